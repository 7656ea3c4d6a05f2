// CAN frames in the `candump -l` log format that can-utils and python-can read.
//
// One line per frame: "(SECONDS.MICROSECONDS) INTERFACE FRAME\n", the time in seconds since
// 1970-01-01 UTC, and FRAME one of
//   123#11223344            classic data, standard identifier (3 hex digits), payload in hex
//   18FEF100#0011           classic data, extended identifier (8 hex digits)
//   321#R  321#R3           remote frame, with its length when it is not 0
//   201##4A0A1A2            CAN FD: "##", one hex digit of flags (4: FD frame, +1: bit-rate switch)
//   20000080#0000000000000000  a bus-error frame (error flag with the bus-error class)
// A frame this interface transmitted itself (echo) ends in " T".
#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>

#include "driver/RawFrame.h"

namespace kvlog {

inline constexpr size_t kMaxInterfaceName = 32;
inline constexpr size_t kCandumpLineCapacity = 64 + kMaxInterfaceName + 2 * 64;

// Writes the line of one CAN frame and returns its length, or 0 (nothing written) when the frame
// has no form in this format: a J1939 or classic payload over 8 bytes, an FD payload over 64 bytes,
// a payload the record does not hold whole, a type that is not CAN, or a `cap` below
// kCandumpLineCapacity. Time stamps before 1970 are written as 0.
size_t FormatCandumpLine(char* out, size_t cap, const driver::RawFrameView& frame,
                         std::string_view interfaceName);

// Interface names hold 1 to kMaxInterfaceName printable characters without blanks.
bool IsValidInterfaceName(std::string_view name);

}  // namespace kvlog
