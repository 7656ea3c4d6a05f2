// Drive mapping of controller paths, the same rule the runtime's platform layer applies.
#include "vora/NativePath.h"

#include <cctype>
#include <cstdlib>
#include <vector>

namespace vora {
namespace {

std::string DriveDirectory() {
  if (const char* drive = std::getenv("KELVANERT_DRIVE_C"); drive != nullptr && *drive != '\0') {
    return drive;
  }
  const char* home = std::getenv("HOME");
  return std::string(home != nullptr ? home : "") + "/.kelvanert/drive_c";
}

bool HasDriveLetter(std::string_view path) {
  return path.size() >= 2 && std::isalpha(static_cast<unsigned char>(path[0])) && path[1] == ':';
}

// Splits the part after the drive at "\" and "/", resolving "." and ".." inside the drive.
bool ResolveInsideDrive(std::string_view rest, std::vector<std::string_view>& parts) {
  size_t start = 0;
  while (start <= rest.size()) {
    size_t end = rest.find_first_of("\\/", start);
    if (end == std::string_view::npos) end = rest.size();
    const std::string_view part = rest.substr(start, end - start);
    if (part == "..") {
      if (parts.empty()) return false;
      parts.pop_back();
    } else if (!part.empty() && part != ".") {
      parts.push_back(part);
    }
    start = end + 1;
  }
  return true;
}

}  // namespace

bool ToNativePath(std::string_view path, std::string& native) {
  if (!HasDriveLetter(path)) {
    native = path;
    return !native.empty();
  }
  if (std::tolower(static_cast<unsigned char>(path[0])) != 'c') return false;
  std::vector<std::string_view> parts;
  if (!ResolveInsideDrive(path.substr(2), parts) || parts.empty()) return false;
  native = DriveDirectory();
  for (const std::string_view part : parts) {
    native += '/';
    native += part;
  }
  return true;
}

}  // namespace vora
