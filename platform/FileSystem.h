// Directory creation and file attributes on runtime paths, with errno numbers as results.
#pragma once

#include <cstdint>
#include <string>

namespace platform {

// Attribute bits as the runtime tests them.
constexpr uint32_t kFileAttributeDirectory = 0x10;
constexpr uint32_t kFileAttributeNormal = 0x80;
constexpr uint32_t kInvalidFileAttributes = 0xFFFFFFFF;

// mkdir of one level: 0 on success, else the errno (17 exists, 2 parent missing). A path that
// cannot be mapped onto the drive, or a file standing where a parent should be, gives 2. The
// drive's own directory is created on demand, as a volume that is always there.
int MakeDirectory(const std::string& runtimePath);

// kFileAttributeDirectory or kFileAttributeNormal for an existing path, kInvalidFileAttributes
// when stat fails or the path cannot be mapped.
uint32_t GetFileAttributes(const std::string& runtimePath);

// The system's description of an errno value (strerror_r), never empty.
std::string ErrorText(int errorNumber);

}  // namespace platform
