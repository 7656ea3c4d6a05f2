// HDF5 storage of one measurement-data file: groups, extendable byte datasets, attributes.
#include "vora/VoraFile.h"

#include "vora/VoraApi.h"

namespace vora {
namespace {

constexpr hsize_t kChunkBytes = 16 * 1024;

// Closes an HDF5 identifier of any kind when it goes out of scope.
class HidGuard {
 public:
  explicit HidGuard(hid_t id) : id_(id) {}
  ~HidGuard() {
    if (id_ >= 0) H5Idec_ref(id_);
  }
  HidGuard(const HidGuard&) = delete;
  HidGuard& operator=(const HidGuard&) = delete;
  hid_t get() const { return id_; }

 private:
  hid_t id_;
};

bool LinkExists(hid_t parent, const std::string& name) {
  return H5Lexists(parent, name.c_str(), H5P_DEFAULT) > 0;
}

std::string ObjectKey(const ObjectPath& path) {
  switch (path.kind) {
    case ObjectPath::Kind::kRoot:
      return "/";
    case ObjectPath::Kind::kGroup:
      return "g:" + path.group;
    case ObjectPath::Kind::kChannel:
      return "c:" + std::to_string(path.group.size()) + ":" + path.group + path.channel;
  }
  return {};
}

}  // namespace

std::unique_ptr<VoraFile> VoraFile::Open(const std::string& nativePath, int32_t openMode,
                                         int32_t access, int32_t& error) {
  const bool writable = access == kVorAccessReadWrite;
  if (access != kVorAccessRead && access != kVorAccessReadWrite) {
    error = kVorErrArgument;
    return nullptr;
  }
  hid_t file = H5I_INVALID_HID;
  switch (openMode) {
    case kVorOpenExisting:
      file = H5Fopen(nativePath.c_str(), writable ? H5F_ACC_RDWR : H5F_ACC_RDONLY, H5P_DEFAULT);
      break;
    case kVorCreateNew:
    case kVorCreateOrReplace:
      if (!writable) {
        error = kVorErrArgument;
        return nullptr;
      }
      file = H5Fcreate(nativePath.c_str(), openMode == kVorCreateNew ? H5F_ACC_EXCL : H5F_ACC_TRUNC,
                       H5P_DEFAULT, H5P_DEFAULT);
      break;
    default:
      error = kVorErrArgument;
      return nullptr;
  }
  if (file < 0) {
    error = kVorErrFile;
    return nullptr;
  }
  return std::unique_ptr<VoraFile>(new VoraFile(file, writable));
}

VoraFile::~VoraFile() { Close(); }

hid_t VoraFile::OpenOrCreateGroup(hid_t parent, const std::string& storedName) {
  if (LinkExists(parent, storedName)) return H5Gopen2(parent, storedName.c_str(), H5P_DEFAULT);
  if (!writable_) return H5I_INVALID_HID;
  return H5Gcreate2(parent, storedName.c_str(), H5P_DEFAULT, H5P_DEFAULT, H5P_DEFAULT);
}

hid_t VoraFile::OpenOrCreateChannel(hid_t group, const std::string& storedName,
                                    hsize_t& storedBytes) {
  if (LinkExists(group, storedName)) {
    const hid_t dataset = H5Dopen2(group, storedName.c_str(), H5P_DEFAULT);
    if (dataset < 0) return dataset;
    HidGuard space(H5Dget_space(dataset));
    hsize_t size = 0;
    if (space.get() < 0 || H5Sget_simple_extent_ndims(space.get()) != 1 ||
        H5Sget_simple_extent_dims(space.get(), &size, nullptr) != 1) {
      H5Dclose(dataset);
      return H5I_INVALID_HID;
    }
    storedBytes = size;
    return dataset;
  }
  if (!writable_) return H5I_INVALID_HID;
  const hsize_t initial = 0;
  const hsize_t unlimited = H5S_UNLIMITED;
  HidGuard space(H5Screate_simple(1, &initial, &unlimited));
  HidGuard properties(H5Pcreate(H5P_DATASET_CREATE));
  H5Pset_chunk(properties.get(), 1, &kChunkBytes);
  storedBytes = 0;
  return H5Dcreate2(group, storedName.c_str(), H5T_STD_U8LE, space.get(), H5P_DEFAULT,
                    properties.get(), H5P_DEFAULT);
}

int32_t VoraFile::CreateObject(const ObjectPath& path, int32_t& handle) {
  const std::string key = ObjectKey(path);
  for (size_t i = 0; i < objects_.size(); ++i) {
    if (objects_[i].key == key) {
      handle = static_cast<int32_t>(i);
      return kVorOk;
    }
  }
  Object object;
  object.key = key;
  if (path.kind == ObjectPath::Kind::kRoot) {
    object.id = H5Gopen2(file_, "/", H5P_DEFAULT);
  } else {
    const hid_t group = OpenOrCreateGroup(file_, EncodeStoredName(path.group));
    if (path.kind == ObjectPath::Kind::kGroup || group < 0) {
      object.id = group;
    } else {
      object.isChannel = true;
      object.id = OpenOrCreateChannel(group, EncodeStoredName(path.channel), object.storedBytes);
      H5Gclose(group);
    }
  }
  if (object.id < 0) return writable_ ? kVorErrObject : kVorErrReadOnly;
  objects_.push_back(std::move(object));
  handle = static_cast<int32_t>(objects_.size() - 1);
  return kVorOk;
}

VoraFile::Object* VoraFile::Find(int32_t handle) {
  if (handle < 0 || static_cast<size_t>(handle) >= objects_.size()) return nullptr;
  return &objects_[static_cast<size_t>(handle)];
}

int32_t VoraFile::SetProperty(int32_t handle, const char* name, int32_t dataType,
                              const void* value) {
  Object* object = Find(handle);
  if (object == nullptr) return kVorErrHandle;
  if (name == nullptr || *name == '\0' || value == nullptr) return kVorErrArgument;
  if (dataType != kVorTypeInt32 && dataType != kVorTypeUInt8) return kVorErrDataType;
  if (!writable_) return kVorErrReadOnly;
  const hid_t fileType = dataType == kVorTypeInt32 ? H5T_STD_I32LE : H5T_STD_U8LE;
  const hid_t memoryType = dataType == kVorTypeInt32 ? H5T_NATIVE_INT32 : H5T_NATIVE_UINT8;
  if (H5Aexists(object->id, name) > 0 && H5Adelete(object->id, name) < 0) return kVorErrObject;
  HidGuard space(H5Screate(H5S_SCALAR));
  HidGuard attribute(H5Acreate2(object->id, name, fileType, space.get(), H5P_DEFAULT, H5P_DEFAULT));
  if (attribute.get() < 0 || H5Awrite(attribute.get(), memoryType, value) < 0) return kVorErrObject;
  return kVorOk;
}

int32_t VoraFile::AppendRaw(int32_t handle, int32_t dataType, const uint8_t* bytes,
                            uint32_t count) {
  Object* object = Find(handle);
  if (object == nullptr || !object->isChannel) return kVorErrHandle;
  if (dataType != kVorTypeUInt8) return kVorErrDataType;
  if (bytes == nullptr && count > 0) return kVorErrArgument;
  if (!writable_) return kVorErrReadOnly;
  object->pending.insert(object->pending.end(), bytes, bytes + count);
  return object->pending.size() >= kPendingLimit ? WritePending(*object) : kVorOk;
}

// Extends the dataset and writes the pending bytes behind what it holds. Pending bytes that cannot
// be written are dropped with the error, so a full disk cannot make the buffer grow without end.
int32_t VoraFile::WritePending(Object& channel) {
  if (channel.pending.empty()) return kVorOk;
  const hsize_t count = channel.pending.size();
  const hsize_t newSize = channel.storedBytes + count;
  int32_t result = kVorErrFile;
  if (H5Dset_extent(channel.id, &newSize) >= 0) {
    HidGuard fileSpace(H5Dget_space(channel.id));
    HidGuard memorySpace(H5Screate_simple(1, &count, nullptr));
    if (H5Sselect_hyperslab(fileSpace.get(), H5S_SELECT_SET, &channel.storedBytes, nullptr, &count,
                            nullptr) >= 0 &&
        H5Dwrite(channel.id, H5T_NATIVE_UINT8, memorySpace.get(), fileSpace.get(), H5P_DEFAULT,
                 channel.pending.data()) >= 0) {
      channel.storedBytes = newSize;
      result = kVorOk;
    }
  }
  channel.pending.clear();
  return result;
}

int32_t VoraFile::Flush(int32_t scope) {
  if (scope <= 0 || (scope & ~kVorFlushAll) != 0) return kVorErrArgument;
  if (!writable_) return kVorOk;
  int32_t result = kVorOk;
  if (scope & kVorFlushData) {
    for (Object& object : objects_) {
      if (const int32_t written = WritePending(object); written != kVorOk) result = written;
    }
  }
  if (H5Fflush(file_, H5F_SCOPE_LOCAL) < 0) result = kVorErrFile;
  return result;
}

int32_t VoraFile::Close() {
  if (file_ < 0) return kVorOk;
  int32_t result = writable_ ? Flush(kVorFlushAll) : kVorOk;
  for (Object& object : objects_) {
    if (object.id >= 0) H5Idec_ref(object.id);
  }
  objects_.clear();
  if (H5Fclose(file_) < 0) result = kVorErrFile;
  file_ = H5I_INVALID_HID;
  return result;
}

}  // namespace vora
