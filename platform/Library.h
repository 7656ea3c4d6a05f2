// Run-time loading of libraries: drive-mapped paths or bare names found by the loader.
#pragma once

namespace platform {

struct LoadedLibrary;  // opaque: the loader's handle
using HMODULE = LoadedLibrary*;
using FARPROC = void*;

// A name with a drive letter or a backslash is a runtime path and goes through the drive
// mapping (a path that cannot be mapped fails); a bare name is found by the dynamic loader's
// search. Null on failure.
HMODULE LoadLibraryA(const char* name);

// The address of an exported symbol, or null.
FARPROC GetProcAddress(HMODULE library, const char* symbol);

// Unloads; false for a null handle or when the loader refuses.
bool FreeLibrary(HMODULE library);

}  // namespace platform
