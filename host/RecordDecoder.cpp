// Little-endian decoding of identifier records and statistics, independent of the service's code.
#include "host/RecordDecoder.h"

#include <cstddef>
#include <cstring>

namespace kvhost {

namespace {

constexpr size_t kCanRecordSize = 28;
constexpr size_t kLinRecordSize = 40;
constexpr size_t kFlexRayRecordSize = 32;

uint32_t U32(const uint8_t* p) {
  return uint32_t(p[0]) | uint32_t(p[1]) << 8 | uint32_t(p[2]) << 16 | uint32_t(p[3]) << 24;
}
uint64_t U64(const uint8_t* p) { return uint64_t(U32(p)) | uint64_t(U32(p + 4)) << 32; }

// The 24 bytes every record begins with.
void DecodeCommon(const uint8_t* p, IdentifierRecord& r) {
  r.identifier = U32(p);
  r.count = U32(p + 4);
  r.lastTimestamp = U64(p + 8);
  r.previousTimestamp = U64(p + 16);
  r.type = p[24];
  r.echo = p[25];
}

// Records of `recordSize` bytes each followed by their payload; `length` reads a record's
// payload length.
template <class Fill>
std::optional<std::vector<IdentifierRecord>> DecodeWithPayloads(const std::vector<uint8_t>& bytes,
                                                                uint32_t recordCount,
                                                                size_t recordSize, Fill fill) {
  std::vector<IdentifierRecord> records;
  size_t at = 0;
  for (uint32_t i = 0; i < recordCount; ++i) {
    if (bytes.size() - at < recordSize) return std::nullopt;
    IdentifierRecord r;
    DecodeCommon(bytes.data() + at, r);
    fill(bytes.data() + at, r);
    at += recordSize;
    if (bytes.size() - at < r.payloadLength) return std::nullopt;
    r.payload.assign(bytes.begin() + at, bytes.begin() + at + r.payloadLength);
    at += r.payloadLength;
    records.push_back(std::move(r));
  }
  if (at != bytes.size()) return std::nullopt;
  return records;
}

template <class View, size_t kFields>
std::optional<View> DecodeWords(const std::vector<uint8_t>& payload) {
  static_assert(sizeof(View) == kFields * 4);
  if (payload.size() != sizeof(View)) return std::nullopt;
  uint32_t words[kFields];
  for (size_t i = 0; i < kFields; ++i) words[i] = U32(payload.data() + 4 * i);
  View view;
  static_assert(sizeof words == sizeof view);
  std::memcpy(&view, words, sizeof view);
  return view;
}

}  // namespace

std::optional<std::vector<IdentifierRecord>> DecodeCanRecords(const std::vector<uint8_t>& payload,
                                                              uint32_t recordCount) {
  return DecodeWithPayloads(payload, recordCount, kCanRecordSize,
                            [](const uint8_t* p, IdentifierRecord& r) {
                              r.payloadLength = uint32_t(p[26]) | uint32_t(p[27]) << 8;
                            });
}

std::optional<std::vector<IdentifierRecord>> DecodeFlexRayRecords(
    const std::vector<uint8_t>& payload, uint32_t recordCount) {
  return DecodeWithPayloads(payload, recordCount, kFlexRayRecordSize,
                            [](const uint8_t* p, IdentifierRecord& r) {
                              r.startup = p[26];
                              r.sync = p[27];
                              r.preamble = p[28];
                              r.channel = p[29];
                              r.cycle = p[30];
                              r.payloadLength = p[31];
                            });
}

std::optional<std::vector<IdentifierRecord>> DecodeLinRecords(const std::vector<uint8_t>& payload,
                                                              uint32_t recordCount) {
  if (payload.size() != size_t{recordCount} * kLinRecordSize) return std::nullopt;
  std::vector<IdentifierRecord> records(recordCount);
  for (uint32_t i = 0; i < recordCount; ++i) {
    const uint8_t* p = payload.data() + size_t{i} * kLinRecordSize;
    IdentifierRecord& r = records[i];
    DecodeCommon(p, r);
    r.flag = p[26];
    r.checksum = U32(p + 27);
    r.payloadLength = p[31] <= 8 ? p[31] : 8;
    r.payload.assign(p + 32, p + 32 + r.payloadLength);
  }
  return records;
}

std::optional<CanStatisticsView> DecodeCanStatistics(const std::vector<uint8_t>& payload) {
  return DecodeWords<CanStatisticsView, 17>(payload);
}

std::optional<LinStatisticsView> DecodeLinStatistics(const std::vector<uint8_t>& payload) {
  return DecodeWords<LinStatisticsView, 15>(payload);
}

std::optional<FlexRayStatisticsView> DecodeFlexRayStatistics(const std::vector<uint8_t>& payload) {
  return DecodeWords<FlexRayStatisticsView, 18>(payload);
}

}  // namespace kvhost
