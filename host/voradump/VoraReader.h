// Reads measurement-data files (HDF5 as vora.dll writes them): groups, channels, properties, bytes.
#pragma once

#include <hdf5.h>

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace voradump {

struct Property {
  std::string name;
  std::optional<int64_t> integer;  // set for integer properties
  std::string text;                // the value as text, for display
};

struct Channel {
  std::string group;  // decoded names, as the writer gave them
  std::string name;
  std::string hdf5Path;  // the dataset's path in the file
  uint64_t bytes = 0;    // the size the file states; see `damage`
  std::vector<Property> properties;
  // Why the stated size cannot be true (more bytes than the file can hold); empty when it can.
  std::string damage;

  std::optional<int64_t> IntegerProperty(const std::string& propertyName) const;
};

struct Group {
  std::string name;  // decoded
  std::vector<Property> properties;
  std::vector<Channel> channels;
  bool readable = true;  // false: the group's own object cannot be read (a damaged file)
  std::vector<std::string> unreadable;  // decoded names of objects below it that cannot be read
};

// A measurement-data file opened for reading. Not thread-safe (HDF5 is not). Every HDF5 object it
// opens is closed again before the call that opened it returns, on every path; the file itself
// is closed by the destructor.
class VoraReader {
 public:
  // Null with `error` set when the file cannot be opened as HDF5.
  static std::unique_ptr<VoraReader> Open(const std::string& path, std::string& error);
  ~VoraReader();
  VoraReader(const VoraReader&) = delete;
  VoraReader& operator=(const VoraReader&) = delete;

  // Every group below the root with its channels (one-dimensional byte datasets), in name order.
  // Other objects (written by other tools) are skipped; objects that cannot be read at all are
  // listed as unreadable.
  std::vector<Group> Groups() const;
  // Reads the raw bytes of a channel. Returns why they cannot be read (a damaged size, too little
  // memory, a damaged file), or an empty text when `out` holds them. Nothing is allocated for a
  // size the file cannot hold.
  [[nodiscard]] std::string ReadBytes(const Channel& channel, std::vector<uint8_t>& out) const;

 private:
  VoraReader(hid_t file, uint64_t fileBytes) : file_(file), fileBytes_(fileBytes) {}
  Group ReadGroup(const std::string& stored) const;
  hid_t file_;
  uint64_t fileBytes_;  // the file's size on disk
};

}  // namespace voradump
