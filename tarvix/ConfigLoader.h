// Reading a hardware description (TARVIX_SIM_CONFIG) from JSON; schema in docs/tarvix.md.
#pragma once

#include <string>
#include <string_view>

#include "tarvix/HardwareConfig.h"

namespace tarvix {

// Parses `json` into `out`. Relative file names (replay logs, captures) are taken from
// `baseDirectory`. On any error: false, and `error` names the offending key and why.
bool ParseHardwareConfig(std::string_view json, const std::string& baseDirectory,
                         HardwareConfig& out, std::string& error);

// Reads and parses a file; relative names inside it are taken from the file's directory.
bool LoadHardwareConfigFile(const std::string& path, HardwareConfig& out, std::string& error);

}  // namespace tarvix
