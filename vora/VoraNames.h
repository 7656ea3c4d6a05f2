// Object paths of the measurement-data library and how group and channel names are stored in HDF5.
//
// An object path names the file root "/", a group "/'group'" or a channel "/'group'/'channel'".
// Names are written between single quotes without escapes, so the group name ends at the first
// "'/'" after the opening "/'": a group name that itself holds "'/'" is split there (the rest goes
// to the channel name). Any other quote, and every other byte, belongs to the name.
//
// In the HDF5 file each name is one link name, encoded so that every name can be stored and read
// back unchanged: "/" is written "%2F", "%" is written "%25", a leading "." is written "%2E"
// (HDF5 gives "/" and "." meanings of their own), and the empty name is written "%". Quotes are
// stored as they are. DecodeStoredName reverses the encoding.
#pragma once

#include <string>
#include <string_view>

namespace vora {

struct ObjectPath {
  enum class Kind { kRoot, kGroup, kChannel };
  Kind kind = Kind::kRoot;
  std::string group;  // names as the caller wrote them
  std::string channel;
};

// Parses an object path; false when it is not of one of the three forms.
bool ParseObjectPath(std::string_view text, ObjectPath& out);

std::string EncodeStoredName(std::string_view name);
std::string DecodeStoredName(std::string_view stored);

}  // namespace vora
