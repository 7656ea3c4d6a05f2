// The text log: header lines and the exact line of one frame for each bus.
//
// One line per logged frame, cells separated by single tabs, lines ended by a line feed. Every line
// starts with the UTC time of day of the frame's time stamp, "%02d:%02d:%02d,%03d\t" (hour, minute,
// second, millisecond; the date is not written). After it, per bus:
//
//   CAN      "%x\t" identifier (extended: AND 0x1FFFFFFF, standard: AND 0x7FF), "%02x  " per
//            payload byte (J1939 lengths up to 2047 written whole, no padding), "\t%1d\t" length,
//            type text "%s\n": 0x01 "S/R"/"E/R", 0x10 "FD"/"E/FD", 0x18 "BRS"/"E/BRS", else
//            "S"/"E".
//   LIN      "%x\t" identifier, "%02x  " per payload byte and "00  " up to eight groups,
//            "\t%1d\t" length, with the checksum column "%02x\t" info byte, then "NR\n" for type
//            0x42 (no response) or "S\n".
//   FlexRay  "%x\t" slot (identifier AND 0xFFFF), "%02x  " per payload byte, "\t%1d\t" length,
//            "%1d\t" cycle (info), channel "A\t" (flags 0x10) / "B\t" (0x20) / "-\t", then startup
//            (0x01), sync (0x02) and preamble (0x04) each "X" or "-", tab-separated, then "\n".
//
// The formatters are pure and allocation-free: they write into a caller-owned buffer (the session's
// line buffer) so that the writer can hand the whole line to the file in one call. A time stamp the
// calendar cannot hold (top bit set) prints "--:--:--,---" in the time cell.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>

#include "driver/RawFrame.h"

namespace nKV_DLL300 {

// The first line of a text log, without the line feed that the log opening adds.
inline constexpr std::string_view kCanTextLogHeader =
    "Timestamp\tID\tPayload\tPayload Length\tType\tName";
inline constexpr std::string_view kLinTextLogHeaderWithChecksum =
    "Timestamp\tID\tPayload\tPayload Length\tChecksum\tType\t";
inline constexpr std::string_view kLinTextLogHeader =
    "Timestamp\tID\tPayload\tPayload Length\tType\t";
inline constexpr std::string_view kFlexRayTextLogHeader =
    "Timestamp\tSlot ID\tPayload\tPayload Length\tCycle Number\tChannel\tStartup\tSync\tPreamble";

// The LIN header follows `logChecksum` as it stands when the log is opened.
constexpr std::string_view LinTextLogHeader(uint8_t logChecksum) {
  return logChecksum != 0 ? kLinTextLogHeaderWithChecksum : kLinTextLogHeader;
}

// Upper bounds of one line, for buffer sizing. A buffer of kTextLineCapacity bytes holds any line.
inline constexpr size_t kTimeCellLength = 13;  // "hh:mm:ss,mmm\t"
constexpr size_t CanTextLineMaxLength(uint32_t payloadBytes) {
  return kTimeCellLength + 9 + 4 * size_t{payloadBytes} + 6 + 6;
}
inline constexpr size_t kLinTextLineMaxLength = kTimeCellLength + 9 + 4 * 8 + 5 + 3 + 3;
constexpr size_t FlexRayTextLineMaxLength(uint32_t payloadBytes) {
  return kTimeCellLength + 5 + 4 * size_t{payloadBytes} + 5 + 4 + 8;
}
inline constexpr size_t kTextLineCapacity = CanTextLineMaxLength(2047);

// Each formatter writes the frame's whole line, line feed included, without a terminating NUL, and
// returns its length. When `cap` is below the frame's bound (the MaxLength functions above, for
// `frame.payloadLength`) it writes nothing and returns 0.
//
// The payload cells print the bytes the view holds (`frame.payloadLength`); the length cell prints
// the length the frame header states. The two differ only for frames cut short in a record of fixed
// size. A LIN frame holds at most 8 payload bytes: a length above 8 prints those 8 groups and the
// stated length, and nothing is read past the frame.
size_t FormatCanTextLine(char* out, size_t cap, const driver::RawFrameView& frame);
size_t FormatLinTextLine(char* out, size_t cap, const driver::RawFrameView& frame,
                         uint8_t logChecksum);
size_t FormatFlexRayTextLine(char* out, size_t cap, const driver::RawFrameView& frame);

// Writes the time cell "hh:mm:ss,mmm\t" (kTimeCellLength bytes) and returns the end.
char* AppendTimeCell(char* out, uint64_t fileTime);

}  // namespace nKV_DLL300
