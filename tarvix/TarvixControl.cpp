// The test-control interface of the simulated driver.
#include "tarvix/TarvixControl.h"

#include <cstdio>

#include "tarvix/CallLog.h"
#include "tarvix/ConfigLoader.h"
#include "tarvix/Simulator.h"

namespace tarvix {

void StartRecording() { CallLog::Instance().startRecording(); }
void StopRecording() { CallLog::Instance().stopRecording(); }
std::vector<CallRecord> RecordedCalls() { return CallLog::Instance().calls(); }

void InjectStatus(std::string_view operation, std::string_view interfaceName, int32_t status,
                  bool always) {
  CallLog::Instance().inject(
      FaultConfig{std::string(operation), std::string(interfaceName), status, always});
}

void ClearInjections() { CallLog::Instance().clearFaults(); }

void ResetToDefaults() {
  CallLog::Instance().reset();
  std::string error;
  Simulator::Instance().installConfig(DefaultHardware(), error);
}

bool LoadConfiguration(std::string_view json, const std::string& baseDirectory,
                       std::string* error) {
  HardwareConfig config;
  std::string message;
  Simulator& sim = Simulator::Instance();
  if (!ParseHardwareConfig(json, baseDirectory, config, message)) {
    std::fprintf(stderr, "tarvix: configuration: %s; the driver offers no hardware\n",
                 message.c_str());
    sim.install(Hardware::Empty(VersionValues{}));
    if (error) *error = message;
    return false;
  }
  const bool ok = sim.installConfig(config, message);
  if (!ok && error) *error = message;
  return ok;
}

bool LoadConfigurationFile(const std::string& path, std::string* error) {
  HardwareConfig config;
  std::string message;
  Simulator& sim = Simulator::Instance();
  if (!LoadHardwareConfigFile(path, config, message)) {
    std::fprintf(stderr, "tarvix: %s: %s; the driver offers no hardware\n", path.c_str(),
                 message.c_str());
    sim.install(Hardware::Empty(VersionValues{}));
    if (error) *error = message;
    return false;
  }
  const bool ok = sim.installConfig(config, message);
  if (!ok && error) *error = message;
  return ok;
}

}  // namespace tarvix
