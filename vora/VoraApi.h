// The entry points of the measurement-data library vora.dll that the runtime calls, and their
// constants.
//
// The runtime does not link the library: it loads vora.dll at run time and resolves these names,
// calling them through the function pointer types below. Every entry point returns kVorOk (0) or a
// negative kVorErr* code; out handles are written only on success.
#pragma once

#include <cstdint>

// Platform codes of VorSetOS.
inline constexpr int32_t kVorPlatformDesktop = 0;   // desktop operating system
inline constexpr int32_t kVorPlatformRealTime = 1;  // the controller's real-time kernel

// Open modes, second argument of VorFileOpenExA.
inline constexpr int32_t kVorOpenExisting = 0;     // open a file that exists; its objects are kept
inline constexpr int32_t kVorCreateNew = 1;        // create a file; fails when it exists
inline constexpr int32_t kVorCreateOrReplace = 2;  // create a file, replacing one that exists

// Access, third argument of VorFileOpenExA.
inline constexpr int32_t kVorAccessRead = 1;       // read only (only with kVorOpenExisting)
inline constexpr int32_t kVorAccessReadWrite = 2;  // read and write

// Interface revision, fourth argument of VorFileOpenExA: the revision of this interface the caller
// was written for. The library speaks exactly this one and refuses others.
inline constexpr int32_t kVorApiRevision = 4713;

// Data-type codes of VorPropSetA and VorObjRawSet.
inline constexpr int32_t kVorTypeInt32 = 3;  // one signed 32-bit integer (properties)
inline constexpr int32_t kVorTypeUInt8 = 5;  // unsigned bytes (channel raw data, byte properties)

// Scopes of VorFileBufFlush, a bit set.
inline constexpr int32_t kVorFlushData = 1;       // buffered channel data
inline constexpr int32_t kVorFlushStructure = 2;  // objects and properties
inline constexpr int32_t kVorFlushAll = kVorFlushData | kVorFlushStructure;

// A handle that names no file or object; callers preset out handles with it.
inline constexpr int32_t kVorNoHandle = -1;

// Results.
inline constexpr int32_t kVorOk = 0;
inline constexpr int32_t kVorErrArgument =
    -1;  // a null pointer, an unknown code or mode, a bad combination
inline constexpr int32_t kVorErrHandle = -2;  // no open file or object of that handle
inline constexpr int32_t kVorErrFile = -3;  // the file cannot be created, opened, written or closed
inline constexpr int32_t kVorErrPath = -4;  // the object path is not of the form /'group'/'channel'
inline constexpr int32_t kVorErrDataType = -5;  // the data-type code is not accepted for the call
inline constexpr int32_t kVorErrRevision = -6;  // the interface revision is not kVorApiRevision
inline constexpr int32_t kVorErrReadOnly = -7;  // a write to a file opened for reading
inline constexpr int32_t kVorErrObject = -8;    // the object cannot be created or opened

extern "C" {
// Sets the platform the caller runs on (kVorPlatform*). Called once right after loading.
using VorSetOSFn = int32_t (*)(int32_t platformCode);
// Sets API behaviour flags; no flag is defined, every value is accepted and kept.
using VorSetAPIFlagsFn = int32_t (*)(uint32_t flags);
// Opens `path` (a native path, or a controller path with a drive letter and backslashes).
using VorFileOpenExAFn = int32_t (*)(const char* path, int32_t openMode, int32_t access,
                                     int32_t revision, int32_t* fileHandle);
// Creates the object at `objectPath` ("/'group'/'channel'", "/'group'" or "/"), or opens it when it
// exists, and returns its handle inside `fileHandle`.
using VorObjCreateAFn = int32_t (*)(const char* objectPath, int32_t fileHandle,
                                    int32_t* objectHandle);
// Sets (or replaces) the property `name` of an object to the value at `value`.
using VorPropSetAFn = int32_t (*)(const char* name, int32_t dataType, const void* value,
                                  int32_t fileHandle, int32_t objectHandle);
// Appends `byteCount` bytes at `bytes` to a channel's raw data (data type kVorTypeUInt8 only).
using VorObjRawSetFn = int32_t (*)(int32_t dataType, uint32_t byteCount, const void* bytes,
                                   int32_t fileHandle, int32_t objectHandle);
// Writes what the library buffers for the file to disk (scope: kVorFlush* bits).
using VorFileBufFlushFn = int32_t (*)(int32_t scope, int32_t fileHandle);
// Flushes everything and closes the file; its handle and object handles become invalid.
using VorFileCloseFn = int32_t (*)(int32_t fileHandle);
}
