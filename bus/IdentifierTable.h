// The table of identifiers a poll loop has seen, and the identifier-record messages built from it.
#pragma once

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <memory>
#include <memory_resource>
#include <new>
#include <vector>

#include "bus/CanIdentifierRules.h"
#include "bus/FlexRayIdentifierRules.h"
#include "bus/IdentifierIndex.h"
#include "bus/LinIdentifierRules.h"
#include "bus/PayloadCopies.h"
#include "driver/RawFrame.h"

namespace nKV_DLL300 {

// -22: a payload copy or the table itself could not be stored.
inline constexpr int32_t kStatusPayloadNotStored = -22;
// idCount is 16 bits wide: no entry beyond this many can ever be used.
inline constexpr uint32_t kIdentifierTableLimit = 65535;
// The send buffer of a CAN or FlexRay session.
inline constexpr uint32_t kSendBufferSize = 100000;

// The settings that decide which frames enter the table, read by the poll loop once per batch.
struct TableSettings {
  uint8_t logTransmittedFrames = 0;  // 0: echoes of our own frames are skipped
  uint8_t logBusErrorFrames = 0;     // 0: CAN and LIN bus-error frames are skipped
};

// One table per poll loop, made when the loop begins (Create) and destroyed when it ends; only the
// poll thread uses it. Entries stay in the order they were first seen; a hash index finds them and
// a sorted key list gives the send order. Both give exactly what a linear first-match search and an
// adjacent-swap sort of the entries would: keys are unique in the table, and ties between equal
// identifiers (CAN types, FlexRay channels) keep the order in which the entries were made.
//
// Rules is CanIdentifierRules, LinIdentifierRules or FlexRayIdentifierRules.
//
// A poll loop uses it like this (CAN shown):
//   auto table = CanIdentifierTable::create(settings.dataLogIdsMax, tableResource);
//   if (!table) { recordStatus(kStatusPayloadNotStored); idle until stopped; }
//   per batch:  recordStatus(table->updateIdentifierTable(buffer, bytesRead, {logTx, logErr},
//                   [&](const driver::RawFrameView& f) { if (txTimeStatistic > 0) countFrame(...);
//                   }));
//               idCount = table->idCount();
//   per period: bool reset = resetRequested.exchange(false);  if (reset) statistics = {};
//               table->sendIdentifierRecords(reset, sendThroughSendReply); idCount = ...;
template <class Rules>
class IdentifierTable {
  static_assert(Rules::kKeyBits <= IdentifierIndex::kKeyBits);
  static_assert(kIdentifierTableLimit <= IdentifierIndex::kMaxEntries);

 public:
  using Entry = typename Rules::Entry;

  // A table for min(dataLogIdsMax, 65535) entries, all zero. Returns null when its storage cannot
  // be obtained; the poll loop then stores kStatusPayloadNotStored and must not run without it.
  // sendBufferSize is the largest message payload of CAN and FlexRay (at least one whole record).
  static std::unique_ptr<IdentifierTable> create(
      uint32_t dataLogIdsMax,
      std::pmr::memory_resource* resource = std::pmr::get_default_resource(),
      uint32_t sendBufferSize = kSendBufferSize) {
    try {
      std::unique_ptr<IdentifierTable> table(new IdentifierTable(resource));
      table->allocate(std::min(dataLogIdsMax, kIdentifierTableLimit), sendBufferSize);
      return table;
    } catch (const std::bad_alloc&) {
      return nullptr;
    }
  }

  uint32_t capacity() const { return capacity_; }
  // The session's idCount: entries in use.
  uint16_t idCount() const { return static_cast<uint16_t>(count_); }
  // Entry i in the order first seen (0 <= i < idCount).
  const Entry& entry(uint32_t i) const { return entries_[i]; }

  // Folds a batch of `bytes` bytes into the table. onCounted(const driver::RawFrameView&) is
  // called for every frame that passes the settings' filters (the bus statistics count those),
  // whether or not its identifier found room: a full table lists no new identifier, but the
  // statistics still describe the whole bus. Returns 0, or kStatusPayloadNotStored when a payload
  // copy could not be stored: that entry then holds no payload (payloadLength 0) until a later
  // frame's copy succeeds.
  template <class OnCounted>
  int32_t updateIdentifierTable(const void* batch, uint32_t bytes, const TableSettings& settings,
                                OnCounted&& onCounted) {
    driver::RawFrameWalker walker(batch, bytes);
    driver::RawFrameView frame;
    typename Rules::KeyState keyState;
    int32_t status = 0;
    while (walker.next(frame)) {
      // Computed for every frame: a FlexRay frame without channel flags takes the key of the one
      // before it, taken into the table or not.
      const uint64_t key = Rules::key(frame, keyState);
      if (skipped(frame, settings)) continue;
      take(frame, key, status);
      onCounted(static_cast<const driver::RawFrameView&>(frame));
    }
    return status;
  }

  int32_t updateIdentifierTable(const void* batch, uint32_t bytes, const TableSettings& settings) {
    return updateIdentifierTable(batch, bytes, settings, [](const driver::RawFrameView&) {});
  }

  // Empties the table: idCount 0, every entry zero. Payload storage is kept for the entries that
  // take the slots next, and returned when the table is destroyed.
  void reset() {
    std::fill(entries_.begin(), entries_.begin() + count_, Entry{});
    index_.clear();
    count_ = 0;
    sortedCount_ = 0;
  }

  // The periodic send. With resetRequested the table is emptied first (the caller zeroes its bus
  // statistics too). Nothing is sent while the table is empty. Otherwise the entries go out sorted
  // by identifier as messages of the bus's type through
  //   int32_t sink(uint8_t type, const void* payload, uint32_t length, uint16_t recordCount)
  // LIN sends one message of idCount x 40 bytes. CAN and FlexRay send each record (28 or 32 bytes)
  // followed by its payload; records that do not fit the send buffer go out in further messages,
  // each with its own record count. A sink result other than 0 ends the send and is returned.
  template <class Sink>
  int32_t sendIdentifierRecords(bool resetRequested, Sink&& sink) {
    if (resetRequested) reset();
    if (count_ == 0) return 0;
    sortNewEntries();
    if constexpr (Rules::kCopiesPayload) {
      return sendWithPayloads(sink);
    } else {
      return sendRecords(sink);
    }
  }

  // The payload copy of entry i, payloadLength bytes (null while none is held).
  const uint8_t* payload(uint32_t i) const {
    if constexpr (Rules::kCopiesPayload) {
      return entries_[i].payloadRef != 0 ? payloads_.data(i) : nullptr;
    } else {
      return entries_[i].payload;
    }
  }

 private:
  explicit IdentifierTable(std::pmr::memory_resource* resource)
      : entries_(resource),
        index_(resource),
        sortKeys_(resource),
        mergeKeys_(resource),
        payloads_(resource),
        wire_(resource) {}

  void allocate(uint32_t capacity, uint32_t sendBufferSize) {
    capacity_ = capacity;
    entries_.assign(capacity, Entry{});
    index_.allocate(capacity);
    sortKeys_.assign(capacity, 0);
    mergeKeys_.assign(capacity, 0);
    if constexpr (Rules::kCopiesPayload) {
      payloads_.allocateSlots(capacity);
      wire_.assign(std::max(sendBufferSize, Rules::kRecordSize + Rules::kMaxPayload), 0);
    } else {
      wire_.assign(size_t{capacity} * Rules::kRecordSize, 0);
    }
  }

  static bool skipped(const driver::RawFrameView& frame, const TableSettings& settings) {
    if ((frame.header.flags & driver::kFlagEcho) && settings.logTransmittedFrames == 0) return true;
    return Rules::kFiltersBusErrors && settings.logBusErrorFrames == 0 &&
           frame.header.type == Rules::kBusErrorType;
  }

  // Counts the frame into its entry, making the entry if there is room; a new identifier that
  // finds none is left out of the table.
  void take(const driver::RawFrameView& frame, uint64_t key, int32_t& status) {
    const uint32_t slot = index_.probe(key);
    uint32_t i = index_.entryAt(slot);
    const uint64_t timestamp = frame.header.timestamp;
    if (i == IdentifierIndex::kNoEntry) {
      if (count_ >= capacity_) return;
      i = count_++;
      index_.set(slot, key, i);
      Entry& e = entries_[i];
      Rules::fill(e, frame, key);
      e.count = 1;
      e.lastTimestamp = e.previousTimestamp = timestamp;
    } else {
      Entry& e = entries_[i];
      Rules::refresh(e, frame, key);
      ++e.count;
      e.previousTimestamp = e.lastTimestamp;
      e.lastTimestamp = timestamp;
    }
    if constexpr (Rules::kCopiesPayload) storePayload(i, frame, status);
  }

  void storePayload(uint32_t i, const driver::RawFrameView& frame, int32_t& status) {
    Entry& e = entries_[i];
    const uint32_t length = Rules::payloadLength(frame);
    if (length > 0 && payloads_.store(i, frame.payload, length)) {
      e.payloadLength = static_cast<decltype(e.payloadLength)>(length);
      e.payloadRef = i + 1;
      return;
    }
    e.payloadLength = 0;
    e.payloadRef = 0;
    if (length > 0) status = kStatusPayloadNotStored;
  }

  // sortKeys_[0, sortedCount_) is sorted from the last send; the entries made since are sorted and
  // merged in. A key is (identifier << 32 | entry index): unique, and ordered like a stable sort by
  // identifier over the order in which the entries were made.
  void sortNewEntries() {
    if (sortedCount_ == count_) return;
    for (uint32_t i = sortedCount_; i < count_; ++i) {
      sortKeys_[i] = (uint64_t{entries_[i].identifier} << 32) | i;
    }
    const auto begin = sortKeys_.begin();
    std::sort(begin + sortedCount_, begin + count_);
    if (sortedCount_ > 0 && sortKeys_[sortedCount_ - 1] > sortKeys_[sortedCount_]) {
      std::merge(begin, begin + sortedCount_, begin + sortedCount_, begin + count_,
                 mergeKeys_.begin());
      std::copy(mergeKeys_.begin(), mergeKeys_.begin() + count_, begin);
    }
    sortedCount_ = count_;
  }

  static uint32_t entryOf(uint64_t sortKey) { return static_cast<uint32_t>(sortKey); }

  template <class Sink>
  int32_t sendRecords(Sink& sink) {
    uint8_t* out = wire_.data();
    for (uint32_t k = 0; k < count_; ++k) {
      std::memcpy(out + size_t{k} * Rules::kRecordSize, &entries_[entryOf(sortKeys_[k])],
                  Rules::kRecordSize);
    }
    return sink(Rules::kMessageType, static_cast<const void*>(out), count_ * Rules::kRecordSize,
                static_cast<uint16_t>(count_));
  }

  template <class Sink>
  int32_t sendWithPayloads(Sink& sink) {
    uint8_t* out = wire_.data();
    const size_t room = wire_.size();
    size_t used = 0;
    uint32_t records = 0;
    for (uint32_t k = 0; k < count_; ++k) {
      const uint32_t i = entryOf(sortKeys_[k]);
      const Entry& e = entries_[i];
      const uint32_t length = e.payloadLength;  // 0 whenever no copy is held
      if (used + Rules::kRecordSize + length > room) {
        const int32_t status = flush(sink, used, records);
        if (status != 0) return status;
      }
      std::memcpy(out + used, &e, Rules::kRecordSize);
      if (length > 0) std::memcpy(out + used + Rules::kRecordSize, payloads_.data(i), length);
      used += Rules::kRecordSize + length;
      ++records;
    }
    return flush(sink, used, records);
  }

  template <class Sink>
  int32_t flush(Sink& sink, size_t& used, uint32_t& records) {
    const int32_t status = sink(Rules::kMessageType, static_cast<const void*>(wire_.data()),
                                static_cast<uint32_t>(used), static_cast<uint16_t>(records));
    used = 0;
    records = 0;
    return status;
  }

  uint32_t capacity_ = 0;
  uint32_t count_ = 0;
  uint32_t sortedCount_ = 0;
  std::pmr::vector<Entry> entries_;       // in the order first seen
  IdentifierIndex index_;                 // key -> entry
  std::pmr::vector<uint64_t> sortKeys_;   // send order
  std::pmr::vector<uint64_t> mergeKeys_;  // scratch of the merge
  PayloadCopies payloads_;                // CAN and FlexRay: slot i holds entry i's payload
  std::pmr::vector<uint8_t> wire_;        // where messages are assembled
};

using CanIdentifierTable = IdentifierTable<CanIdentifierRules>;
using LinIdentifierTable = IdentifierTable<LinIdentifierRules>;
using FlexRayIdentifierTable = IdentifierTable<FlexRayIdentifierRules>;

}  // namespace nKV_DLL300
