// A fresh temporary directory standing for drive C: for the length of one test.
#pragma once

#include <chrono>
#include <cstdlib>
#include <filesystem>
#include <random>
#include <string>

class TempDrive {
 public:
  TempDrive() {
    std::random_device seed;
    const auto stamp = std::chrono::steady_clock::now().time_since_epoch().count();
    root = std::filesystem::temp_directory_path() /
           ("kv-drive-" + std::to_string(stamp) + "-" + std::to_string(seed()));
    std::filesystem::create_directories(root);
    setenv("KELVANERT_DRIVE_C", root.c_str(), 1);
  }
  ~TempDrive() {
    unsetenv("KELVANERT_DRIVE_C");
    std::error_code ignored;
    std::filesystem::remove_all(root, ignored);
  }
  TempDrive(const TempDrive&) = delete;
  TempDrive& operator=(const TempDrive&) = delete;

  std::filesystem::path native(const std::string& relative) const { return root / relative; }
  bool isDirectory(const std::string& relative) const {
    return std::filesystem::is_directory(native(relative));
  }
  void writeFile(const std::string& relative, const std::string& content = "x") const;

  std::filesystem::path root;
};

#include <fstream>

inline void TempDrive::writeFile(const std::string& relative, const std::string& content) const {
  std::filesystem::create_directories(native(relative).parent_path());
  std::ofstream(native(relative)) << content;
}
