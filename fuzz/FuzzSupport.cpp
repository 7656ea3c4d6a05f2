// Output sink and scratch directory of the fuzz targets.
#include "fuzz/FuzzSupport.h"

#include <cstdlib>
#include <filesystem>

namespace kvfuzz {
namespace {

// Removes the scratch directory when the process ends.
struct Scratch {
  std::string path;
  Scratch() {
    std::string pattern = (std::filesystem::temp_directory_path() / "kvfuzz-XXXXXX").string();
    if (mkdtemp(pattern.data()) != nullptr) path = pattern;
  }
  ~Scratch() {
    std::error_code ignored;
    if (!path.empty()) std::filesystem::remove_all(path, ignored);
  }
};

}  // namespace

std::FILE* Sink() {
  static std::FILE* const sink = std::fopen("/dev/null", "w");
  return sink;
}

const std::string& ScratchDirectory() {
  static const Scratch scratch;
  return scratch.path;
}

bool WriteFile(const std::string& path, const uint8_t* data, size_t size) {
  std::FILE* file = std::fopen(path.c_str(), "wb");
  if (file == nullptr) return false;
  const bool written = size == 0 || std::fwrite(data, 1, size, file) == size;
  return std::fclose(file) == 0 && written;
}

}  // namespace kvfuzz
