// Parsing registry.ini into the section of one key, and Win32-shaped queries over it.
#include "platform/Registry.h"

#include <cctype>
#include <cstring>
#include <fstream>
#include <map>
#include <new>
#include <optional>

#include "platform/Drive.h"

namespace platform {

struct RegistryKey {
  std::map<std::string, std::string> values;  // names in lower case
};

namespace {

constexpr const char* kLocalMachinePrefix = "HKEY_LOCAL_MACHINE\\";

std::string LowerCase(std::string text) {
  for (char& c : text) c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
  return text;
}

std::string Trimmed(const std::string& text) {
  const size_t begin = text.find_first_not_of(" \t\r\n");
  if (begin == std::string::npos) return {};
  const size_t end = text.find_last_not_of(" \t\r\n");
  return text.substr(begin, end - begin + 1);
}

// The values of section `wanted` (lower case), or nothing when the file or section is missing.
std::optional<std::map<std::string, std::string>> ReadSection(const std::string& wanted) {
  const std::optional<std::string> native = MapRuntimePath(kRegistryFile);
  if (!native) return std::nullopt;
  std::ifstream file(*native);
  if (!file) return std::nullopt;
  std::optional<std::map<std::string, std::string>> found;
  bool inSection = false;
  for (std::string raw; std::getline(file, raw);) {
    const std::string line = Trimmed(raw);
    if (line.empty() || line[0] == ';' || line[0] == '#') continue;
    if (line.front() == '[' && line.back() == ']') {
      inSection = LowerCase(Trimmed(line.substr(1, line.size() - 2))) == wanted;
      if (inSection && !found) found.emplace();
      continue;
    }
    const size_t equals = line.find('=');
    if (inSection && equals != std::string::npos) {
      (*found)[LowerCase(Trimmed(line.substr(0, equals)))] = line.substr(equals + 1);
    }
  }
  return found;
}

}  // namespace

int32_t RegOpenKeyExA(HKEY root, const char* subKey, uint32_t, uint32_t, HKEY* result) {
  if (result == nullptr || subKey == nullptr) return ERROR_INVALID_PARAMETER;
  *result = nullptr;
  if (root != HKEY_LOCAL_MACHINE) return ERROR_FILE_NOT_FOUND;
  auto values = ReadSection(LowerCase(std::string(kLocalMachinePrefix) + subKey));
  if (!values) return ERROR_FILE_NOT_FOUND;
  auto* key = new (std::nothrow) RegistryKey{std::move(*values)};
  if (key == nullptr) return ERROR_FILE_NOT_FOUND;
  *result = key;
  return ERROR_SUCCESS;
}

int32_t RegQueryValueExA(HKEY key, const char* valueName, uint32_t*, uint32_t* type, uint8_t* data,
                         uint32_t* dataSize) {
  if (key == nullptr || key == HKEY_LOCAL_MACHINE) return ERROR_INVALID_PARAMETER;
  const auto value = key->values.find(LowerCase(valueName != nullptr ? valueName : ""));
  if (value == key->values.end()) return ERROR_FILE_NOT_FOUND;
  if (type != nullptr) *type = REG_SZ;
  const auto needed = static_cast<uint32_t>(value->second.size() + 1);
  if (dataSize == nullptr) return data == nullptr ? ERROR_SUCCESS : ERROR_INVALID_PARAMETER;
  const uint32_t available = *dataSize;
  *dataSize = needed;
  if (data == nullptr) return ERROR_SUCCESS;
  if (available < needed) return ERROR_MORE_DATA;
  std::memcpy(data, value->second.c_str(), needed);
  return ERROR_SUCCESS;
}

int32_t RegCloseKey(HKEY key) {
  if (key == nullptr || key == HKEY_LOCAL_MACHINE) return ERROR_INVALID_PARAMETER;
  delete key;
  return ERROR_SUCCESS;
}

}  // namespace platform
