// Splitting a controller address into host and port.
#include "host/kvmon/ControllerAddress.h"

#include <cctype>

namespace kvmon {
namespace {

bool ReadPort(const std::string& text, uint16_t& port) {
  if (text.empty() || text.size() > 5) return false;
  uint32_t value = 0;
  for (const char c : text) {
    if (!std::isdigit(static_cast<unsigned char>(c))) return false;
    value = value * 10 + static_cast<uint32_t>(c - '0');
  }
  if (value == 0 || value > 65535) return false;
  port = static_cast<uint16_t>(value);
  return true;
}

}  // namespace

std::string ControllerAddress::text() const {
  const bool ipv6 = host.find(':') != std::string::npos;
  return (ipv6 ? "[" + host + "]" : host) + ":" + std::to_string(port);
}

std::optional<ControllerAddress> ParseControllerAddress(const std::string& text,
                                                        std::string& error) {
  ControllerAddress address;
  std::optional<std::string> portText;
  if (!text.empty() && text[0] == '[') {  // [IPv6] or [IPv6]:PORT
    const size_t close = text.find(']');
    if (close == std::string::npos || (close + 1 < text.size() && text[close + 1] != ':')) {
      error = "'" + text + "' is not [IPV6-ADDRESS]:PORT";
      return std::nullopt;
    }
    address.host = text.substr(1, close - 1);
    if (close + 1 < text.size()) portText = text.substr(close + 2);
  } else if (text.find(':') != text.rfind(':')) {  // a bare IPv6 address has several colons
    address.host = text;
  } else {
    const size_t colon = text.find(':');
    address.host = text.substr(0, colon);
    if (colon != std::string::npos) portText = text.substr(colon + 1);
  }
  if (address.host.empty()) {
    error = "'" + text + "' names no host";
    return std::nullopt;
  }
  if (portText && !ReadPort(*portText, address.port)) {
    error = "'" + *portText + "' is not a TCP port (1 to 65535)";
    return std::nullopt;
  }
  return address;
}

}  // namespace kvmon
