// A receive session on a bound interface: set-up, properties, start and stop, state, waits.
#include "tarvix/socketcan/SocketCanReceiver.h"

#include <linux/can.h>
#include <linux/can/error.h>

#include <algorithm>
#include <chrono>
#include <cstring>

#include "driver/Properties.h"
#include "driver/Sessions.h"
#include "driver/States.h"
#include "driver/Status.h"
#include "tarvix/SessionProperties.h"
#include "tarvix/SimClock.h"
#include "tarvix/socketcan/FrameConversion.h"
#include "tarvix/socketcan/LinkQuery.h"

namespace tarvix {
namespace {

constexpr int64_t kWaitSliceNs = 20'000'000;
constexpr uint32_t kCanControlFd = 0x20;          // CAN_CTRLMODE_FD
constexpr uint32_t kCanControlListenOnly = 0x02;  // CAN_CTRLMODE_LISTENONLY

// The bit timing a session asks of its device, and whether the device already runs it.
CanTiming TimingOf(const SessionSetup& setup, const SessionSettings& s) {
  CanTiming t;
  t.bitRate = static_cast<uint32_t>(s.baudRate);
  t.fd = setup.cluster.canIoMode != driver::kCanIoModeClassic;
  const bool switching = setup.cluster.canIoMode == driver::kCanIoModeFdBrs;
  t.dataBitRate = static_cast<uint32_t>(switching && s.dataBaudRate ? s.dataBaudRate : s.baudRate);
  t.listenOnly = s.listenOnly;
  return t;
}

bool Runs(const LinkReport& link, const CanTiming& t) {
  return link.bitRate == t.bitRate && (!t.fd || link.dataBitRate == t.dataBitRate) &&
         ((link.controlModes & kCanControlFd) != 0) == t.fd &&
         ((link.controlModes & kCanControlListenOnly) != 0) == t.listenOnly;
}

DeviceReport ReportOf(const std::string& device) {
  LinkReport link;
  DeviceReport r;
  if (QueryLink(device, link) != 0) return r;
  r.present = true;
  r.up = link.up && link.running;
  r.hasState = link.hasState;
  r.canState = link.canState;
  r.hasCounters = link.hasCounters;
  r.txErrors = link.txErrors;
  r.rxErrors = link.rxErrors;
  return r;
}

}  // namespace

SocketCanReceiver::SocketCanReceiver(SessionSetup setup, std::shared_ptr<DevicePort> port)
    : DriverSession(std::move(setup)),
      port_(std::move(port)),
      fdFrames_(setup_.cluster.canIoMode != driver::kCanIoModeClassic) {
  settings_.baudRate = setup_.cluster.baudRate;
  settings_.dataBaudRate = setup_.cluster.dataBaudRate;
  settings_.transceiver = setup_.transceiver;
  std::lock_guard lock(mutex_);
  // A subordinate session watches the device as it runs: it receives from the moment it exists.
  if (setup_.subordinate) (void)startLocked();
}

SocketCanReceiver::~SocketCanReceiver() { close(); }

int32_t SocketCanReceiver::setProperty(uint32_t id, uint32_t size, const void* value) {
  std::lock_guard lock(mutex_);
  const int32_t status =
      SessionProperties::Store({setup_, false, started_, settings_}, id, size, value);
  if (status != driver::kSuccess || id != driver::kPropJ1939NodeAddress) return status;
  if (settings_.nodeAddress >= driver::kJ1939NullAddress) {
    claim_.end(*port_, this);
    return status;
  }
  DeviceLookup device;
  const int index = LookUpDevice(port_->device(), device) && device.up ? device.index : 0;
  claim_.begin(*port_, this, index, settings_.nodeName, static_cast<uint8_t>(settings_.nodeAddress),
               settings_.listenOnly, NowNs());
  return status;
}

int32_t SocketCanReceiver::getProperty(uint32_t id, uint32_t size, void* value) {
  std::lock_guard lock(mutex_);
  const int32_t status =
      SessionProperties::Load({setup_, false, started_, settings_}, id, size, value);
  if (status == driver::kSuccess && id == driver::kPropJ1939NodeAddress) {
    const uint32_t address = claim_.address(NowNs());
    std::memcpy(value, &address, sizeof address);
  }
  return status;
}

// Starts receiving. Where the session sets the interface up (not subordinate) and the device is
// a CAN controller, its bit timing, CAN FD and listen-only modes are set first; a virtual device
// has none, which is no error. A device that is missing or down is a lost bus, not a failure.
int32_t SocketCanReceiver::startLocked() {
  if (started_) return driver::kSuccess;
  configurePending_ = !setup_.subordinate;
  DeviceLookup device;
  const bool present = LookUpDevice(port_->device(), device);
  if (present && configurePending_) {
    LinkReport link;
    const CanTiming timing = TimingOf(setup_, settings_);
    if (QueryLink(port_->device(), link) == 0 && link.canController && !Runs(link, timing) &&
        ConfigureCanLink(device.index, timing) != 0) {
      return driver::kInvalidPropertyValue;
    }
    configurePending_ = false;
    (void)LookUpDevice(port_->device(), device);
  }
  started_ = true;
  port_->setListenOnly(this, settings_.listenOnly);
  lost_ = false;
  if (!present || !device.up || openSockets(device.index) != 0) noteLost();
  return driver::kSuccess;
}

int32_t SocketCanReceiver::start(uint32_t scope) {
  if (scope > driver::kScopeInterfaceOnly) return driver::kInvalidScope;
  std::lock_guard lock(mutex_);
  if (closed_) return driver::kInvalidReference;
  return startLocked();
}

void SocketCanReceiver::stopLocked() {
  started_ = false;
  sockets_.reset();
  port_->setListenOnly(this, false);
  lost_ = false;
}

int32_t SocketCanReceiver::stop(uint32_t scope) {
  if (scope > driver::kScopeInterfaceOnly) return driver::kInvalidScope;
  std::lock_guard lock(mutex_);
  stopLocked();
  return driver::kSuccess;
}

int32_t SocketCanReceiver::write(const void*, uint32_t, double) {
  return driver::kWrongSessionMode;
}

int32_t SocketCanReceiver::wait(uint32_t condition, double timeoutS) {
  if (condition != driver::kWaitTransmitComplete &&
      condition != driver::kWaitInterfaceCommunicating) {
    return driver::kInvalidCondition;
  }
  if (condition == driver::kWaitTransmitComplete) return driver::kWrongSessionMode;
  const int64_t deadline = DeadlineOf(timeoutS, NowNs());
  for (;;) {
    {
      std::lock_guard lock(mutex_);
      if (closed_) return driver::kInvalidReference;
      DeviceLookup device;
      if (started_ && LookUpDevice(port_->device(), device) && device.running)
        return driver::kSuccess;
    }
    const int64_t now = NowNs();
    if (now >= deadline) return driver::kWaitTimeout;
    WaitReadable({wake_.fd()}, std::min(deadline - now, kWaitSliceNs));
  }
}

int32_t SocketCanReceiver::readState(uint32_t stateId, uint32_t size, void* state,
                                     uint32_t* faultCode) {
  if (stateId != driver::kStateCan) return driver::kUnknownState;
  if (size != driver::kStateCanSize) return driver::kWrongStateSize;
  if (state == nullptr) return driver::kBufferMissing;
  const DeviceReport device = ReportOf(port_->device());
  std::lock_guard lock(mutex_);
  const uint32_t word = state_.word(started_, device);
  std::memcpy(state, &word, sizeof word);
  if (faultCode != nullptr) *faultCode = 0;
  return driver::kSuccess;
}

void SocketCanReceiver::close() {
  {
    std::lock_guard lock(mutex_);
    if (closed_) return;
    closed_ = true;
    stopLocked();
    claim_.end(*port_, this);
  }
  wake_.signal();
}

}  // namespace tarvix
