// Test and benchmark support: the identifier table done the plain way, as the reference to match.
#pragma once

#include <cstdint>
#include <cstring>
#include <utility>
#include <vector>

#include "bus/IdentifierTable.h"

namespace nKV_DLL300::test {

// Linear first-match search over the used entries, and an adjacent-swap sort of the entries
// themselves before every send (swapping only when the left identifier is greater). Payload copies
// are plain vectors that move with their entries. Messages are split like IdentifierTable's.
template <class Rules>
class LiteralIdentifierTable {
 public:
  using Entry = typename Rules::Entry;

  LiteralIdentifierTable(uint32_t dataLogIdsMax, uint32_t sendBufferSize = kSendBufferSize)
      : entries_(std::min(dataLogIdsMax, kIdentifierTableLimit)),
        payloads_(entries_.size()),
        room_(std::max(sendBufferSize, Rules::kRecordSize + Rules::kMaxPayload)) {}

  uint16_t idCount() const { return static_cast<uint16_t>(count_); }

  void updateIdentifierTable(const void* batch, uint32_t bytes, const TableSettings& settings) {
    driver::RawFrameWalker walker(batch, bytes);
    driver::RawFrameView f;
    typename Rules::KeyState keyState;
    while (walker.next(f)) {
      const uint64_t key = Rules::key(f, keyState);
      if ((f.header.flags & driver::kFlagEcho) && !settings.logTransmittedFrames) continue;
      if (Rules::kFiltersBusErrors && !settings.logBusErrorFrames &&
          f.header.type == Rules::kBusErrorType)
        continue;
      uint32_t i = 0;
      while (i < count_ && Rules::entryKey(entries_[i]) != key) ++i;
      if (i == count_) {
        if (count_ == entries_.size()) continue;
        ++count_;
        Rules::fill(entries_[i], f, key);
        entries_[i].count = 1;
        entries_[i].lastTimestamp = entries_[i].previousTimestamp = f.header.timestamp;
      } else {
        Rules::refresh(entries_[i], f, key);
        ++entries_[i].count;
        entries_[i].previousTimestamp = entries_[i].lastTimestamp;
        entries_[i].lastTimestamp = f.header.timestamp;
      }
      if constexpr (Rules::kCopiesPayload) {
        const uint32_t length = Rules::payloadLength(f);
        entries_[i].payloadLength = static_cast<decltype(entries_[i].payloadLength)>(length);
        payloads_[i].assign(f.payload, f.payload + length);
      }
    }
  }

  template <class Sink>
  void sendIdentifierRecords(bool resetRequested, Sink&& sink) {
    if (resetRequested) {
      count_ = 0;
      for (auto& e : entries_) e = Entry{};
      for (auto& p : payloads_) p.clear();
    }
    if (count_ == 0) return;
    for (uint32_t pass = 0; pass + 1 < count_; ++pass) {
      for (uint32_t j = 0; j + 1 < count_ - pass; ++j) {
        if (entries_[j].identifier > entries_[j + 1].identifier) {
          std::swap(entries_[j], entries_[j + 1]);
          std::swap(payloads_[j], payloads_[j + 1]);
        }
      }
    }
    std::vector<uint8_t> out;
    uint16_t records = 0;
    for (uint32_t i = 0; i < count_; ++i) {
      const uint32_t length = Rules::kCopiesPayload ? payloads_[i].size() : 0;
      if (out.size() + Rules::kRecordSize + length > room_ && Rules::kCopiesPayload) {
        sink(Rules::kMessageType, static_cast<const void*>(out.data()),
             static_cast<uint32_t>(out.size()), records);
        out.clear();
        records = 0;
      }
      const auto* r = reinterpret_cast<const uint8_t*>(&entries_[i]);
      out.insert(out.end(), r, r + Rules::kRecordSize);
      out.insert(out.end(), payloads_[i].begin(), payloads_[i].end());
      ++records;
    }
    sink(Rules::kMessageType, static_cast<const void*>(out.data()),
         static_cast<uint32_t>(out.size()), records);
  }

 private:
  std::vector<Entry> entries_;
  std::vector<std::vector<uint8_t>> payloads_;
  uint32_t room_;
  uint32_t count_ = 0;
};

}  // namespace nKV_DLL300::test
