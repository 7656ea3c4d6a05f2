// How a CAN frame finds, fills and updates its identifier entry.
#pragma once

#include <algorithm>
#include <cstdint>

#include "bus/IdentifierEntry.h"
#include "driver/RawFrame.h"

namespace nKV_DLL300 {

// Key: identifier and type, so a remote frame and a data frame of one identifier are two entries.
// The payload is copied outside the entry (PayloadCopies); the table stores it.
struct CanIdentifierRules {
  using Entry = CanIdentifierEntry;
  static constexpr uint8_t kMessageType = 0;
  static constexpr uint32_t kRecordSize = kCanRecordSize;
  static constexpr bool kCopiesPayload = true;
  static constexpr uint32_t kMaxPayload = 2047;
  static constexpr bool kFiltersBusErrors = true;
  static constexpr uint8_t kBusErrorType = 0x02;

  static constexpr int kKeyBits = 40;
  struct KeyState {};  // the key depends on the frame alone

  static uint64_t key(const driver::RawFrameView& frame, KeyState&) {
    return (uint64_t{frame.header.identifier} << 8) | frame.header.type;
  }
  static uint64_t entryKey(const Entry& e) { return (uint64_t{e.identifier} << 8) | e.type; }
  static uint32_t payloadLength(const driver::RawFrameView& frame) {
    return std::min(frame.payloadLength, kMaxPayload);
  }
  static uint8_t echo(const driver::RawFrameView& frame) {
    return frame.header.flags & driver::kFlagEcho;
  }

  static void fill(Entry& e, const driver::RawFrameView& frame, uint64_t) {
    e.identifier = frame.header.identifier;
    e.type = frame.header.type;
    e.echo = echo(frame);
  }
  static void refresh(Entry& e, const driver::RawFrameView& frame, uint64_t) {
    e.echo = echo(frame);
  }
};

}  // namespace nKV_DLL300
