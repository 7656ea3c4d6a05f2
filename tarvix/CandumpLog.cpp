// Reading and writing candump -l log lines.
#include "tarvix/CandumpLog.h"

#include <cstdio>
#include <fstream>

#include "driver/FrameTypes.h"
#include "tarvix/SimClock.h"

namespace tarvix {
namespace {

constexpr uint32_t kErrorFlag = 0x20000000;  // in the log: an error frame
constexpr int kStandardDigits = 3;
constexpr int kExtendedDigits = 8;

int HexValue(char c) {
  if (c >= '0' && c <= '9') return c - '0';
  if (c >= 'a' && c <= 'f') return c - 'a' + 10;
  if (c >= 'A' && c <= 'F') return c - 'A' + 10;
  return -1;
}

bool ParseHex(std::string_view text, uint32_t& out) {
  if (text.empty() || text.size() > 8) return false;
  out = 0;
  for (char c : text) {
    const int v = HexValue(c);
    if (v < 0) return false;
    out = (out << 4) | static_cast<uint32_t>(v);
  }
  return true;
}

// Seconds are bounded (the year 2096) so that the replay's sums of times, distances between times
// and a round's length stay well inside its signed 64-bit nanoseconds.
constexpr int64_t kMaxSeconds = 4'000'000'000;

bool ParseSeconds(std::string_view digits, int64_t& seconds) {
  if (digits.empty()) return false;
  seconds = 0;
  for (char c : digits) {
    if (c < '0' || c > '9') return false;
    seconds = seconds * 10 + (c - '0');
    if (seconds > kMaxSeconds) return false;
  }
  return true;
}

// Any number of decimals: the first six are the microseconds, later ones are dropped.
bool ParseMicroseconds(std::string_view decimals, int64_t& micros) {
  micros = 0;
  for (size_t i = 0; i < decimals.size(); ++i) {
    const char c = decimals[i];
    if (c < '0' || c > '9') return false;
    if (i < 6) micros = micros * 10 + (c - '0');
  }
  for (size_t i = decimals.size(); i < 6; ++i) micros *= 10;
  return true;
}

bool ParseTime(std::string_view token, int64_t& timeUs) {
  if (token.size() < 3 || token.front() != '(' || token.back() != ')') return false;
  token = token.substr(1, token.size() - 2);
  const size_t dot = token.find('.');
  int64_t seconds = 0, micros = 0;
  if (!ParseSeconds(token.substr(0, dot), seconds)) return false;
  if (dot != std::string_view::npos && !ParseMicroseconds(token.substr(dot + 1), micros))
    return false;
  timeUs = seconds * 1000000 + micros;
  return true;
}

bool ParseData(std::string_view hex, SimFrame& f, uint32_t maxLength) {
  if (hex.size() % 2 != 0 || hex.size() / 2 > maxLength) return false;
  for (size_t i = 0; i < hex.size(); i += 2) {
    const int hi = HexValue(hex[i]);
    const int lo = HexValue(hex[i + 1]);
    if (hi < 0 || lo < 0) return false;
    f.payload[i / 2] = static_cast<uint8_t>(hi * 16 + lo);
  }
  f.length = static_cast<uint8_t>(hex.size() / 2);
  return true;
}

bool ParseIdentifier(std::string_view text, SimFrame& f) {
  uint32_t id = 0;
  if (!ParseHex(text, id)) return false;
  if (text.size() == kStandardDigits) {
    if (id > driver::kStandardIdMask) return false;
    f.identifier = id;
  } else if (text.size() == kExtendedDigits) {
    if (id & kErrorFlag) {
      f.type = driver::kFrameCanBusError;
      f.identifier = 0;
    } else {
      f.identifier = (id & driver::kExtendedIdMask) | driver::kExtendedIdFlag;
    }
  } else {
    return false;
  }
  return true;
}

bool ParseFrameToken(std::string_view token, SimFrame& f) {
  const size_t hash = token.find('#');
  if (hash == std::string_view::npos || !ParseIdentifier(token.substr(0, hash), f)) return false;
  std::string_view rest = token.substr(hash + 1);
  if (f.type == driver::kFrameCanBusError) {
    SimFrame ignored;
    return ParseData(rest, ignored, 8);  // error details are not kept: the frame has length 0
  }
  if (!rest.empty() && rest.front() == '#') {
    if (rest.size() < 2) return false;
    const int flags = HexValue(rest[1]);
    if (flags < 0) return false;
    f.type = (flags & 1) ? driver::kFrameCanFdBrsData : driver::kFrameCanFdData;
    return ParseData(rest.substr(2), f, driver::kMaxCanFdPayload);
  }
  if (!rest.empty() && (rest.front() == 'R' || rest.front() == 'r')) {
    f.type = driver::kFrameCanRemote;
    if (rest.size() == 1) return true;
    const int dlc = HexValue(rest[1]);
    if (rest.size() != 2 || dlc < 0 || dlc > 8) return false;
    f.length = static_cast<uint8_t>(dlc);
    return true;
  }
  f.type = driver::kFrameCanData;
  return ParseData(rest, f, 8);
}

std::string_view NextToken(std::string_view& line) {
  const size_t start = line.find_first_not_of(" \t\r\n");
  if (start == std::string_view::npos) {
    line = {};
    return {};
  }
  line = line.substr(start);
  const size_t end = line.find_first_of(" \t\r\n");
  std::string_view token = line.substr(0, end);
  line = end == std::string_view::npos ? std::string_view{} : line.substr(end);
  return token;
}

}  // namespace

bool ParseCandumpLine(std::string_view line, LoggedFrame& out) {
  out = LoggedFrame{};
  const std::string_view time = NextToken(line);
  const std::string_view iface = NextToken(line);
  const std::string_view frame = NextToken(line);
  if (!ParseTime(time, out.timeUs) || iface.empty() || frame.empty()) return false;
  out.interfaceName = std::string(iface);
  return ParseFrameToken(frame, out.frame);
}

bool ReadCandumpLog(std::istream& in, const std::string& name, std::vector<LoggedFrame>& out,
                    std::string& error) {
  std::string line;
  for (size_t number = 1; std::getline(in, line); ++number) {
    if (line.find_first_not_of(" \t\r\n") == std::string::npos) continue;
    LoggedFrame f;
    if (!ParseCandumpLine(line, f)) {
      error = "candump log \"" + name + "\" line " + std::to_string(number) + ": malformed frame";
      return false;
    }
    out.push_back(std::move(f));
  }
  return true;
}

bool ReadCandumpFile(const std::string& path, std::vector<LoggedFrame>& out, std::string& error) {
  std::ifstream in(path);
  if (!in) {
    error = "cannot read candump log \"" + path + "\"";
    return false;
  }
  return ReadCandumpLog(in, path, out, error);
}

std::string FormatCandumpLine(const SimFrame& f, const std::string& interfaceName) {
  uint64_t seconds = 0;
  uint32_t micros = 0;
  UnixTimeOf(TimestampAt(f.endNs), seconds, micros);
  char head[64];
  std::snprintf(head, sizeof head, "(%010llu.%06u) ", static_cast<unsigned long long>(seconds),
                micros);
  std::string line = head + interfaceName + " ";
  char id[16];
  if (f.type == driver::kFrameCanBusError) {
    return line + "20000000#0000000000000000\n";
  }
  if (f.identifier & driver::kExtendedIdFlag) {
    std::snprintf(id, sizeof id, "%08X#", f.identifier & driver::kExtendedIdMask);
  } else {
    std::snprintf(id, sizeof id, "%03X#", f.identifier & driver::kStandardIdMask);
  }
  line += id;
  if (f.type == driver::kFrameCanRemote) {
    line += 'R';
    if (f.length > 0) line += static_cast<char>('0' + (f.length & 0xF));
    return line + "\n";
  }
  if (f.type == driver::kFrameCanFdData || f.type == driver::kFrameCanFdBrsData) {
    line += f.type == driver::kFrameCanFdBrsData ? "#1" : "#0";
  }
  static constexpr char kHex[] = "0123456789ABCDEF";
  for (uint32_t i = 0; i < f.length; ++i) {
    line += kHex[f.payload[i] >> 4];
    line += kHex[f.payload[i] & 0xF];
  }
  return line + "\n";
}

}  // namespace tarvix
