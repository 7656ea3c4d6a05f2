// Reading --tx frame texts and writing the transmit property messages of a frame.
#include "host/kvmon/TransmitText.h"

#include <algorithm>
#include <cctype>
#include <cstdio>

namespace kvmon {
namespace {

constexpr size_t kCommandLimit = 256;  // the controller reads at most this many bytes per command
constexpr size_t kClassicMax = 8;
constexpr uint8_t kFrameTypeRemote = 0x01;
constexpr uint8_t kFrameTypeFd = 0x10;
constexpr uint8_t kFrameTypeFdSwitching = 0x18;
constexpr const char* kPayloadProperty = "SET_TX_PROP_PAYLOAD=";

int HexDigit(char c) {
  if (c >= '0' && c <= '9') return c - '0';
  c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
  return c >= 'a' && c <= 'f' ? c - 'a' + 10 : -1;
}

bool IsFdLength(size_t n) {
  return n <= 8 || n == 12 || n == 16 || n == 20 || n == 24 || n == 32 || n == 48 || n == 64;
}

bool ReadIdentifier(const std::string& digits, TransmitFrame& frame, std::string& error) {
  if (digits.empty() || digits.size() > 8) {
    error = "the identifier needs 1 to 8 hex digits";
    return false;
  }
  uint32_t value = 0;
  for (char c : digits) {
    if (HexDigit(c) < 0) {
      error = "'" + digits + "' is not a hex identifier";
      return false;
    }
    value = value << 4 | static_cast<uint32_t>(HexDigit(c));
  }
  frame.extended = digits.size() > 3;
  if (value > (frame.extended ? 0x1FFFFFFFu : 0x7FFu)) {
    error = frame.extended ? "an extended identifier is at most 1FFFFFFF"
                           : "a standard identifier is at most 7FF";
    return false;
  }
  frame.identifier = value;
  return true;
}

bool ReadHexBytes(const std::string& text, std::vector<uint8_t>& bytes, std::string& error) {
  std::string digits;
  for (char c : text) {
    if (c != '.') digits += c;
  }
  if (digits.size() % 2 != 0) {
    error = "the data needs two hex digits per byte";
    return false;
  }
  for (size_t i = 0; i < digits.size(); i += 2) {
    const int high = HexDigit(digits[i]);
    const int low = HexDigit(digits[i + 1]);
    if (high < 0 || low < 0) {
      error = "'" + text + "' is not hex data";
      return false;
    }
    bytes.push_back(static_cast<uint8_t>(high << 4 | low));
  }
  return true;
}

bool ReadRemote(const std::string& data, TransmitFrame& frame, std::string& error) {
  frame.remote = true;
  frame.frameType = kFrameTypeRemote;
  if (data.size() == 1) return true;
  if (data.size() != 2 || data[1] < '0' || data[1] > '8') {
    error = "a remote frame is ID#R or ID#R followed by a length from 0 to 8";
    return false;
  }
  frame.length = static_cast<uint32_t>(data[1] - '0');
  return true;
}

bool ReadFd(const std::string& data, TransmitFrame& frame, std::string& error) {
  const int flags = data.empty() ? -1 : HexDigit(data[0]);
  if (flags < 0) {
    error = "a CAN FD frame is ID##F followed by the data (F: 0, or 1 for bit-rate switching)";
    return false;
  }
  frame.frameType = (flags & 1) ? kFrameTypeFdSwitching : kFrameTypeFd;
  if (!ReadHexBytes(data.substr(1), frame.payload, error)) return false;
  if (frame.payload.size() > 64 || !IsFdLength(frame.payload.size())) {
    error = "a CAN FD payload has 0 to 8, 12, 16, 20, 24, 32, 48 or 64 bytes";
    return false;
  }
  frame.length = static_cast<uint32_t>(frame.payload.size());
  return true;
}

bool ReadClassic(const std::string& data, TransmitFrame& frame, std::string& error) {
  if (!ReadHexBytes(data, frame.payload, error)) return false;
  if (frame.payload.size() > kClassicMax) {
    error = "a classic CAN frame carries at most 8 bytes (CAN FD: ID##0...)";
    return false;
  }
  frame.length = static_cast<uint32_t>(frame.payload.size());
  return true;
}

}  // namespace

std::string PayloadList(const std::vector<uint8_t>& payload) {
  size_t used = payload.size();
  while (used > 0 && payload[used - 1] == 0) --used;
  std::string list;
  for (size_t i = 0; i < used; ++i) {
    if (i > 0) list += ',';
    list += std::to_string(payload[i]);
  }
  return list;
}

std::optional<TransmitFrame> ParseTransmitFrame(const std::string& text, std::string& error) {
  const size_t hash = text.find('#');
  if (hash == std::string::npos) {
    error = "'" + text + "' is not a frame such as 123#11223344";
    return std::nullopt;
  }
  TransmitFrame frame;
  frame.text = text;
  if (!ReadIdentifier(text.substr(0, hash), frame, error)) return std::nullopt;
  const std::string data = text.substr(hash + 1);
  bool ok = false;
  if (!data.empty() && data[0] == '#') {
    ok = ReadFd(data.substr(1), frame, error);
  } else if (!data.empty() && (data[0] == 'R' || data[0] == 'r')) {
    ok = ReadRemote(data, frame, error);
  } else {
    ok = ReadClassic(data, frame, error);
  }
  if (!ok) return std::nullopt;
  if (std::string(kPayloadProperty).size() + PayloadList(frame.payload).size() > kCommandLimit) {
    error = "this payload is too long for one command to the controller; use fewer non-zero bytes";
    return std::nullopt;
  }
  return frame;
}

std::vector<std::string> TransmitMessages(const TransmitFrame& frame) {
  // Timing types: 0 cyclic data, 1 event data, 2 cyclic remote, 3 event remote.
  const bool cyclic = frame.periodMs.has_value();
  const uint32_t timing = (cyclic ? 0u : 1u) + (frame.remote ? 2u : 0u);
  char rate[64];
  std::snprintf(rate, sizeof rate, "%.9g", cyclic ? *frame.periodMs / 1000.0 : 0.0);
  return {
      "SET_TX_PROP_IDENTIFIER=" + std::to_string(frame.identifier),
      std::string("SET_TX_PROP_EXTENDED_ID=") + (frame.extended ? "1" : "0"),
      "SET_TX_PROP_FRAME_TYPE=" + std::to_string(frame.frameType),
      "SET_TX_PROP_PAYLOAD_LENGTH=" + std::to_string(frame.length),
      "SET_TX_PROP_TIMING_TYPE=" + std::to_string(timing),
      std::string("SET_TX_PROP_CYCLIC_RATE=") + rate,
      kPayloadProperty + PayloadList(frame.payload),
      "CMD_TX_START",
  };
}

}  // namespace kvmon
