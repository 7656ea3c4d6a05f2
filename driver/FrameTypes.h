// Frame type codes and flag bits of the driver's raw frames (driver/RawFrame.h).
#pragma once

#include <cstdint>

namespace driver {

// CAN.
inline constexpr uint8_t kFrameCanData = 0x00;
inline constexpr uint8_t kFrameCanRemote = 0x01;
inline constexpr uint8_t kFrameCanBusError = 0x02;
inline constexpr uint8_t kFrameCanFdData = 0x10;
inline constexpr uint8_t kFrameCanFdBrsData = 0x18;
inline constexpr uint8_t kFrameJ1939 = 0xC0;  // info bits 0-2 carry payload length bits 8-10

// LIN.
inline constexpr uint8_t kFrameLinData = 0x40;
inline constexpr uint8_t kFrameLinBusError = 0x41;
inline constexpr uint8_t kFrameLinNoResponse = 0x42;

// FlexRay.
inline constexpr uint8_t kFrameFlexRayData = 0x20;
inline constexpr uint8_t kFrameFlexRayNull = 0x21;

// Flags.
inline constexpr uint8_t kFlagEcho = 0x80;  // transmitted by the reading session's own interface
inline constexpr uint8_t kFlagLinEnhancedChecksum = 0x01;
inline constexpr uint8_t kFlagFlexRayStartup = 0x01;
inline constexpr uint8_t kFlagFlexRaySync = 0x02;
inline constexpr uint8_t kFlagFlexRayPreamble = 0x04;
inline constexpr uint8_t kFlagFlexRayChannelA = 0x10;
inline constexpr uint8_t kFlagFlexRayChannelB = 0x20;

// Identifier bit 29 marks an extended CAN identifier.
inline constexpr uint32_t kExtendedIdFlag = 0x20000000;
inline constexpr uint32_t kStandardIdMask = 0x7FF;
inline constexpr uint32_t kExtendedIdMask = 0x1FFFFFFF;

// Payload limits (the raw frame layout itself is driver/RawFrame.h).
inline constexpr uint32_t kMaxCanFdPayload = 64;
inline constexpr uint32_t kMaxJ1939Payload = 2047;

}  // namespace driver
