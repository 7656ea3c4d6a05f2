// The configuration file kelvanert.ini: its first word name=value gives the TCP port.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace nKV_DLL300 {

constexpr char kDefaultPortText[] = "13456";
constexpr char kServiceDirectory[] = "C:\\QV-RT\\tarvix\\kelvane";
constexpr char kConfigurationFileName[] = "kelvanert.ini";
constexpr size_t kMaxTokenLength = 19;  // the first word is held in 20 bytes

// The port text to listen on, and why the default was taken when the file was unusable (empty
// when nothing needs saying).
struct PortChoice {
  std::string portText;
  std::string problem;
};

// The port text for a file's contents; nullopt stands for "no file". A missing file and a file
// without a word give the default silently; a first word without "=" or longer than 19
// characters gives the default with a problem.
PortChoice ChoosePortText(const std::optional<std::string>& fileContents);

// The port a port text stands for: an integer as the property values read it, modulo 65536
// (abc gives 0, 70000 gives 4464).
uint16_t PortFromText(std::string_view portText);

// Looks up the service directory (creating it and its missing parents) and reads the file in
// it. A directory that cannot be created gives the default port with a problem.
PortChoice ReadConfiguration();

}  // namespace nKV_DLL300
