// The measurement-data library vora.dll: where it is installed, loading it once, its entry points.
#pragma once

#include <atomic>
#include <cstdint>
#include <mutex>
#include <string>

#include "logging/vorException.h"
#include "platform/Library.h"
#include "vora/VoraApi.h"

namespace nKV_DLL300 {

// The library is not linked: locate names the file once, load opens it on the first use and
// resolves the entry points the logging calls, unload frees it. Every entry-point wrapper throws
// vorException{kVorLibraryNotLoaded} while the library is not loaded; otherwise it returns the
// entry point's own result, which the logging does not examine.
//
// Threads: locate, load and unload take the library lock, so sessions opening their first
// measurement-data logs at once load the library once. The entry points are called without the
// lock from any session's poll thread (the library accepts concurrent calls on different files);
// unload must not run while a session still calls them, which the module ensures by unloading only
// after its service has stopped every session.
class MeasurementLibrary {
 public:
  MeasurementLibrary() = default;
  // Frees a library still loaded (failure ignored). The module's own instance is never destroyed.
  ~MeasurementLibrary();
  MeasurementLibrary(const MeasurementLibrary&) = delete;
  MeasurementLibrary& operator=(const MeasurementLibrary&) = delete;

  // Detects the platform (once per instance) and names the library file: "vora.dll" alone on the
  // real-time kernel (environment "OS" starting with PHARLAP, any case), so that the loader's
  // search finds it; elsewhere the QVSHAREDDIR value of the installer key in the registry
  // followed by "\vora\vora.dll", or "C:\Program Files\Quovera\Shared\vora\vora.dll" when the key
  // or value is missing or cannot be read. A library already loaded stays loaded; the new path
  // is used by the next load after an unload.
  void locate();
  // Loads the library and resolves its entry points, then calls VorSetOS with the platform code;
  // does nothing when it is loaded already. Throws vorException{kVorLibraryNotLoaded} when the
  // file cannot be loaded or an entry point is missing; the library is then unloaded again, so
  // the next call tries anew.
  void load();
  // Frees a loaded library; throws vorException{kVorLibraryNotUnloaded} when that fails. Nothing
  // to do when it is not loaded.
  void unload();

  std::string path() const;
  int32_t platformCode() const;
  bool loaded() const { return loaded_.load(std::memory_order_acquire); }

  int32_t FileOpenExA(const char* path, int32_t openMode, int32_t access, int32_t revision,
                      int32_t* fileHandle) const;
  int32_t ObjCreateA(const char* objectPath, int32_t fileHandle, int32_t* objectHandle) const;
  int32_t PropSetA(const char* name, int32_t dataType, const void* value, int32_t fileHandle,
                   int32_t objectHandle) const;
  int32_t ObjRawSet(int32_t dataType, uint32_t byteCount, const void* bytes, int32_t fileHandle,
                    int32_t objectHandle) const;
  int32_t FileBufFlush(int32_t scope, int32_t fileHandle) const;
  int32_t FileClose(int32_t fileHandle) const;

 private:
  // The entry points the logging calls, resolved by name. Written under lock_ while loaded_ is
  // false; read by the wrappers only after they saw loaded_ true.
  struct EntryPoints {
    VorSetOSFn setOS = nullptr;
    VorFileOpenExAFn fileOpenExA = nullptr;
    VorObjCreateAFn objCreateA = nullptr;
    VorPropSetAFn propSetA = nullptr;
    VorObjRawSetFn objRawSet = nullptr;
    VorFileBufFlushFn fileBufFlush = nullptr;
    VorFileCloseFn fileClose = nullptr;
  };

  void resolveEntryPoints();  // lock_ held
  template <typename Fn>
  Fn resolve(const char* name) const;  // lock_ held
  // Throws unless loaded; the table then holds every entry point.
  const EntryPoints& table() const;

  mutable std::mutex lock_;    // the library lock: guards loading, unloading and locating
  std::string path_;           // lock_
  int32_t platformCode_ = -1;  // lock_; -1 until detected, then kept for the instance's life
  platform::HMODULE module_ = nullptr;  // lock_
  std::atomic<bool> loaded_{false};     // set under lock_ once every entry point is resolved
  EntryPoints table_;                   // see EntryPoints
};

// The module's one library: located by the module's static initialisers, after its service,
// loaded by the first measurement-data log, unloaded by the module's orderly unload.
MeasurementLibrary& TheMeasurementLibrary();
void LocateMeasurementLibrary();
void LoadMeasurementLibrary();
void UnloadMeasurementLibrary();

}  // namespace nKV_DLL300
