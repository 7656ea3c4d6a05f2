// The command line of kelvanert-controller.
#pragma once

#include <optional>
#include <string>

namespace kvcontroller {

struct ControllerOptions {
  std::string modulePath;  // empty: libkelvanert.so beside the executable
  bool help = false;
};

// Parses argv; nullopt (with a message in `error`) for an unknown option or a missing value.
std::optional<ControllerOptions> ParseOptions(int argc, char** argv, std::string& error);

// The usage text, examples first.
const char* UsageText();

}  // namespace kvcontroller
