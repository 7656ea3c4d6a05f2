// Test helper: loads the built vora.dll as the runtime does and reads its files back with HDF5.
#pragma once

#include <dlfcn.h>
#include <hdf5.h>
#include <gtest/gtest.h>

#include <cstdint>
#include <cstdlib>
#include <filesystem>
#include <optional>
#include <string>
#include <vector>

#include "vora/VoraApi.h"

namespace voratest {

// The entry points resolved by name from a dlopen of vora.dll; unloads it when destroyed.
struct VoraDll {
  void* handle = nullptr;
  VorSetOSFn SetOS = nullptr;
  VorSetAPIFlagsFn SetAPIFlags = nullptr;
  VorFileOpenExAFn FileOpenExA = nullptr;
  VorObjCreateAFn ObjCreateA = nullptr;
  VorPropSetAFn PropSetA = nullptr;
  VorObjRawSetFn ObjRawSet = nullptr;
  VorFileBufFlushFn FileBufFlush = nullptr;
  VorFileCloseFn FileClose = nullptr;

  VoraDll() {
    handle = dlopen(VORA_DLL_PATH, RTLD_NOW | RTLD_LOCAL);
    if (handle == nullptr) return;
    Resolve(SetOS, "VorSetOS");
    Resolve(SetAPIFlags, "VorSetAPIFlags");
    Resolve(FileOpenExA, "VorFileOpenExA");
    Resolve(ObjCreateA, "VorObjCreateA");
    Resolve(PropSetA, "VorPropSetA");
    Resolve(ObjRawSet, "VorObjRawSet");
    Resolve(FileBufFlush, "VorFileBufFlush");
    Resolve(FileClose, "VorFileClose");
  }
  ~VoraDll() { Unload(); }
  void Unload() {
    if (handle != nullptr) dlclose(handle);
    handle = nullptr;
  }
  bool complete() const {
    return SetOS && SetAPIFlags && FileOpenExA && ObjCreateA && PropSetA && ObjRawSet && FileBufFlush && FileClose;
  }

 private:
  template <typename Fn>
  void Resolve(Fn& fn, const char* name) {
    fn = reinterpret_cast<Fn>(dlsym(handle, name));
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
inline std::optional<std::vector<uint8_t>> ReadBytes(const std::string& file, const std::string& dataset) {
  H5Eset_auto2(H5E_DEFAULT, nullptr, nullptr);
  const hid_t f = H5Fopen(file.c_str(), H5F_ACC_RDONLY, H5P_DEFAULT);
  if (f < 0) return std::nullopt;
  std::optional<std::vector<uint8_t>> bytes;
  const hid_t d = H5Lexists(f, dataset.c_str(), H5P_DEFAULT) > 0 ? H5Dopen2(f, dataset.c_str(), H5P_DEFAULT) : -1;
  if (d >= 0) {
    const hid_t space = H5Dget_space(d);
    hsize_t size = 0;
    if (H5Sget_simple_extent_ndims(space) == 1 && H5Sget_simple_extent_dims(space, &size, nullptr) == 1) {
      bytes.emplace(size);
      if (size > 0 && H5Dread(d, H5T_NATIVE_UINT8, H5S_ALL, H5S_ALL, H5P_DEFAULT, bytes->data()) < 0) bytes.reset();
    }
    H5Sclose(space);
    H5Dclose(d);
  }
  H5Fclose(f);
  return bytes;
}

// Reads an integer attribute of an object; nullopt when missing.
inline std::optional<int64_t> ReadIntAttribute(const std::string& file, const std::string& object,
                                               const std::string& name) {
  H5Eset_auto2(H5E_DEFAULT, nullptr, nullptr);
  const hid_t f = H5Fopen(file.c_str(), H5F_ACC_RDONLY, H5P_DEFAULT);
  if (f < 0) return std::nullopt;
  std::optional<int64_t> value;
  if (H5Aexists_by_name(f, object.c_str(), name.c_str(), H5P_DEFAULT) > 0) {
    const hid_t a = H5Aopen_by_name(f, object.c_str(), name.c_str(), H5P_DEFAULT, H5P_DEFAULT);
    int64_t v = 0;
    if (a >= 0 && H5Aread(a, H5T_NATIVE_INT64, &v) >= 0) value = v;
    if (a >= 0) H5Aclose(a);
  }
  H5Fclose(f);
  return value;
}

}  // namespace voratest
