// The library's process-wide state: the open files by handle, the platform code and API flags.
#pragma once

#include <cstdint>
#include <map>
#include <memory>
#include <mutex>

#include "vora/VoraFile.h"

namespace vora {

// One instance per loaded library. Every entry point runs under `mutex_`, the one lock of the
// library: HDF5 as built for this system is not thread-safe, and sessions of several threads call
// the library at the same time, each for its own file.
class VoraLibrary {
 public:
  static VoraLibrary& Instance();
  ~VoraLibrary();  // at unload: files still open are flushed and closed

  int32_t SetPlatform(int32_t platformCode);
  int32_t SetApiFlags(uint32_t flags);
  int32_t OpenFile(const char* path, int32_t openMode, int32_t access, int32_t revision,
                   int32_t* fileHandle);
  int32_t CreateObject(const char* objectPath, int32_t fileHandle, int32_t* objectHandle);
  int32_t SetProperty(const char* name, int32_t dataType, const void* value, int32_t fileHandle,
                      int32_t objectHandle);
  int32_t AppendRaw(int32_t dataType, uint32_t byteCount, const void* bytes, int32_t fileHandle,
                    int32_t objectHandle);
  int32_t Flush(int32_t scope, int32_t fileHandle);
  int32_t CloseFile(int32_t fileHandle);

 private:
  VoraLibrary() = default;
  void QuietHdf5();                    // guarded by mutex_
  VoraFile* Find(int32_t fileHandle);  // guarded by mutex_
  int32_t NextHandle();                // guarded by mutex_

  std::mutex mutex_;
  std::map<int32_t, std::unique_ptr<VoraFile>> files_;  // guarded by mutex_
  int32_t nextHandle_ = 0;                              // guarded by mutex_
  int32_t platformCode_ = 0;                            // guarded by mutex_
  uint32_t apiFlags_ = 0;                               // guarded by mutex_
  bool hdf5Quiet_ = false;                              // guarded by mutex_
};

}  // namespace vora
