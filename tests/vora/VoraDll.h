// Test helper: loads the built vora.dll as the runtime does and reads its files back with HDF5.
#pragma once

#include <dlfcn.h>
#include <gtest/gtest.h>
#include <hdf5.h>

#include <cstdint>
#include <cstdlib>
#include <filesystem>
#include <optional>
#include <string>
#include <vector>

#include "vora/VoraApi.h"

namespace voratest {

#define VORA_ENTRY_POINTS(X) \
  X(SetOS)                   \
  X(SetAPIFlags) X(FileOpenExA) X(ObjCreateA) X(PropSetA) X(ObjRawSet) X(FileBufFlush) X(FileClose)

// The entry points resolved by name from a dlopen of vora.dll; unloads it when destroyed.
struct VoraDll {
  void* handle = dlopen(VORA_DLL_PATH, RTLD_NOW | RTLD_LOCAL);
#define VORA_MEMBER(name) \
  Vor##name##Fn name =    \
      handle ? reinterpret_cast<Vor##name##Fn>(dlsym(handle, "Vor" #name)) : nullptr;
  VORA_ENTRY_POINTS(VORA_MEMBER)
#undef VORA_MEMBER

  ~VoraDll() { Unload(); }
  void Unload() {
    if (handle != nullptr) dlclose(handle);
    handle = nullptr;
  }
  bool complete() const {
#define VORA_PRESENT(name) &&name != nullptr
    return handle != nullptr VORA_ENTRY_POINTS(VORA_PRESENT);
#undef VORA_PRESENT
  }

  // The controller's channel: the object and its three properties; the channel's handle.
  int32_t OpenChannel(int32_t file, const std::string& objectPath, int32_t protocol,
                      bool withProtocol = true) {
    int32_t channel = -1;
    EXPECT_EQ(ObjCreateA(objectPath.c_str(), file, &channel), 0) << objectPath;
    const int32_t byteOrder = 0, version = 512;
    EXPECT_EQ(PropSetA("QV_network_frame_byte_order", 3, &byteOrder, file, channel), 0);
    EXPECT_EQ(PropSetA("QV_network_frame_version", 3, &version, file, channel), 0);
    if (withProtocol) {
      EXPECT_EQ(PropSetA("QV_network_protocol", 3, &protocol, file, channel), 0);
    }
    return channel;
  }
};

// A fresh directory for one test, removed with everything in it at the end.
struct TempDir {
  std::filesystem::path path;
  TempDir() {
    std::string pattern = (std::filesystem::temp_directory_path() / "vora-test-XXXXXX").string();
    path = mkdtemp(pattern.data());
  }
  ~TempDir() { std::filesystem::remove_all(path); }
  std::string operator/(const std::string& name) const { return (path / name).string(); }
};

// Reads a dataset of bytes; nullopt when it is missing or not one-dimensional.
inline std::optional<std::vector<uint8_t>> ReadBytes(const std::string& file,
                                                     const std::string& dataset) {
  H5Eset_auto2(H5E_DEFAULT, nullptr, nullptr);
  const hid_t f = H5Fopen(file.c_str(), H5F_ACC_RDONLY, H5P_DEFAULT);
  if (f < 0) return std::nullopt;
  std::optional<std::vector<uint8_t>> bytes;
  const hid_t d = H5Lexists(f, dataset.c_str(), H5P_DEFAULT) > 0
                      ? H5Dopen2(f, dataset.c_str(), H5P_DEFAULT)
                      : -1;
  if (d >= 0) {
    const hid_t space = H5Dget_space(d);
    hsize_t size = 0;
    if (H5Sget_simple_extent_ndims(space) == 1 &&
        H5Sget_simple_extent_dims(space, &size, nullptr) == 1) {
      bytes.emplace(size);
      if (size > 0 &&
          H5Dread(d, H5T_NATIVE_UINT8, H5S_ALL, H5S_ALL, H5P_DEFAULT, bytes->data()) < 0)
        bytes.reset();
    }
    H5Sclose(space);
    H5Dclose(d);
  }
  H5Fclose(f);
  return bytes;
}

// Makes a channel claim `size` bytes (without writing them); false when that fails.
inline bool SetExtent(const std::string& file, const std::string& dataset, hsize_t size) {
  H5Eset_auto2(H5E_DEFAULT, nullptr, nullptr);
  const hid_t f = H5Fopen(file.c_str(), H5F_ACC_RDWR, H5P_DEFAULT);
  if (f < 0) return false;
  const hid_t d = H5Dopen2(f, dataset.c_str(), H5P_DEFAULT);
  const bool done = d >= 0 && H5Dset_extent(d, &size) >= 0;
  if (d >= 0) H5Dclose(d);
  return H5Fclose(f) >= 0 && done;
}

// Adds a soft link to nothing at `name`; false when that fails.
inline bool AddDanglingLink(const std::string& file, const std::string& name) {
  H5Eset_auto2(H5E_DEFAULT, nullptr, nullptr);
  const hid_t f = H5Fopen(file.c_str(), H5F_ACC_RDWR, H5P_DEFAULT);
  if (f < 0) return false;
  const bool done = H5Lcreate_soft("/nowhere", f, name.c_str(), H5P_DEFAULT, H5P_DEFAULT) >= 0;
  return H5Fclose(f) >= 0 && done;
}

}  // namespace voratest
