// Test support: crafted read batches, captured messages and a memory resource that can refuse.
#pragma once

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <memory_resource>
#include <new>
#include <vector>

#include "driver/RawFrame.h"

namespace nKV_DLL300::test {

// Frames laid out as the driver delivers them: header, payload padded to a multiple of 8 bytes.
class FrameBatch {
 public:
  FrameBatch& add(uint64_t timestamp, uint32_t identifier, uint8_t type, uint8_t flags,
                  uint8_t info, const std::vector<uint8_t>& payload) {
    driver::RawFrameHeader h{timestamp, identifier, type,
                             flags,     info,       static_cast<uint8_t>(payload.size() & 0xFF)};
    if (type == driver::kFrameJ1939)
      h.info = static_cast<uint8_t>((info & ~7u) | (payload.size() >> 8));
    const size_t at = bytes_.size();
    bytes_.resize(at + driver::RawFrameSize(h), 0);
    std::memcpy(bytes_.data() + at, &h, sizeof h);
    const size_t length = std::min<size_t>(payload.size(), driver::RawPayloadLength(h));
    if (length > 0) std::memcpy(bytes_.data() + at + sizeof h, payload.data(), length);
    return *this;
  }
  FrameBatch& can(uint64_t timestamp, uint32_t identifier, std::vector<uint8_t> payload,
                  uint8_t type = 0, uint8_t flags = 0) {
    return add(timestamp, identifier, type, flags, 0, payload);
  }

  const uint8_t* data() const { return bytes_.data(); }
  uint32_t size() const { return static_cast<uint32_t>(bytes_.size()); }
  void clear() { bytes_.clear(); }

 private:
  std::vector<uint8_t> bytes_;
};

struct Message {
  uint8_t type;
  std::vector<uint8_t> bytes;
  uint16_t records;
  bool operator==(const Message&) const = default;
};

// A sink that keeps every message it is handed.
struct MessageCapture {
  std::vector<Message> messages;
  int32_t result = 0;
  auto sink() {
    return [this](uint8_t type, const void* payload, uint32_t length, uint16_t records) {
      const auto* p = static_cast<const uint8_t*>(payload);
      messages.push_back(Message{type, std::vector<uint8_t>(p, p + length), records});
      return result;
    };
  }
};

// One CAN or FlexRay record read back from a message: the record bytes and the payload after them.
struct WireRecord {
  uint32_t identifier;
  uint32_t count;
  uint64_t lastTimestamp;
  uint64_t previousTimestamp;
  uint8_t type;
  uint8_t echo;
  uint32_t payloadLength;
  std::vector<uint8_t> head;  // the whole record
  std::vector<uint8_t> payload;
};

// Splits a CAN (recordSize 28) or FlexRay (32) message into its records.
inline std::vector<WireRecord> DecodeRecords(const Message& m, uint32_t recordSize) {
  std::vector<WireRecord> out;
  size_t at = 0;
  while (at + recordSize <= m.bytes.size()) {
    const uint8_t* r = m.bytes.data() + at;
    WireRecord w{};
    std::memcpy(&w.identifier, r, 4);
    std::memcpy(&w.count, r + 4, 4);
    std::memcpy(&w.lastTimestamp, r + 8, 8);
    std::memcpy(&w.previousTimestamp, r + 16, 8);
    w.type = r[24];
    w.echo = r[25];
    if (recordSize == 28) {
      uint16_t length;
      std::memcpy(&length, r + 26, 2);
      w.payloadLength = length;
    } else {
      w.payloadLength = r[31];
    }
    w.head.assign(r, r + recordSize);
    w.payload.assign(r + recordSize, r + recordSize + w.payloadLength);
    at += recordSize + w.payloadLength;
    out.push_back(std::move(w));
  }
  return out;
}

// Counts allocations, and refuses them once `refuseFrom` allocations have been made.
class CountingResource : public std::pmr::memory_resource {
 public:
  size_t allocations = 0;
  size_t refuseFrom = SIZE_MAX;
  size_t outstanding = 0;

 private:
  void* do_allocate(size_t bytes, size_t alignment) override {
    if (allocations >= refuseFrom) throw std::bad_alloc();
    ++allocations;
    ++outstanding;
    return std::pmr::new_delete_resource()->allocate(bytes, alignment);
  }
  void do_deallocate(void* p, size_t bytes, size_t alignment) override {
    --outstanding;
    std::pmr::new_delete_resource()->deallocate(p, bytes, alignment);
  }
  bool do_is_equal(const memory_resource& other) const noexcept override { return this == &other; }
};

}  // namespace nKV_DLL300::test
