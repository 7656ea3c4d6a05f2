// Test control of the simulated driver: call recording, fault injection, hardware reload.
// Not part of the driver interface; tests link libtarvix.so and call these in-process.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace tarvix {

// One driver call as the recorder saw it.
struct CallRecord {
  std::string operation;       // "kxSetProperty", "kxdbCreateObject", ...
  uint32_t reference = 0;      // the reference argument (parent for kxdbCreateObject), 0 if none
  uint32_t id = 0;             // property, state id, mode, scope, condition, class or close flag
  uint32_t size = 0;           // the size argument
  std::vector<uint8_t> value;  // bytes set or written; for reads, the bytes got (at most 256 kept)
  std::vector<std::string> texts;  // name arguments in call order
  double timeout = 0.0;            // time-out argument in seconds
  uint32_t result = 0;             // reference created, bytes read; 0 otherwise
  std::string interfaceName;       // interface the reference belongs to, "" if none
  int32_t status = 0;              // what the call returned
};

// Recording is off until started; starting it again empties the record.
void StartRecording();
void StopRecording();
std::vector<CallRecord> RecordedCalls();

// From now on `operation` ("kxStart", ...) on `interfaceName` ("" any reference) returns `status`
// without doing its work: once (the next matching call) or always, until cleared.
void InjectStatus(std::string_view operation, std::string_view interfaceName, int32_t status,
                  bool always);
void ClearInjections();

// Closes every session, database and system object, clears recording and injections, and installs
// the default hardware (TARVIX_SIM_CONFIG is not read again).
void ResetToDefaults();

// Installs the hardware that a JSON configuration text describes (relative paths are taken from
// `baseDirectory`); closes every open object first. On failure: false, `error` says why, and the
// driver offers no hardware until the next successful load or reset.
bool LoadConfiguration(std::string_view json, const std::string& baseDirectory, std::string* error);
bool LoadConfigurationFile(const std::string& path, std::string* error);

}  // namespace tarvix
