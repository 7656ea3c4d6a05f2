// libFuzzer target: arbitrary bytes as kelvanert.ini in the service directory of a scratch drive,
// read the way the service reads it at start-up, and the port taken from it.
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <filesystem>
#include <string>

#include "fuzz/FuzzSupport.h"
#include "service/Configuration.h"

namespace {

// The service directory's native path on the scratch drive, made once.
const std::string& ServiceDirectory() {
  static const std::string directory = [] {
    const std::string drive = kvfuzz::ScratchDirectory() + "/drive_c";
    setenv("KELVANERT_DRIVE_C", drive.c_str(), 1);
    const std::string service = drive + "/QV-RT/tarvix/kelvane";
    std::filesystem::create_directories(service);
    return service;
  }();
  return directory;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  if (!kvfuzz::WriteFile(ServiceDirectory() + "/kelvanert.ini", data, size)) return 0;
  const nKV_DLL300::PortChoice choice = nKV_DLL300::ReadConfiguration();
  (void)nKV_DLL300::PortFromText(choice.portText);
  return 0;
}
