// mkdir/stat behind runtime paths; errno is reported as the number it is.
#include "platform/FileSystem.h"

#include <string.h>
#include <sys/stat.h>
#include <sys/types.h>

#include <cerrno>
#include <optional>

#include "platform/Drive.h"

namespace platform {

namespace {

constexpr mode_t kDirectoryMode = 0777;  // narrowed by the process umask

// Creates the drive directory and its missing parents (mkdir -p).
void EnsureDrive() {
  std::string drive = DriveDirectory();
  struct stat info {};
  if (stat(drive.c_str(), &info) == 0) return;
  for (size_t slash = drive.find('/', 1); slash != std::string::npos;
       slash = drive.find('/', slash + 1)) {
    mkdir(drive.substr(0, slash).c_str(), kDirectoryMode);
  }
  mkdir(drive.c_str(), kDirectoryMode);
}

}  // namespace

int MakeDirectory(const std::string& runtimePath) {
  const std::optional<std::string> native = MapRuntimePath(runtimePath);
  if (!native) return ENOENT;
  EnsureDrive();
  if (mkdir(native->c_str(), kDirectoryMode) == 0) return 0;
  // A file where a parent directory should be is "path not found" on the controller.
  return errno == ENOTDIR ? ENOENT : errno;
}

uint32_t GetFileAttributes(const std::string& runtimePath) {
  const std::optional<std::string> native = MapRuntimePath(runtimePath);
  struct stat info {};
  if (!native || stat(native->c_str(), &info) != 0) return kInvalidFileAttributes;
  return S_ISDIR(info.st_mode) ? kFileAttributeDirectory : kFileAttributeNormal;
}

std::string ErrorText(int errorNumber) {
  char buffer[256] = {};
  // GNU strerror_r may return a static text instead of filling the buffer.
  const char* text = strerror_r(errorNumber, buffer, sizeof buffer);
  if (text == nullptr || *text == '\0') return "Unknown error " + std::to_string(errorNumber);
  return text;
}

}  // namespace platform
