// How a LIN frame finds, fills and updates its identifier entry.
#pragma once

#include <algorithm>
#include <cstdint>
#include <cstring>

#include "bus/IdentifierEntry.h"
#include "driver/RawFrame.h"

namespace nKV_DLL300 {

// Key: the identifier alone, so data, bus-error and no-response frames of one identifier share an
// entry that shows the type of its last frame. The payload (at most 8 bytes) lives in the entry.
struct LinIdentifierRules {
  using Entry = LinIdentifierEntry;
  static constexpr uint8_t kMessageType = 1;
  static constexpr uint32_t kRecordSize = kLinRecordSize;
  static constexpr bool kCopiesPayload = false;
  static constexpr uint32_t kMaxPayload = 8;
  static constexpr bool kFiltersBusErrors = true;
  static constexpr uint8_t kBusErrorType = 0x41;

  static constexpr int kKeyBits = 32;
  struct KeyState {};

  static uint64_t key(const driver::RawFrameView& frame, KeyState&) {
    return frame.header.identifier;
  }
  static uint64_t entryKey(const Entry& e) { return e.identifier; }

  static void fill(Entry& e, const driver::RawFrameView& frame, uint64_t) {
    e.identifier = frame.header.identifier;
    e.payloadLength = payloadLength(frame);
    std::memcpy(e.payload, frame.payload, e.payloadLength);
    takeLastFrame(e, frame);
  }

  static void refresh(Entry& e, const driver::RawFrameView& frame, uint64_t) {
    const uint8_t length = payloadLength(frame);
    if (e.payloadLength != length) {
      e.payloadLength = length;
      std::memset(e.payload, 0, sizeof e.payload);
    }
    std::memcpy(e.payload, frame.payload, length);
    takeLastFrame(e, frame);
  }

 private:
  // A driver frame claiming more than 8 bytes keeps its first 8: the entry holds no more.
  static uint8_t payloadLength(const driver::RawFrameView& frame) {
    return static_cast<uint8_t>(std::min(frame.payloadLength, kMaxPayload));
  }
  static void takeLastFrame(Entry& e, const driver::RawFrameView& frame) {
    e.type = frame.header.type;
    e.echo = frame.header.flags & driver::kFlagEcho;
    e.flag = frame.header.flags & 0x01;
    e.checksum[0] = frame.header.info;
    e.checksum[1] = e.checksum[2] = e.checksum[3] = 0;
  }
};

}  // namespace nKV_DLL300
