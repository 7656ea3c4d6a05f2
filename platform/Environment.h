// Environment variables of the process.
#pragma once

#include <optional>
#include <string>

namespace platform {

// The value of `name`, or nothing when it is unset (on Linux "OS" normally is).
std::optional<std::string> GetEnvironmentVariable(const char* name);

}  // namespace platform
