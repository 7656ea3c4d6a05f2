// Walking an HDF5 measurement-data file with the HDF5 C API.
#include "host/voradump/VoraReader.h"

#include <string>

#include "vora/VoraNames.h"

namespace voradump {
namespace {

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
  const hid_t attribute = H5Aopen(object, name.c_str(), H5P_DEFAULT);
  if (attribute < 0) return property;
  const hid_t type = H5Aget_type(attribute);
  const hid_t space = H5Aget_space(attribute);
  if (H5Tget_class(type) == H5T_INTEGER && H5Sget_simple_extent_npoints(space) == 1) {
    int64_t value = 0;
    if (H5Aread(attribute, H5T_NATIVE_INT64, &value) >= 0) {
      property.integer = value;
      property.text = std::to_string(value);
    }
  } else {
    property.text = "(not an integer)";
  }
  H5Sclose(space);
  H5Tclose(type);
  H5Aclose(attribute);
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
  const hid_t type = H5Dget_type(dataset);
  const hid_t space = H5Dget_space(dataset);
  std::optional<uint64_t> bytes;
  hsize_t size = 0;
  if (H5Tget_class(type) == H5T_INTEGER && H5Tget_size(type) == 1 &&
      H5Sget_simple_extent_ndims(space) == 1 &&
      H5Sget_simple_extent_dims(space, &size, nullptr) == 1) {
    bytes = size;
  }
  H5Sclose(space);
  H5Tclose(type);
  return bytes;
}

H5O_type_t ObjectType(hid_t parent, const std::string& name) {
  H5O_info_t info{};
  if (H5Oget_info_by_name2(parent, name.c_str(), &info, H5O_INFO_BASIC, H5P_DEFAULT) < 0)
    return H5O_TYPE_UNKNOWN;
  return info.type;
}

void AddChannel(hid_t group, const std::string& groupStored, const std::string& stored,
                Group& out) {
  const hid_t dataset = H5Dopen2(group, stored.c_str(), H5P_DEFAULT);
  if (dataset < 0) return;
  if (const auto bytes = ChannelBytes(dataset)) {
    out.channels.push_back(Channel{out.name, vora::DecodeStoredName(stored),
                                   "/" + groupStored + "/" + stored, *bytes, Properties(dataset)});
  }
  H5Dclose(dataset);
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
  if (H5Fis_hdf5(path.c_str()) <= 0) {
    error = "not a measurement-data (HDF5) file: " + path;
    return nullptr;
  }
  const hid_t file = H5Fopen(path.c_str(), H5F_ACC_RDONLY, H5P_DEFAULT);
  if (file < 0) {
    error = "cannot open " + path;
    return nullptr;
  }
  return std::unique_ptr<VoraReader>(new VoraReader(file));
}

VoraReader::~VoraReader() { H5Fclose(file_); }

std::vector<Group> VoraReader::Groups() const {
  std::vector<Group> groups;
  for (const std::string& stored : LinkNames(file_)) {
    if (ObjectType(file_, stored) != H5O_TYPE_GROUP) continue;
    const hid_t group = H5Gopen2(file_, stored.c_str(), H5P_DEFAULT);
    if (group < 0) continue;
    Group g{vora::DecodeStoredName(stored), Properties(group), {}};
    for (const std::string& channel : LinkNames(group)) {
      if (ObjectType(group, channel) == H5O_TYPE_DATASET) AddChannel(group, stored, channel, g);
    }
    H5Gclose(group);
    groups.push_back(std::move(g));
  }
  return groups;
}

bool VoraReader::ReadBytes(const Channel& channel, std::vector<uint8_t>& out) const {
  const hid_t dataset = H5Dopen2(file_, channel.hdf5Path.c_str(), H5P_DEFAULT);
  if (dataset < 0) return false;
  const auto bytes = ChannelBytes(dataset);
  bool ok = bytes.has_value();
  if (ok) {
    out.resize(*bytes);
    ok = *bytes == 0 ||
         H5Dread(dataset, H5T_NATIVE_UINT8, H5S_ALL, H5S_ALL, H5P_DEFAULT, out.data()) >= 0;
  }
  H5Dclose(dataset);
  return ok;
}

}  // namespace voradump
