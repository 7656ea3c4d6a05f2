// The library's handle table and the checks every entry point makes before touching a file.
#include "vora/VoraLibrary.h"

#include <limits>

#include "vora/NativePath.h"
#include "vora/VoraApi.h"

namespace vora {

VoraLibrary& VoraLibrary::Instance() {
  static VoraLibrary library;
  return library;
}

VoraLibrary::~VoraLibrary() {
  std::lock_guard lock(mutex_);
  files_.clear();
}

// HDF5 prints its error stack on every failed call unless told not to; failures are results here.
void VoraLibrary::QuietHdf5() {
  if (hdf5Quiet_) return;
  H5Eset_auto2(H5E_DEFAULT, nullptr, nullptr);
  hdf5Quiet_ = true;
}

VoraFile* VoraLibrary::Find(int32_t fileHandle) {
  const auto it = files_.find(fileHandle);
  return it == files_.end() ? nullptr : it->second.get();
}

// Handles count up and are not reused soon, so a stale handle rarely names another file.
int32_t VoraLibrary::NextHandle() {
  while (files_.contains(nextHandle_))
    nextHandle_ = nextHandle_ == std::numeric_limits<int32_t>::max() ? 0 : nextHandle_ + 1;
  const int32_t handle = nextHandle_;
  nextHandle_ = handle == std::numeric_limits<int32_t>::max() ? 0 : handle + 1;
  return handle;
}

int32_t VoraLibrary::SetPlatform(int32_t platformCode) {
  if (platformCode != kVorPlatformDesktop && platformCode != kVorPlatformRealTime)
    return kVorErrArgument;
  std::lock_guard lock(mutex_);
  platformCode_ = platformCode;
  return kVorOk;
}

int32_t VoraLibrary::SetApiFlags(uint32_t flags) {
  std::lock_guard lock(mutex_);
  apiFlags_ = flags;
  return kVorOk;
}

int32_t VoraLibrary::OpenFile(const char* path, int32_t openMode, int32_t access, int32_t revision,
                              int32_t* fileHandle) {
  if (path == nullptr || fileHandle == nullptr) return kVorErrArgument;
  if (revision != kVorApiRevision) return kVorErrRevision;
  std::string native;
  if (!ToNativePath(path, native)) return kVorErrFile;
  std::lock_guard lock(mutex_);
  QuietHdf5();
  int32_t error = kVorOk;
  std::unique_ptr<VoraFile> file = VoraFile::Open(native, openMode, access, error);
  if (!file) return error;
  const int32_t handle = NextHandle();
  files_.emplace(handle, std::move(file));
  *fileHandle = handle;
  return kVorOk;
}

int32_t VoraLibrary::CreateObject(const char* objectPath, int32_t fileHandle,
                                  int32_t* objectHandle) {
  if (objectPath == nullptr || objectHandle == nullptr) return kVorErrArgument;
  ObjectPath path;
  if (!ParseObjectPath(objectPath, path)) return kVorErrPath;
  std::lock_guard lock(mutex_);
  VoraFile* file = Find(fileHandle);
  if (file == nullptr) return kVorErrHandle;
  int32_t handle = kVorNoHandle;
  const int32_t result = file->CreateObject(path, handle);
  if (result == kVorOk) *objectHandle = handle;
  return result;
}

int32_t VoraLibrary::SetProperty(const char* name, int32_t dataType, const void* value,
                                 int32_t fileHandle, int32_t objectHandle) {
  std::lock_guard lock(mutex_);
  VoraFile* file = Find(fileHandle);
  return file == nullptr ? kVorErrHandle : file->SetProperty(objectHandle, name, dataType, value);
}

int32_t VoraLibrary::AppendRaw(int32_t dataType, uint32_t byteCount, const void* bytes,
                               int32_t fileHandle, int32_t objectHandle) {
  std::lock_guard lock(mutex_);
  VoraFile* file = Find(fileHandle);
  return file == nullptr ? kVorErrHandle
                         : file->AppendRaw(objectHandle, dataType,
                                           static_cast<const uint8_t*>(bytes), byteCount);
}

int32_t VoraLibrary::Flush(int32_t scope, int32_t fileHandle) {
  std::lock_guard lock(mutex_);
  VoraFile* file = Find(fileHandle);
  return file == nullptr ? kVorErrHandle : file->Flush(scope);
}

int32_t VoraLibrary::CloseFile(int32_t fileHandle) {
  std::lock_guard lock(mutex_);
  const auto it = files_.find(fileHandle);
  if (it == files_.end()) return kVorErrHandle;
  const int32_t result = it->second->Close();
  files_.erase(it);
  return result;
}

}  // namespace vora
