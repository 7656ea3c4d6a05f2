// Helpers shared by the fuzz targets: a sink for the tools' output and a private scratch directory.
#pragma once

#include <cstdint>
#include <cstdio>
#include <string>

namespace kvfuzz {

// /dev/null opened for writing once per process; the tools write their output and messages there.
std::FILE* Sink();

// A directory of this process, created on first use and removed with its contents at exit.
const std::string& ScratchDirectory();

// Writes `size` bytes to `path`, replacing the file; false when that fails.
bool WriteFile(const std::string& path, const uint8_t* data, size_t size);

}  // namespace kvfuzz
