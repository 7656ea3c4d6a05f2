// How a FlexRay frame finds, fills and updates its identifier entry.
#pragma once

#include <algorithm>
#include <cstdint>

#include "bus/IdentifierEntry.h"
#include "driver/RawFrame.h"

namespace nKV_DLL300 {

// Key: slot and channel key. The channel key is 0 for a frame flagged channel A (0x10), else 1 for
// one flagged channel B (0x20), else the key of the frame before it in the batch (0 for the first).
// A new entry takes the channel of its key, so a frame without channel flags finds the entry it
// created again; the entry keeps the type of its first frame. Payloads are copied outside the
// entry.
struct FlexRayIdentifierRules {
  using Entry = FlexRayIdentifierEntry;
  static constexpr uint8_t kMessageType = 2;
  static constexpr uint32_t kRecordSize = kFlexRayRecordSize;
  static constexpr bool kCopiesPayload = true;
  static constexpr uint32_t kMaxPayload = 255;
  static constexpr bool kFiltersBusErrors = false;
  static constexpr uint8_t kBusErrorType = 0;
  static constexpr uint8_t kFlagChannelA = 0x10;
  static constexpr uint8_t kFlagChannelB = 0x20;

  static constexpr int kKeyBits = 33;
  struct KeyState {
    uint8_t previousChannel = 0;
  };

  static uint64_t key(const driver::RawFrameView& frame, KeyState& state) {
    const uint8_t flags = frame.header.flags;
    if (flags & kFlagChannelA) {
      state.previousChannel = 0;
    } else if (flags & kFlagChannelB) {
      state.previousChannel = 1;
    }
    return (uint64_t{frame.header.identifier} << 1) | state.previousChannel;
  }
  static uint64_t entryKey(const Entry& e) { return (uint64_t{e.identifier} << 1) | e.channel; }
  static uint32_t payloadLength(const driver::RawFrameView& frame) {
    return std::min(frame.payloadLength, kMaxPayload);
  }

  static void fill(Entry& e, const driver::RawFrameView& frame, uint64_t key) {
    e.identifier = frame.header.identifier;
    e.type = frame.header.type;
    refresh(e, frame, key);
  }

  static void refresh(Entry& e, const driver::RawFrameView& frame, uint64_t key) {
    const uint8_t flags = frame.header.flags;
    e.echo = flags & driver::kFlagEcho;
    e.startup = flags & 0x01;
    e.sync = (flags >> 1) & 0x01;
    e.preamble = (flags >> 2) & 0x01;
    e.cycle = frame.header.info;
    e.channel = static_cast<uint8_t>(key & 1);
  }
};

}  // namespace nKV_DLL300
