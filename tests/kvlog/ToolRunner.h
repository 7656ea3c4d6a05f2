// Test helper: runs a command line, capturing its standard output, standard error and exit code.
#pragma once

#include <sys/wait.h>

#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <string>
#include <vector>

namespace kvtest {

struct ToolRun {
  int exitCode = -1;
  std::string out;
  std::string err;
};

inline std::string ReadText(const std::filesystem::path& path) {
  std::ifstream in(path, std::ios::binary);
  std::stringstream text;
  text << in.rdbuf();
  return text.str();
}

// `command` is run by the shell; arguments must be quoted by the caller.
inline ToolRun RunTool(const std::string& command, const std::filesystem::path& scratch) {
  const auto out = scratch / "tool.out";
  const auto err = scratch / "tool.err";
  const std::string line = command + " >'" + out.string() + "' 2>'" + err.string() + "'";
  const int status = std::system(line.c_str());
  ToolRun run;
  run.exitCode = WIFEXITED(status) ? WEXITSTATUS(status) : -1;
  run.out = ReadText(out);
  run.err = ReadText(err);
  return run;
}

inline void WriteBytes(const std::filesystem::path& path, const std::vector<uint8_t>& bytes) {
  std::ofstream(path, std::ios::binary)
      .write(reinterpret_cast<const char*>(bytes.data()),
             static_cast<std::streamsize>(bytes.size()));
}

}  // namespace kvtest
