// Drive mapping: drive letter check, separator change and a lexical walk that cannot climb out.
#include "platform/Drive.h"

#include <cerrno>
#include <climits>
#include <cstdlib>
#include <vector>

namespace platform {

namespace {

bool IsSeparator(char c) { return c == '\\' || c == '/'; }

bool HasDriveLetter(std::string_view path) {
  return path.size() >= 2 && path[1] == ':' &&
         ((path[0] >= 'A' && path[0] <= 'Z') || (path[0] >= 'a' && path[0] <= 'z'));
}

// Splits on separators and resolves "." and ".."; false when ".." climbs above the root.
bool ResolveComponents(std::string_view rest, std::vector<std::string_view>& parts) {
  size_t begin = 0;
  while (begin <= rest.size()) {
    size_t end = begin;
    while (end < rest.size() && !IsSeparator(rest[end])) ++end;
    const std::string_view part = rest.substr(begin, end - begin);
    if (part == "..") {
      if (parts.empty()) return false;
      parts.pop_back();
    } else if (!part.empty() && part != ".") {
      parts.push_back(part);
    }
    begin = end + 1;
  }
  return true;
}

// realpath(3) of `path`; empty when it does not exist or cannot be resolved.
std::string RealPath(const std::string& path) {
  char resolved[PATH_MAX];
  return ::realpath(path.c_str(), resolved) != nullptr ? std::string(resolved) : std::string();
}

}  // namespace

std::string DriveDirectory() {
  if (const char* drive = std::getenv("KELVANERT_DRIVE_C"); drive != nullptr && *drive != '\0') {
    return drive;
  }
  const char* home = std::getenv("HOME");
  const std::string base = (home != nullptr && *home != '\0') ? home : ".";
  return base + "/.kelvanert/drive_c";
}

std::optional<std::string> MapRuntimePath(std::string_view runtimePath) {
  if (runtimePath.find('\0') != std::string_view::npos) return std::nullopt;
  std::string_view rest = runtimePath;
  if (HasDriveLetter(rest)) {
    if (rest[0] != 'C' && rest[0] != 'c') return std::nullopt;
    rest.remove_prefix(2);
  }
  std::vector<std::string_view> parts;
  if (!ResolveComponents(rest, parts)) return std::nullopt;
  std::string native = DriveDirectory();
  while (native.size() > 1 && native.back() == '/') native.pop_back();
  for (std::string_view part : parts) {
    native += '/';
    native += part;
  }
  return native;
}

std::string ResolvedNativePath(const std::string& runtimePath) {
  const std::optional<std::string> native = MapRuntimePath(runtimePath);
  if (!native) return {};
  if (std::string file = RealPath(*native); !file.empty()) return file;
  const size_t slash = native->rfind('/');
  if (slash == std::string::npos) return {};
  const std::string directory = RealPath(slash == 0 ? "/" : native->substr(0, slash));
  if (directory.empty()) return {};
  return (directory == "/" ? "" : directory) + native->substr(slash);
}

std::FILE* OpenFile(const std::string& runtimePath, const char* mode) {
  const std::optional<std::string> native = MapRuntimePath(runtimePath);
  if (!native) {
    errno = ENOENT;
    return nullptr;
  }
  return std::fopen(native->c_str(), mode);
}

}  // namespace platform
