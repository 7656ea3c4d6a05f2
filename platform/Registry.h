// The registry stand-in: keys and string values read from C:\Windows\registry.ini.
#pragma once

#include <cstdint>
#include <string>

namespace platform {

// The file: one "[HKEY_LOCAL_MACHINE\SOFTWARE\...]" section per key, then "name=value" lines.
// Key paths and value names match without regard to case; blank lines and lines starting with
// ';' or '#' are ignored; a value runs to the end of its line. No file or no section is a
// missing key.
inline constexpr const char* kRegistryFile = "C:\\Windows\\registry.ini";

struct RegistryKey;  // an open key: the values of its section, read when it was opened
using HKEY = RegistryKey*;

// Only the local-machine root exists.
inline const HKEY HKEY_LOCAL_MACHINE = reinterpret_cast<HKEY>(static_cast<uintptr_t>(0x80000002));

inline constexpr int32_t ERROR_SUCCESS = 0;
inline constexpr int32_t ERROR_FILE_NOT_FOUND = 2;
inline constexpr int32_t ERROR_INVALID_PARAMETER = 87;
inline constexpr int32_t ERROR_MORE_DATA = 234;
inline constexpr uint32_t REG_SZ = 1;

// Opens root\subKey; *result must be released with RegCloseKey. Options and access are ignored.
int32_t RegOpenKeyExA(HKEY root, const char* subKey, uint32_t options, uint32_t access,
                      HKEY* result);

// Reads a string value with its NUL. data may be null to ask for the size; *dataSize is the
// buffer size in, the bytes needed (value length + 1) out; ERROR_MORE_DATA when it is short.
int32_t RegQueryValueExA(HKEY key, const char* valueName, uint32_t* reserved, uint32_t* type,
                         uint8_t* data, uint32_t* dataSize);

int32_t RegCloseKey(HKEY key);

}  // namespace platform
