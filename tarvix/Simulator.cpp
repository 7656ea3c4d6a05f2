// The driver's object registry and the operations on system, device and interface objects.
#include "tarvix/Simulator.h"

#include <cstdio>
#include <cstdlib>
#include <cstring>

#include "driver/Properties.h"
#include "driver/Sessions.h"
#include "driver/Status.h"
#include "tarvix/CallLog.h"
#include "tarvix/ConfigLoader.h"
#include "tarvix/ObjectRef.h"
#include "tarvix/socketcan/DeviceBinding.h"

namespace tarvix {
namespace {

template <typename T>
void Store(void* p, T v) {
  std::memcpy(p, &v, sizeof v);
}

int32_t GetWord(uint32_t word, uint32_t size, void* value) {
  if (size != sizeof word) return driver::kWrongPropertySize;
  if (value == nullptr) return driver::kBufferMissing;
  Store(value, word);
  return driver::kSuccess;
}

// A reference list: the caller's room must hold every reference; the rest of it is zeroed.
int32_t GetRefList(const std::vector<uint32_t>& refs, uint32_t size, void* value) {
  if (size % 4 != 0 || size == 0) return driver::kWrongPropertySize;
  if (value == nullptr) return driver::kBufferMissing;
  if (refs.size() * 4 > size) return driver::kBufferTooSmall;
  std::memset(value, 0, size);
  if (!refs.empty()) std::memcpy(value, refs.data(), refs.size() * 4);
  return driver::kSuccess;
}

}  // namespace

Simulator& Simulator::Instance() {
  static Simulator* instance = new Simulator();  // never destroyed: callers may outlive statics
  return *instance;
}

Simulator::Simulator() {
  const char* path = std::getenv("TARVIX_SIM_CONFIG");
  HardwareConfig config = DefaultHardware();
  std::string error;
  if (path != nullptr && path[0] != '\0' && !LoadHardwareConfigFile(path, config, error)) {
    std::fprintf(stderr, "tarvix: %s: %s; the driver offers no hardware\n", path, error.c_str());
    hardware_ = Hardware::Empty(VersionValues{});
    return;
  }
  const char* devices = std::getenv(kSocketCanVariable);
  if (devices != nullptr && !AddShortFormDevices(devices, config, error)) {
    std::fprintf(stderr, "tarvix: %s: %s; the driver offers no hardware\n", kSocketCanVariable,
                 error.c_str());
    hardware_ = Hardware::Empty(config.versions);
    return;
  }
  if (!installConfig(config, error)) hardware_ = Hardware::Empty(config.versions);
}

bool Simulator::installConfig(const HardwareConfig& config, std::string& error) {
  std::shared_ptr<Hardware> hw;
  {
    std::lock_guard lock(mutex_);
    hw = Hardware::Build(config, ++generation_, error);
  }
  if (hw == nullptr) {
    std::fprintf(stderr, "tarvix: %s; the driver offers no hardware\n", error.c_str());
    install(Hardware::Empty(config.versions));
    return false;
  }
  install(hw);
  CallLog::Instance().setFaults(config.faults);
  return true;
}

void Simulator::install(std::shared_ptr<Hardware> hardware) {
  std::unordered_map<uint32_t, std::shared_ptr<DriverSession>> old;
  {
    std::lock_guard lock(mutex_);
    old.swap(sessions_);
    systems_.clear();
    databases_.clear();
    hardware_ = std::move(hardware);
  }
  for (auto& [ref, s] : old) s->close();
}

std::shared_ptr<Hardware> Simulator::hardware() {
  std::lock_guard lock(mutex_);
  return hardware_;
}

int32_t Simulator::systemOpen(uint32_t& ref) {
  std::lock_guard lock(mutex_);
  ref = MakeRef(kRefSystem, ++serial_);
  systems_.insert(ref);
  return driver::kSuccess;
}

int32_t Simulator::systemClose(uint32_t ref) {
  std::lock_guard lock(mutex_);
  if (RefKind(ref) != kRefSystem && ref != 0) return driver::kWrongObjectKind;
  return systems_.erase(ref) ? driver::kSuccess : driver::kInvalidReference;
}

int32_t Simulator::systemProperty(uint32_t id, uint32_t size, void* value) {
  const VersionValues& v = hardware_->config().versions;
  switch (id) {
    case driver::kPropSystemVersionPacked:
      return GetWord(v.packed, size, value);
    case driver::kPropSystemVersionMajor:
      return GetWord(v.major, size, value);
    case driver::kPropSystemVersionMinor:
      return GetWord(v.minor, size, value);
    case driver::kPropSystemVersionPhase:
      return GetWord(v.phase, size, value);
    case driver::kPropSystemVersionUpdate:
      return GetWord(v.update, size, value);
    case driver::kPropSystemDevices: {
      std::vector<uint32_t> refs;
      for (const SimDevice& d : hardware_->devices()) refs.push_back(d.ref);
      return GetRefList(refs, size, value);
    }
    default:
      return driver::kUnknownProperty;
  }
}

int32_t Simulator::deviceProperty(const SimDevice& device, uint32_t id, uint32_t size,
                                  void* value) {
  if (id != driver::kPropDeviceInterfaces) return driver::kUnknownProperty;
  std::vector<uint32_t> refs;
  for (int32_t i : device.interfaces) refs.push_back(hardware_->interfaces()[i].ref);
  return GetRefList(refs, size, value);
}

int32_t Simulator::interfaceProperty(const SimInterface& i, uint32_t id, uint32_t size,
                                     void* value) {
  switch (id) {
    case driver::kPropInterfaceName: {
      const std::string& name = i.config.name;
      if (value == nullptr) return driver::kBufferMissing;
      if (size < name.size() + 1) return driver::kBufferTooSmall;
      std::memset(value, 0, size);
      std::memcpy(value, name.data(), name.size());
      return driver::kSuccess;
    }
    case driver::kPropInterfacePort:
      // Read with up to 16 bytes of room: the port, then zeros.
      if (size < 4 || size > 16) return driver::kWrongPropertySize;
      if (value == nullptr) return driver::kBufferMissing;
      std::memset(value, 0, size);
      Store(value, i.config.port);
      return driver::kSuccess;
    case driver::kPropInterfaceProtocol:
      return GetWord(i.config.protocol, size, value);
    case driver::kPropInterfaceCanFd:
      return GetWord(CanFdOf(i), size, value);
    default:
      return driver::kUnknownProperty;
  }
}

int32_t Simulator::getProperty(uint32_t ref, uint32_t id, uint32_t size, void* value) {
  if (RefKind(ref) == kRefSession) {
    auto s = session(ref);
    return s ? s->getProperty(id, size, value) : driver::kInvalidReference;
  }
  std::lock_guard lock(mutex_);
  switch (RefKind(ref)) {
    case kRefSystem:
      return systems_.count(ref) ? systemProperty(id, size, value) : driver::kInvalidReference;
    case kRefDevice: {
      const SimDevice* d = hardware_->deviceByRef(ref);
      return d ? deviceProperty(*d, id, size, value) : driver::kInvalidReference;
    }
    case kRefInterface: {
      const SimInterface* i = hardware_->interfaceByRef(ref);
      return i ? interfaceProperty(*i, id, size, value) : driver::kInvalidReference;
    }
    default:
      return databases_.owns(ref) ? driver::kWrongObjectKind : driver::kInvalidReference;
  }
}

int32_t Simulator::setProperty(uint32_t ref, uint32_t id, uint32_t size, const void* value) {
  if (RefKind(ref) == kRefSession) {
    auto s = session(ref);
    return s ? s->setProperty(id, size, value) : driver::kInvalidReference;
  }
  // System, device and interface properties are read only.
  std::vector<uint8_t> scratch(size);
  const int32_t status = getProperty(ref, id, size, size ? scratch.data() : nullptr);
  if (status == driver::kSuccess || status == driver::kWrongPropertySize ||
      status == driver::kBufferTooSmall || status == driver::kBufferMissing) {
    return value == nullptr ? driver::kBufferMissing : driver::kPropertyReadOnly;
  }
  return status;
}

std::shared_ptr<DriverSession> Simulator::session(uint32_t ref) {
  std::lock_guard lock(mutex_);
  auto it = sessions_.find(ref);
  return it == sessions_.end() ? nullptr : it->second;
}

int32_t Simulator::notASession(uint32_t ref) {
  std::lock_guard lock(mutex_);
  const uint32_t kind = RefKind(ref);
  if ((kind == kRefSystem && systems_.count(ref)) || databases_.owns(ref) ||
      (kind == kRefDevice && hardware_->deviceByRef(ref)) ||
      (kind == kRefInterface && hardware_->interfaceByRef(ref))) {
    return driver::kWrongObjectKind;
  }
  return driver::kInvalidReference;
}

int32_t Simulator::clear(uint32_t ref) {
  if (RefKind(ref) == kRefSystem) return systemClose(ref);
  std::shared_ptr<DriverSession> s;
  {
    std::lock_guard lock(mutex_);
    auto it = sessions_.find(ref);
    if (it != sessions_.end()) {
      s = it->second;
      sessions_.erase(it);
    } else if (RefKind(ref) == kRefDatabase && databases_.owns(ref)) {
      return databases_.close(ref, driver::kCloseAll);
    }
  }
  if (s == nullptr) return notASession(ref);
  s->close();
  return driver::kSuccess;
}

std::string Simulator::interfaceOf(uint32_t ref) {
  if (RefKind(ref) == kRefSession) {
    auto s = session(ref);
    return s ? s->setup().interfaceName : std::string();
  }
  std::lock_guard lock(mutex_);
  if (RefKind(ref) == kRefInterface) {
    const SimInterface* i = hardware_->interfaceByRef(ref);
    return i ? i->config.name : std::string();
  }
  return {};
}

int32_t Simulator::dbOpen(const char* name, uint32_t& ref) {
  std::lock_guard lock(mutex_);
  return databases_.open(name, ref);
}

int32_t Simulator::dbCreateObject(uint32_t parent, uint32_t objectClass, const char* name,
                                  uint32_t& ref) {
  std::lock_guard lock(mutex_);
  return databases_.createObject(parent, objectClass, name, ref);
}

int32_t Simulator::dbSetProperty(uint32_t ref, uint32_t id, uint32_t size, const void* value) {
  std::lock_guard lock(mutex_);
  return databases_.setProperty(ref, id, size, value);
}

int32_t Simulator::dbClose(uint32_t ref, uint32_t closeAll) {
  std::lock_guard lock(mutex_);
  return databases_.close(ref, closeAll);
}

}  // namespace tarvix
