// Text lines and binary records formatted per second, per bus, over batches like the default
// traffic.
#include <benchmark/benchmark.h>

#include <cstring>
#include <vector>

#include "driver/RawFrame.h"
#include "logging/BinaryLogFormat.h"
#include "logging/FrameSelection.h"
#include "logging/TextLogFormat.h"

namespace {

using namespace nKV_DLL300;

constexpr int kFramesPerBatch = 512;
constexpr uint64_t kStart = 133'604'103'030'420'000ull;
constexpr uint64_t kTicksPerFrame = 2'300;  // 230 us, a busy bus

enum class Bus { kCan, kCanFd, kLin, kFlexRay };

void Append(std::vector<uint8_t>& batch, driver::RawFrameHeader h, const uint8_t* payload) {
  const uint32_t length = driver::RawPayloadLength(h);
  const size_t at = batch.size();
  batch.resize(at + driver::RawFrameSize(h), 0);
  std::memcpy(batch.data() + at, &h, sizeof h);
  std::memcpy(batch.data() + at + driver::kRawFrameHeaderSize, payload, length);
}

// A batch shaped like a loaded bus of the kind: mixed identifiers, types and lengths.
std::vector<uint8_t> MakeBatch(Bus bus) {
  std::vector<uint8_t> batch;
  uint8_t payload[64];
  for (int i = 0; i < 64; ++i) payload[i] = static_cast<uint8_t>(i * 37);
  for (int i = 0; i < kFramesPerBatch; ++i) {
    const uint64_t ts = kStart + i * kTicksPerFrame;
    payload[0] = static_cast<uint8_t>(i);
    switch (bus) {
      case Bus::kCan:
        Append(batch, {ts, i % 4 == 3 ? 0x38FEF100u : 0x100u + (i % 7), 0, 0, 0, 8}, payload);
        break;
      case Bus::kCanFd:
        Append(batch, {ts, 0x200u + (i % 3), 0x18, 0, 0, static_cast<uint8_t>(i % 2 ? 64 : 12)},
               payload);
        break;
      case Bus::kLin:
        Append(batch,
               {ts, 0x10u + (i % 4), static_cast<uint8_t>(i % 4 == 2 ? 0x42 : 0x40), 0, 0x5a,
                static_cast<uint8_t>(i % 4 == 2 ? 0 : 8)},
               payload);
        break;
      case Bus::kFlexRay:
        Append(batch, {ts, 1u + (i % 40), 0x20, 0x12, static_cast<uint8_t>(i % 64), 16}, payload);
        break;
    }
  }
  return batch;
}

size_t FormatLine(Bus bus, char* out, size_t cap, const driver::RawFrameView& v) {
  switch (bus) {
    case Bus::kCan:
    case Bus::kCanFd:
      return FormatCanTextLine(out, cap, v);
    case Bus::kLin:
      return FormatLinTextLine(out, cap, v, 1);
    case Bus::kFlexRay:
      return FormatFlexRayTextLine(out, cap, v);
  }
  return 0;
}

BinaryRecordLayout LayoutOf(Bus bus) {
  switch (bus) {
    case Bus::kCan:
    case Bus::kLin:
      return BinaryRecordLayout::kFixed24;
    case Bus::kCanFd:
      return BinaryRecordLayout::kCanVariable;
    case Bus::kFlexRay:
      return BinaryRecordLayout::kFlexRayVariable;
  }
  return BinaryRecordLayout::kFixed24;
}

// Walk, select and format every frame of the batch into the session's line buffer, then append the
// line to a stream-sized output buffer, as a buffered file stream would take it.
void TextLines(benchmark::State& state, Bus bus) {
  const std::vector<uint8_t> batch = MakeBatch(bus);
  static char line[kTextLineCapacity];
  std::vector<char> stream(1 << 16);
  size_t used = 0;
  for (auto _ : state) {
    driver::RawFrameWalker walker(batch.data(), static_cast<uint32_t>(batch.size()));
    driver::RawFrameView view;
    while (walker.next(view)) {
      if (!IsFrameLogged(view.header, 0)) continue;
      const size_t n = FormatLine(bus, line, sizeof line, view);
      if (used + n > stream.size()) used = 0;
      std::memcpy(stream.data() + used, line, n);
      used += n;
    }
    benchmark::DoNotOptimize(stream.data());
  }
  state.SetItemsProcessed(state.iterations() * kFramesPerBatch);
}

void BinaryRecords(benchmark::State& state, Bus bus) {
  const std::vector<uint8_t> batch = MakeBatch(bus);
  const BinaryRecordLayout layout = LayoutOf(bus);
  std::vector<uint8_t> stream(1 << 16);
  size_t used = 0;
  for (auto _ : state) {
    driver::RawFrameWalker walker(batch.data(), static_cast<uint32_t>(batch.size()));
    driver::RawFrameView view;
    while (walker.next(view)) {
      if (!IsFrameLogged(view.header, 0)) continue;
      if (used + 2048 + driver::kRawFrameHeaderSize > stream.size()) used = 0;
      used += CopyBinaryRecord(stream.data() + used, stream.size() - used, view, layout);
    }
    benchmark::DoNotOptimize(stream.data());
  }
  state.SetItemsProcessed(state.iterations() * kFramesPerBatch);
}

BENCHMARK_CAPTURE(TextLines, Can, Bus::kCan);
BENCHMARK_CAPTURE(TextLines, CanFd, Bus::kCanFd);
BENCHMARK_CAPTURE(TextLines, Lin, Bus::kLin);
BENCHMARK_CAPTURE(TextLines, FlexRay, Bus::kFlexRay);
BENCHMARK_CAPTURE(BinaryRecords, Can, Bus::kCan);
BENCHMARK_CAPTURE(BinaryRecords, CanFd, Bus::kCanFd);
BENCHMARK_CAPTURE(BinaryRecords, Lin, Bus::kLin);
BENCHMARK_CAPTURE(BinaryRecords, FlexRay, Bus::kFlexRay);

}  // namespace
