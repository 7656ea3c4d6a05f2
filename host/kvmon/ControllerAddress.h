// Where the controller is: "HOST", "HOST:PORT", "[IPV6]:PORT" or a bare IPv6 address, from -c or
// the environment variable KVMON_CONTROLLER.
#pragma once

#include <cstdint>
#include <optional>
#include <string>

namespace kvmon {

inline constexpr char kControllerVariable[] = "KVMON_CONTROLLER";
inline constexpr uint16_t kDefaultControllerPort = 13456;

struct ControllerAddress {
  std::string host = "127.0.0.1";
  uint16_t port = kDefaultControllerPort;

  // "host:port", with brackets around an IPv6 address.
  std::string text() const;
};

// nullopt with `error` in plain words when `text` names no host or no TCP port. A host without a
// port keeps the default port.
std::optional<ControllerAddress> ParseControllerAddress(const std::string& text,
                                                        std::string& error);

}  // namespace kvmon
