// LoadLibraryA/GetProcAddress/FreeLibrary over dlopen/dlsym/dlclose.
#include "platform/Library.h"

#include <dlfcn.h>

#include <cstring>
#include <optional>
#include <string>

#include "platform/Drive.h"

namespace platform {

namespace {

bool IsRuntimePath(const char* name) {
  return std::strchr(name, '\\') != nullptr || (name[0] != '\0' && name[1] == ':');
}

}  // namespace

HMODULE LoadLibraryA(const char* name) {
  if (name == nullptr || *name == '\0') return nullptr;
  std::string target = name;
  if (IsRuntimePath(name)) {
    const std::optional<std::string> native = MapRuntimePath(name);
    if (!native) return nullptr;
    target = *native;
  }
  return static_cast<HMODULE>(dlopen(target.c_str(), RTLD_NOW | RTLD_LOCAL));
}

FARPROC GetProcAddress(HMODULE library, const char* symbol) {
  if (library == nullptr || symbol == nullptr) return nullptr;
  return dlsym(library, symbol);
}

bool FreeLibrary(HMODULE library) { return library != nullptr && dlclose(library) == 0; }

}  // namespace platform
