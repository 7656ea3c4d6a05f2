// An output session on a bound interface.
#include "tarvix/socketcan/SocketCanSender.h"

#include <linux/can.h>

#include <algorithm>
#include <cerrno>
#include <cmath>
#include <cstring>

#include "driver/Properties.h"
#include "driver/Sessions.h"
#include "driver/States.h"
#include "driver/Status.h"
#include "tarvix/SessionProperties.h"
#include "tarvix/SimClock.h"
#include "tarvix/socketcan/BusState.h"
#include "tarvix/socketcan/FrameConversion.h"
#include "tarvix/socketcan/LinkQuery.h"
#include "tarvix/socketcan/SocketCanReceiver.h"

namespace tarvix {
namespace {

constexpr int64_t kRetryNs = 1'000'000;  // a full device queue is tried again this often
constexpr int64_t kWaitSliceNs = 5'000'000;

bool IsCyclic(const FrameDefinition& d) {
  const bool cyclicType = d.timingType == driver::kTimingCyclicData ||
                          d.timingType == driver::kTimingCyclicRemote ||
                          d.timingType == driver::kTimingCyclicAndEvent;
  return cyclicType && d.cyclicRateS > 0.0;
}

bool DeviceGone(int error) { return error == ENETDOWN || error == ENODEV || error == ENXIO; }

}  // namespace

SocketCanSender::SocketCanSender(SessionSetup setup, std::shared_ptr<DevicePort> port)
    : DriverSession(std::move(setup)), port_(std::move(port)) {
  settings_.baudRate = setup_.cluster.baudRate;
  settings_.dataBaudRate = setup_.cluster.dataBaudRate;
  settings_.transceiver = setup_.transceiver;
}

SocketCanSender::~SocketCanSender() { close(); }

int32_t SocketCanSender::setProperty(uint32_t id, uint32_t size, const void* value) {
  std::lock_guard lock(mutex_);
  return SessionProperties::Store({setup_, true, started_, settings_}, id, size, value);
}

int32_t SocketCanSender::getProperty(uint32_t id, uint32_t size, void* value) {
  std::lock_guard lock(mutex_);
  return SessionProperties::Load({setup_, true, started_, settings_}, id, size, value);
}

int32_t SocketCanSender::start(uint32_t scope) {
  if (scope > driver::kScopeInterfaceOnly) return driver::kInvalidScope;
  std::lock_guard lock(mutex_);
  started_ = true;
  return driver::kSuccess;
}

int32_t SocketCanSender::stop(uint32_t scope) {
  if (scope > driver::kScopeInterfaceOnly) return driver::kInvalidScope;
  std::lock_guard lock(mutex_);
  started_ = false;
  endRepetition();
  return driver::kSuccess;
}

int32_t SocketCanSender::read(void*, uint32_t, double, uint32_t* bytesRead) {
  if (bytesRead != nullptr) *bytesRead = 0;
  return driver::kWrongSessionMode;
}

// The raw socket on the device as it is now, reading back its own frames (registered with the
// port, which counts them as sent). False while the device is missing or down.
bool SocketCanSender::ensureSocket() {
  if (socket_ != nullptr && socket_->isOpen()) return true;
  DeviceLookup device;
  if (!LookUpDevice(port_->device(), device) || !device.up) return false;
  RawSocketOptions options;
  options.receiveOwn = true;
  for (const FrameDefinition& d : setup_.frames) {
    options.fdFrames |= d.canIoMode != driver::kFrameCanIoModeClassic;
    const uint32_t id = d.extended ? (d.identifier & CAN_EFF_MASK) | CAN_EFF_FLAG : d.identifier;
    options.filters.emplace_back(id, CAN_EFF_FLAG | CAN_EFF_MASK);
  }
  auto socket = std::make_shared<RawCanSocket>();
  if (socket->open(device.index, options) != 0) return false;
  socket_ = std::move(socket);
  index_ = device.index;
  std::weak_ptr<SocketCanSender> self = weak_from_this();
  port_->addOutput(this, socket_, [self] {
    if (auto s = self.lock()) s->restart();
  });
  return true;
}

// Hands one frame to the device. A full device queue is waited out up to the deadline; a frame
// for a device that is gone is lost (the transmit-complete wait then times out).
int32_t SocketCanSender::sendOnce(Lock& lock, const WireFrame& frame, int64_t deadlineNs) {
  for (;;) {
    if (!ensureSocket()) {
      lostSinceWrite_ = true;
      return driver::kSuccess;
    }
    const int error = socket_->send(frame);
    if (error == 0) {
      ++written_;
      return driver::kSuccess;
    }
    if (DeviceGone(error)) {
      if (error != ENETDOWN) socket_.reset();
      lostSinceWrite_ = true;
      return driver::kSuccess;
    }
    if (error != ENOBUFS && error != EAGAIN) return driver::kInvalidFrame;
    if (NowNs() >= deadlineNs) return driver::kWriteTimeout;
    lock.unlock();
    PauseNs(kRetryNs);
    lock.lock();
    if (closed_) return driver::kInvalidReference;
  }
}

int32_t SocketCanSender::sendLatest(Lock& lock, const FrameRecord& record, int64_t deadlineNs) {
  const FrameDefinition& def = *record.second;
  const WireFrame frame = ToWireFrame(record.first);
  if (!IsCyclic(def)) {
    endRepetition();
    return sendOnce(lock, frame, deadlineNs);
  }
  const int64_t period = std::max<int64_t>(1000, std::llround(def.cyclicRateS * 1e9));
  if (repeated_ && repeated_->canId != frame.canId) endRepetition();
  if (!bcm_.isOpen() && (!ensureSocket() || bcm_.open(index_) != 0)) {
    lostSinceWrite_ = true;
    return driver::kSuccess;
  }
  // A cyclic frame keeps its rhythm when its value changes; "cyclic and event" frames also go
  // out at once on every write.
  const bool restart = !repeated_ || period != periodNs_;
  const bool now = restart || def.timingType == driver::kTimingCyclicAndEvent;
  if (bcm_.repeat(frame, period, restart, now) != 0) return driver::kInvalidFrame;
  repeated_ = frame;
  periodNs_ = period;
  port_->setRepeated(this, frame);
  return driver::kSuccess;
}

void SocketCanSender::endRepetition() {
  bcm_.close();  // the kernel drops the repetition with its socket
  repeated_.reset();
  port_->setRepeated(this, std::nullopt);
}

int32_t SocketCanSender::write(const void* frames, uint32_t size, double timeoutS) {
  if (frames == nullptr) return driver::kBufferMissing;
  std::vector<FrameRecord> records;
  const int32_t parsed =
      ParseFrameRecords(setup_, static_cast<const uint8_t*>(frames), size, records);
  if (parsed != driver::kSuccess) return parsed;
  const int64_t deadline = DeadlineOf(timeoutS, NowNs());
  Lock lock(mutex_);
  if (closed_) return driver::kInvalidReference;
  if (settings_.listenOnly || port_->listenOnly()) return driver::kListenOnly;
  started_ = true;
  lostSinceWrite_ = false;
  for (const FrameRecord& r : records) {
    const int32_t status = setup_.mode == driver::kModeOutputQueued
                               ? sendOnce(lock, ToWireFrame(r.first), deadline)
                               : sendLatest(lock, r, deadline);
    if (status != driver::kSuccess) return status;
  }
  return driver::kSuccess;
}

int32_t SocketCanSender::wait(uint32_t condition, double timeoutS) {
  if (condition != driver::kWaitTransmitComplete &&
      condition != driver::kWaitInterfaceCommunicating) {
    return driver::kInvalidCondition;
  }
  const int64_t deadline = DeadlineOf(timeoutS, NowNs());
  for (;;) {
    int fd = -1;
    {
      std::lock_guard lock(mutex_);
      if (closed_) return driver::kInvalidReference;
      DeviceLookup device;
      const bool done = condition == driver::kWaitTransmitComplete
                            ? !lostSinceWrite_ && port_->confirmed(this) >= written_
                            : started_ && LookUpDevice(port_->device(), device) && device.running;
      if (done) return driver::kSuccess;
      if (socket_ != nullptr) fd = socket_->fd();
    }
    const int64_t now = NowNs();
    if (now >= deadline) return driver::kWaitTimeout;
    WaitReadable({fd}, std::min(deadline - now, kWaitSliceNs));
  }
}

int32_t SocketCanSender::readState(uint32_t stateId, uint32_t size, void* state,
                                   uint32_t* faultCode) {
  if (stateId != driver::kStateCan) return driver::kUnknownState;
  if (size != driver::kStateCanSize) return driver::kWrongStateSize;
  if (state == nullptr) return driver::kBufferMissing;
  LinkReport link;
  DeviceReport device;
  if (QueryLink(port_->device(), link) == 0) {
    device = DeviceReport{true,          link.up && link.running, link.hasState,
                          link.canState, link.hasCounters,        link.txErrors,
                          link.rxErrors};
  }
  std::lock_guard lock(mutex_);
  const uint32_t word = BusState{}.word(started_, device);
  std::memcpy(state, &word, sizeof word);
  if (faultCode != nullptr) *faultCode = 0;
  return driver::kSuccess;
}

void SocketCanSender::close() {
  std::lock_guard lock(mutex_);
  if (closed_) return;
  closed_ = true;
  endRepetition();
  port_->removeOutput(this);
  socket_.reset();
}

void SocketCanSender::restart() {
  std::lock_guard lock(mutex_);
  if (closed_ || !repeated_) return;
  const WireFrame frame = *repeated_;
  bcm_.close();
  socket_.reset();
  if (ensureSocket() && bcm_.open(index_) == 0) (void)bcm_.repeat(frame, periodNs_, true, true);
}

std::shared_ptr<DriverSession> MakeSocketCanSession(SessionSetup setup,
                                                    std::shared_ptr<DevicePort> port) {
  if (setup.mode == driver::kModeReceiveStream)
    return std::make_shared<SocketCanReceiver>(std::move(setup), std::move(port));
  return std::make_shared<SocketCanSender>(std::move(setup), std::move(port));
}

}  // namespace tarvix
