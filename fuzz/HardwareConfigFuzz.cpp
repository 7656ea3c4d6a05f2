// libFuzzer target: arbitrary bytes as the hardware description of the simulated driver
// (TARVIX_SIM_CONFIG), given whole to its loader. The loader opens no device and no file.
#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>

#include "tarvix/ConfigLoader.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  const std::string_view json(reinterpret_cast<const char*>(data), size);
  tarvix::HardwareConfig config;
  std::string error;
  (void)tarvix::ParseHardwareConfig(json, "/nonexistent", config, error);
  return 0;
}
