// Lines of the candump -l log format: reading them for replay, writing them for bus captures.
#pragma once

#include <cstdint>
#include <istream>
#include <string>
#include <string_view>
#include <vector>

#include "tarvix/SimFrame.h"

namespace tarvix {

// One logged frame: its time in microseconds since 1970 and the frame (endNs unused).
struct LoggedFrame {
  int64_t timeUs = 0;
  std::string interfaceName;
  SimFrame frame;
};

// Line format: "(SECONDS.DECIMALS) IFACE ID#DATA". The time takes any number of decimals, or none
// ("(1)", "(1.5)", "(1.000001)"; digits past the microseconds are dropped), and at most
// 4 000 000 000 seconds. ID is 3 hex digits (standard) or 8 hex digits (extended; with bit 29 set:
// an error frame), DATA is hex bytes; "ID#R" or "ID#Rn" a remote frame with length n; "ID##F" +
// DATA a CAN FD frame whose flags nibble F has bit 0 for bit-rate switching. Anything after the
// frame token is ignored. Returns false for a malformed line.
bool ParseCandumpLine(std::string_view line, LoggedFrame& out);

// Reads a whole log; blank lines are skipped, the first malformed line fails with its number
// (`name` names the log in the error).
bool ReadCandumpLog(std::istream& in, const std::string& name, std::vector<LoggedFrame>& out,
                    std::string& error);
bool ReadCandumpFile(const std::string& path, std::vector<LoggedFrame>& out, std::string& error);

// The log line of a frame carried on a bus, with its newline. Bus-error frames are written as
// error frames "20000000#0000000000000000".
std::string FormatCandumpLine(const SimFrame& frame, const std::string& interfaceName);

}  // namespace tarvix
