// One measurement-data file open in the library: an HDF5 file with its groups and channels.
//
// Layout of the file (readable with any HDF5 tool):
//   /<group>            one HDF5 group per measurement group
//   /<group>/<channel>  one dataset per channel: one-dimensional, unsigned 8-bit, extendable
//                       (chunked, unlimited), holding the channel's raw bytes in the order appended
//   attributes          the properties of a channel (or group, or the root) as scalar attributes:
//                       32-bit signed little-endian for data type 3, unsigned 8-bit for type 5
// Group and channel link names are encoded as VoraNames.h describes.
#pragma once

#include <hdf5.h>

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "vora/VoraNames.h"

namespace vora {

// Not thread-safe: the library calls every operation under its one global lock, since the HDF5
// build the library links is not thread-safe itself.
class VoraFile {
 public:
  // Opens or creates `nativePath` (open mode and access as in VoraApi.h). On failure returns null
  // and sets `error` to a kVorErr* code.
  static std::unique_ptr<VoraFile> Open(const std::string& nativePath, int32_t openMode,
                                        int32_t access, int32_t& error);
  ~VoraFile();  // writes buffered data and closes the file
  VoraFile(const VoraFile&) = delete;
  VoraFile& operator=(const VoraFile&) = delete;

  int32_t CreateObject(const ObjectPath& path, int32_t& handle);
  int32_t SetProperty(int32_t handle, const char* name, int32_t dataType, const void* value);
  int32_t AppendRaw(int32_t handle, int32_t dataType, const uint8_t* bytes, uint32_t count);
  int32_t Flush(int32_t scope);
  int32_t Close();  // flushes and closes; the object is unusable afterwards

  // Appended bytes are kept per channel and written once this many are pending.
  static constexpr size_t kPendingLimit = 64 * 1024;

 private:
  struct Object {
    hid_t id = H5I_INVALID_HID;
    bool isChannel = false;
    std::string key;          // the path as parsed, to hand out one handle per object
    hsize_t storedBytes = 0;  // bytes already in the dataset
    std::vector<uint8_t> pending;
  };

  VoraFile(hid_t file, bool writable) : file_(file), writable_(writable) {}
  hid_t OpenOrCreateGroup(hid_t parent, const std::string& storedName);
  hid_t OpenOrCreateChannel(hid_t group, const std::string& storedName, hsize_t& storedBytes);
  int32_t WritePending(Object& channel);
  Object* Find(int32_t handle);

  hid_t file_;
  bool writable_;
  std::vector<Object> objects_;  // the handle is the index
};

}  // namespace vora
