// The driver's object registry: the hardware, open system objects, sessions and databases.
#pragma once

#include <cstdint>
#include <memory>
#include <mutex>
#include <set>
#include <string>
#include <unordered_map>

#include "tarvix/DatabaseStore.h"
#include "tarvix/Hardware.h"
#include "tarvix/Session.h"

namespace tarvix {

// The CAN FD capability an interface reports (0x00130007): configured, or the bound device's.
uint32_t CanFdOf(const SimInterface& i);

// One per process. Thread-safe: mutex_ guards the registry; session operations run on the session
// (under its bus's lock) after the registry has handed out a shared reference to it.
class Simulator {
 public:
  static Simulator& Instance();

  int32_t systemOpen(uint32_t& ref);
  int32_t systemClose(uint32_t ref);
  int32_t getProperty(uint32_t ref, uint32_t id, uint32_t size, void* value);
  int32_t setProperty(uint32_t ref, uint32_t id, uint32_t size, const void* value);
  int32_t createSession(const char* database, const char* cluster, const char* frameList,
                        const char* interfaceName, uint32_t mode, uint32_t& ref);
  std::shared_ptr<DriverSession> session(uint32_t ref);
  int32_t clear(uint32_t ref);
  // kxStart and the like on a reference that is no session.
  int32_t notASession(uint32_t ref);

  int32_t dbOpen(const char* name, uint32_t& ref);
  int32_t dbCreateObject(uint32_t parent, uint32_t objectClass, const char* name, uint32_t& ref);
  int32_t dbSetProperty(uint32_t ref, uint32_t id, uint32_t size, const void* value);
  int32_t dbClose(uint32_t ref, uint32_t closeAll);

  // Name of the interface a reference belongs to ("" for none), for fault injection and records.
  std::string interfaceOf(uint32_t ref);

  // Test control: closes every session, database and system object and installs new hardware.
  void install(std::shared_ptr<Hardware> hardware);
  // Builds hardware for `config`; on failure prints the message and installs no hardware.
  bool installConfig(const HardwareConfig& config, std::string& error);

 private:
  Simulator();
  std::shared_ptr<Hardware> hardware();
  int32_t systemProperty(uint32_t id, uint32_t size, void* value);
  int32_t deviceProperty(const SimDevice& device, uint32_t id, uint32_t size, void* value);
  int32_t interfaceProperty(const SimInterface& i, uint32_t id, uint32_t size, void* value);
  int32_t buildSetup(const std::string& database, const std::string& cluster,
                     const std::string& frameList, const SimInterface& i, uint32_t mode,
                     SessionSetup& setup);

  std::mutex mutex_;
  std::shared_ptr<Hardware> hardware_;                                     // guarded by mutex_
  std::unordered_map<uint32_t, std::shared_ptr<DriverSession>> sessions_;  // guarded by mutex_
  std::set<uint32_t> systems_;                                             // guarded by mutex_
  DatabaseStore databases_;                                                // guarded by mutex_
  uint32_t serial_ = 0;                                                    // guarded by mutex_
  uint32_t generation_ = 0;                                                // guarded by mutex_
};

}  // namespace tarvix
