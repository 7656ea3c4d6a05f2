// Walking an HDF5 measurement-data file with the HDF5 C API.
#include "host/voradump/VoraReader.h"

#include <filesystem>
#include <new>
#include <string>
#include <system_error>

#include "vora/VoraNames.h"

namespace voradump {
namespace {

// A compressed dataset may unpack to more bytes than the file holds, but not to more than this.
constexpr uint64_t kMaxUnpackedChannelBytes = uint64_t{4} << 30;

// Owns one HDF5 identifier of any kind (file, group, dataset, dataspace, attribute, type, property
// list) and closes it when it goes out of scope; an invalid identifier is left alone.
class Hid {
 public:
  explicit Hid(hid_t id) : id_(id) {}
  ~Hid() {
    if (id_ >= 0) H5Idec_ref(id_);
  }
  Hid(const Hid&) = delete;
  Hid& operator=(const Hid&) = delete;
  hid_t get() const { return id_; }
  bool valid() const { return id_ >= 0; }

 private:
  hid_t id_;
};

// Names of the links directly below `group`, in name order.
std::vector<std::string> LinkNames(hid_t group) {
  std::vector<std::string> names;
  H5Literate(
      group, H5_INDEX_NAME, H5_ITER_INC, nullptr,
      [](hid_t, const char* name, const H5L_info_t*, void* data) -> herr_t {
        static_cast<std::vector<std::string>*>(data)->emplace_back(name);
        return 0;
      },
      &names);
  return names;
}

Property ReadProperty(hid_t object, const std::string& name) {
  Property property{name, std::nullopt, "(not readable)"};
  const Hid attribute(H5Aopen(object, name.c_str(), H5P_DEFAULT));
  if (!attribute.valid()) return property;
  const Hid type(H5Aget_type(attribute.get()));
  const Hid space(H5Aget_space(attribute.get()));
  if (!type.valid() || !space.valid()) return property;
  if (H5Tget_class(type.get()) != H5T_INTEGER || H5Sget_simple_extent_npoints(space.get()) != 1) {
    property.text = "(not an integer)";
    return property;
  }
  int64_t value = 0;
  if (H5Aread(attribute.get(), H5T_NATIVE_INT64, &value) >= 0) {
    property.integer = value;
    property.text = std::to_string(value);
  }
  return property;
}

std::vector<Property> Properties(hid_t object) {
  std::vector<std::string> names;
  H5Aiterate2(
      object, H5_INDEX_NAME, H5_ITER_INC, nullptr,
      [](hid_t, const char* name, const H5A_info_t*, void* data) -> herr_t {
        static_cast<std::vector<std::string>*>(data)->emplace_back(name);
        return 0;
      },
      &names);
  std::vector<Property> properties;
  for (const std::string& name : names) properties.push_back(ReadProperty(object, name));
  return properties;
}

// A channel is a one-dimensional dataset of 8-bit integers; anything else is not ours.
std::optional<uint64_t> ChannelBytes(hid_t dataset) {
  const Hid type(H5Dget_type(dataset));
  const Hid space(H5Dget_space(dataset));
  hsize_t size = 0;
  if (type.valid() && space.valid() && H5Tget_class(type.get()) == H5T_INTEGER &&
      H5Tget_size(type.get()) == 1 && H5Sget_simple_extent_ndims(space.get()) == 1 &&
      H5Sget_simple_extent_dims(space.get(), &size, nullptr) == 1) {
    return size;
  }
  return std::nullopt;
}

// The most bytes a dataset can hold in a file of `fileBytes`: the file itself, unless compressed.
uint64_t MostBytesHeld(hid_t dataset, uint64_t fileBytes) {
  const Hid creation(H5Dget_create_plist(dataset));
  const bool packed = creation.valid() && H5Pget_nfilters(creation.get()) > 0;
  return packed ? kMaxUnpackedChannelBytes : fileBytes;
}

std::string SizeDamage(uint64_t bytes, uint64_t most, uint64_t fileBytes) {
  if (bytes <= most) return {};
  return "its size of " + std::to_string(bytes) + " bytes is more than the file of " +
         std::to_string(fileBytes) + " bytes can hold: the file is damaged";
}

// The type of the object a link names; nullopt when its header cannot be read.
std::optional<H5O_type_t> ObjectType(hid_t parent, const std::string& name) {
  H5O_info_t info{};
  if (H5Oget_info_by_name2(parent, name.c_str(), &info, H5O_INFO_BASIC, H5P_DEFAULT) < 0)
    return std::nullopt;
  return info.type;
}

void AddChannel(hid_t group, const std::string& groupStored, const std::string& stored,
                uint64_t fileBytes, Group& out) {
  const Hid dataset(H5Dopen2(group, stored.c_str(), H5P_DEFAULT));
  if (!dataset.valid()) return;
  const auto bytes = ChannelBytes(dataset.get());
  if (!bytes) return;
  out.channels.push_back(
      Channel{out.name, vora::DecodeStoredName(stored), "/" + groupStored + "/" + stored, *bytes,
              Properties(dataset.get()),
              SizeDamage(*bytes, MostBytesHeld(dataset.get(), fileBytes), fileBytes)});
}

}  // namespace

std::optional<int64_t> Channel::IntegerProperty(const std::string& propertyName) const {
  for (const Property& p : properties) {
    if (p.name == propertyName) return p.integer;
  }
  return std::nullopt;
}

std::unique_ptr<VoraReader> VoraReader::Open(const std::string& path, std::string& error) {
  H5Eset_auto2(H5E_DEFAULT, nullptr, nullptr);
  std::error_code failure;
  const uint64_t fileBytes = std::filesystem::file_size(path, failure);
  if (failure || H5Fis_hdf5(path.c_str()) <= 0) {
    error = "not a measurement-data (HDF5) file: " + path;
    return nullptr;
  }
  const hid_t file = H5Fopen(path.c_str(), H5F_ACC_RDONLY, H5P_DEFAULT);
  if (file < 0) {
    error = "cannot open " + path;
    return nullptr;
  }
  return std::unique_ptr<VoraReader>(new VoraReader(file, fileBytes));
}

VoraReader::~VoraReader() { H5Fclose(file_); }

Group VoraReader::ReadGroup(const std::string& stored) const {
  Group g{vora::DecodeStoredName(stored), {}, {}, true, {}};
  const Hid group(H5Gopen2(file_, stored.c_str(), H5P_DEFAULT));
  if (!group.valid()) {
    g.readable = false;
    return g;
  }
  g.properties = Properties(group.get());
  for (const std::string& channel : LinkNames(group.get())) {
    const auto type = ObjectType(group.get(), channel);
    if (!type)
      g.unreadable.push_back(vora::DecodeStoredName(channel));
    else if (*type == H5O_TYPE_DATASET)
      AddChannel(group.get(), stored, channel, fileBytes_, g);
  }
  return g;
}

std::vector<Group> VoraReader::Groups() const {
  std::vector<Group> groups;
  for (const std::string& stored : LinkNames(file_)) {
    const auto type = ObjectType(file_, stored);
    if (!type)
      groups.push_back(Group{vora::DecodeStoredName(stored), {}, {}, false, {}});
    else if (*type == H5O_TYPE_GROUP)
      groups.push_back(ReadGroup(stored));
  }
  return groups;
}

std::string VoraReader::ReadBytes(const Channel& channel, std::vector<uint8_t>& out) const {
  const Hid dataset(H5Dopen2(file_, channel.hdf5Path.c_str(), H5P_DEFAULT));
  const auto bytes = dataset.valid() ? ChannelBytes(dataset.get()) : std::nullopt;
  if (!bytes) return "its bytes cannot be read: the file is damaged";
  if (std::string damage = SizeDamage(*bytes, MostBytesHeld(dataset.get(), fileBytes_), fileBytes_);
      !damage.empty()) {
    return damage;
  }
  try {
    out.resize(*bytes);
  } catch (const std::bad_alloc&) {
    return "its " + std::to_string(*bytes) + " bytes do not fit in memory";
  }
  if (*bytes > 0 &&
      H5Dread(dataset.get(), H5T_NATIVE_UINT8, H5S_ALL, H5S_ALL, H5P_DEFAULT, out.data()) < 0) {
    return "its bytes cannot be read: the file is damaged";
  }
  return {};
}

}  // namespace voradump
