// Session creation: interface, database and mode checks, and the setup a new session starts from.
#include <algorithm>
#include <cstring>

#include "driver/Properties.h"
#include "driver/Sessions.h"
#include "driver/Status.h"
#include "tarvix/ObjectRef.h"
#include "tarvix/Simulator.h"
#include "tarvix/socketcan/SocketCanSender.h"

namespace tarvix {
namespace {

constexpr size_t kMaxTextLength = 1024;

bool ValidText(const char* text) { return text != nullptr && std::strlen(text) <= kMaxTextLength; }

bool IsOutputMode(uint32_t mode) {
  return mode == driver::kModeOutputQueued || mode == driver::kModeOutputSinglePoint;
}

// What a session that takes its bus's settings gets: the simulated bus's, or the bound device's
// as it runs.
ClusterSettings RunningSettings(const SimInterface& i, bool j1939) {
  if (i.port) return i.port->runningSettings(j1939);
  const BusConfig& bus = i.bus->config();
  return ClusterSettings{i.config.protocol, bus.bitRate, bus.dataBitRate, bus.canIoMode, j1939};
}

}  // namespace

uint32_t CanFdOf(const SimInterface& i) { return i.port ? i.port->canFd() : i.config.canFd; }

int32_t Simulator::buildSetup(const std::string& database, const std::string& cluster,
                              const std::string& frameList, const SimInterface& i, uint32_t mode,
                              SessionSetup& setup) {
  ResolvedDatabase db;
  if (const int32_t st = databases_.resolve(database, cluster, frameList, db);
      st != driver::kSuccess)
    return st;
  if (db.fromBus) {
    const bool j1939 = db.cluster.j1939;
    if (j1939 && i.config.protocol != driver::kProtocolCan) return driver::kProtocolMismatch;
    db.cluster = RunningSettings(i, j1939);
  }
  if (db.cluster.protocol != i.config.protocol) return driver::kProtocolMismatch;
  if (db.cluster.protocol == driver::kProtocolCan &&
      db.cluster.canIoMode != driver::kCanIoModeClassic && CanFdOf(i) == 0 && !db.subordinate) {
    return driver::kInterfaceNotCapable;
  }
  if (IsOutputMode(mode)) {
    if (db.subordinate || db.cluster.protocol != driver::kProtocolCan) return driver::kInvalidMode;
    if (db.frames.empty()) return driver::kFrameNotFound;
  }
  setup.mode = mode;
  setup.interfaceIndex = i.index;
  setup.interfaceName = i.config.name;
  setup.subordinate = db.subordinate;
  setup.transceiver = i.config.transceiver;
  setup.cluster = db.cluster;
  setup.frames = std::move(db.frames);
  setup.receiveQueueFrames = std::max<uint32_t>(1, hardware_->config().receiveQueueFrames);
  setup.transmitQueueFrames = std::max<uint32_t>(1, hardware_->config().transmitQueueFrames);
  return driver::kSuccess;
}

int32_t Simulator::createSession(const char* database, const char* cluster, const char* frameList,
                                 const char* interfaceName, uint32_t mode, uint32_t& ref) {
  if (!ValidText(database) || !ValidText(cluster) || !ValidText(frameList) ||
      !ValidText(interfaceName)) {
    return driver::kInvalidName;
  }
  if (mode != driver::kModeReceiveStream && !IsOutputMode(mode)) return driver::kInvalidMode;
  SessionSetup setup;
  std::shared_ptr<Bus> bus;
  std::shared_ptr<DevicePort> port;
  {
    std::lock_guard lock(mutex_);
    const SimInterface* i = hardware_->findInterface(interfaceName);
    if (i == nullptr) return driver::kInterfaceNotFound;
    if (const int32_t st = buildSetup(database, cluster, frameList, *i, mode, setup);
        st != driver::kSuccess) {
      return st;
    }
    bus = i->bus;
    port = i->port;
  }
  std::shared_ptr<DriverSession> session =
      port ? MakeSocketCanSession(std::move(setup), std::move(port))
           : std::make_shared<Session>(std::move(setup), std::move(bus));
  std::lock_guard lock(mutex_);
  ref = MakeRef(kRefSession, ++serial_);
  sessions_[ref] = std::move(session);
  return driver::kSuccess;
}

}  // namespace tarvix
