// A driver session: receiving, start and stop, reads, writes and waits.
#include "tarvix/Session.h"

#include <algorithm>
#include <cstring>

#include "driver/FrameTypes.h"
#include "driver/Properties.h"
#include "driver/RawFrame.h"
#include "driver/Sessions.h"
#include "driver/States.h"
#include "driver/Status.h"
#include "tarvix/CanBus.h"
#include "tarvix/FlexRayBus.h"
#include "tarvix/FrameRecords.h"
#include "tarvix/FrameTiming.h"
#include "tarvix/SimClock.h"

namespace tarvix {
namespace {

constexpr uint32_t kErrorCounterMax = 255;
constexpr int64_t kMaxNapNs = 1'000'000;  // waiting writers look at the bus at least every 1 ms
constexpr int64_t kMinNapNs = 50'000;
constexpr int kFlexRayIntegrationCycles = 2;

void Nap(int64_t deadlineNs, int64_t nextEventNs) {
  const int64_t now = NowNs();
  const int64_t until = std::min(deadlineNs, nextEventNs);
  SleepNs(std::clamp<int64_t>(until - now, kMinNapNs, kMaxNapNs));
}

}  // namespace

Session::Session(SessionSetup setup, std::shared_ptr<Bus> bus)
    : DriverSession(std::move(setup)), bus_(std::move(bus)) {
  settings_.baudRate = setup_.cluster.baudRate;
  settings_.dataBaudRate = setup_.cluster.dataBaudRate;
  settings_.transceiver = setup_.transceiver;
  std::lock_guard lock(bus_->mutex());
  bus_->advance(NowNs());
  if (setup_.mode != driver::kModeReceiveStream) {
    output_ = std::make_unique<OutputQueue>(setup_.mode, setup_.transmitQueueFrames);
    static_cast<CanBus&>(*bus_).addSource(output_.get());
  }
  bus_->attach(this);
  bus_->changed();
  // A subordinate session watches an interface the controller's application runs: it receives
  // from the moment it exists. Other sessions start with kxStart or their first read or write.
  if (setup_.subordinate) startLocked(NowNs());
}

Session::~Session() { close(); }

void Session::close() {
  std::lock_guard lock(bus_->mutex());
  if (closed_) return;
  closed_ = true;
  bus_->detach(this);
  bus_->changed();  // a read waiting in this session ends
  if (output_) static_cast<CanBus&>(*bus_).removeSource(output_.get());
  if (setup_.cluster.protocol == driver::kProtocolCan) static_cast<CanBus&>(*bus_).release(this);
}

bool Session::rateMatches(const BusConfig& bus) const {
  return setup_.subordinate || settings_.baudRate == bus.bitRate;
}

bool Session::understands(const SimFrame& f, const BusConfig& bus) const {
  if (!rateMatches(bus)) return false;
  const bool fd = f.type == driver::kFrameCanFdData || f.type == driver::kFrameCanFdBrsData;
  if (!fd || setup_.subordinate) return true;
  if (setup_.cluster.canIoMode == driver::kCanIoModeClassic) return false;
  if (f.type != driver::kFrameCanFdBrsData) return true;
  const uint64_t dataRate = settings_.dataBaudRate ? settings_.dataBaudRate : settings_.baudRate;
  return dataRate == (bus.dataBitRate ? bus.dataBitRate : bus.bitRate);
}

void Session::offer(const SimFrame& frame, const BusConfig& bus) {
  if (!listening()) return;
  const bool own = frame.origin >= 0 && frame.origin == setup_.interfaceIndex;
  if (own && !settings_.echo) return;
  ++framesSeen_;
  lastFrameNs_ = frame.endNs;
  switch (setup_.cluster.protocol) {
    case driver::kProtocolCan:
      return offerCan(frame, own, bus);
    case driver::kProtocolLin:
      return offerLin(frame, own, bus);
    default:
      return offerFlexRay(frame, bus);
  }
}

void Session::offerCan(SimFrame f, bool own, const BusConfig& bus) {
  if (f.type == driver::kFrameCanBusError) {
    if (settings_.busErrorFrames) push(f);
    return;
  }
  if (!own && !understands(f, bus)) {
    receiveErrors_ = std::min(kErrorCounterMax, receiveErrors_ + 1);
    lastError_ = driver::kCanLastErrorForm;
    pushError(f, driver::kFrameCanBusError);
    return;
  }
  if (receiveErrors_ > 0) --receiveErrors_;
  if (own) f.flags |= driver::kFlagEcho;
  const bool data = f.type == driver::kFrameCanData || f.type == driver::kFrameCanFdData ||
                    f.type == driver::kFrameCanFdBrsData;
  if (setup_.cluster.j1939 && data && (f.identifier & driver::kExtendedIdFlag)) {
    f.type = driver::kFrameJ1939;
    f.info = static_cast<uint8_t>(f.length >> 8);  // bits 8-10 of the length (always 0 here)
  }
  push(f);
}

void Session::offerLin(SimFrame f, bool own, const BusConfig& bus) {
  if (!own && !rateMatches(bus)) {
    lastError_ = driver::kLinLastErrorBitRate;
    lastErrorId_ = f.identifier;
    pushError(f, driver::kFrameLinBusError);
    return;
  }
  if (f.type == driver::kFrameLinNoResponse) {
    lastError_ = driver::kLinLastErrorNoResponse;
    lastErrorId_ = f.identifier;
    if (!settings_.linNoResponse) return;
  }
  if (!settings_.linChecksum) f.info = 0;
  if (own) f.flags |= driver::kFlagEcho;
  push(f);
}

void Session::offerFlexRay(SimFrame f, const BusConfig& bus) {
  if (!rateMatches(bus)) return;  // a controller at the wrong rate never integrates
  if (f.type == driver::kFrameFlexRayNull) {
    ++nullFramesSeen_;
    if (!settings_.nullFrames) return;
  } else {
    ++dataFramesSeen_;
  }
  push(f);
}

void Session::pushError(const SimFrame& cause, uint8_t type) {
  if (!settings_.busErrorFrames) return;
  SimFrame e;
  e.endNs = cause.endNs;
  e.type = type;
  push(e);
}

void Session::push(const SimFrame& frame) {
  if (queue_.size() >= setup_.receiveQueueFrames) {
    queue_.pop_front();
    overflowed_ = true;
  }
  queue_.push_back(frame);
}

void Session::startLocked(int64_t nowNs) {
  if (started_) return;
  started_ = true;
  startedAtNs_ = nowNs;
  updateOutputBlock();
}

void Session::updateOutputBlock() {
  if (!output_) return;
  const bool blocked = !started_ || !rateMatches(bus_->config()) || settings_.listenOnly;
  output_->setBlocked(blocked);
  if (blocked && started_) transmitErrors_ = std::min(kErrorCounterMax, 128u);
}

int32_t Session::start(uint32_t scope) {
  if (scope > driver::kScopeInterfaceOnly) return driver::kInvalidScope;
  std::lock_guard lock(bus_->mutex());
  const int64_t now = NowNs();
  bus_->advance(now);
  startLocked(now);
  bus_->changed();
  return driver::kSuccess;
}

int32_t Session::stop(uint32_t scope) {
  if (scope > driver::kScopeInterfaceOnly) return driver::kInvalidScope;
  std::lock_guard lock(bus_->mutex());
  bus_->advance(NowNs());
  started_ = false;
  if (output_) {
    output_->halt();
    updateOutputBlock();
  }
  bus_->changed();
  return driver::kSuccess;
}

int32_t Session::readLocked(uint8_t* buffer, uint32_t size, uint32_t& bytes) {
  bytes = 0;
  if (queue_.empty()) return driver::kReadTimeout;
  if (RawSize(queue_.front()) > size) return driver::kBufferTooSmall;
  while (!queue_.empty() && RawSize(queue_.front()) <= size - bytes) {
    bytes += EncodeRaw(queue_.front(), buffer + bytes);
    queue_.pop_front();
  }
  if (!overflowed_) return driver::kSuccess;
  overflowed_ = false;
  return driver::kWarnReceiveQueueOverflow;
}

// A read that waits sleeps until the bus may carry its next frame, the time-out, or a change on
// the bus (another session's write, this session's close), without looking at the bus in between.
int32_t Session::read(void* buffer, uint32_t size, double timeoutS, uint32_t* bytesRead) {
  if (bytesRead == nullptr || (buffer == nullptr && size > 0)) return driver::kBufferMissing;
  *bytesRead = 0;
  if (isOutput()) return driver::kWrongSessionMode;
  const int64_t deadline = DeadlineOf(timeoutS, NowNs());
  std::unique_lock lock(bus_->mutex());
  for (;;) {
    if (closed_) return driver::kInvalidReference;
    const int64_t now = NowNs();
    bus_->advance(now);
    startLocked(now);
    const int32_t status = readLocked(static_cast<uint8_t*>(buffer), size, *bytesRead);
    if (status != driver::kReadTimeout || timeoutS == 0.0 || now >= deadline) return status;
    bus_->waitForChange(lock, std::min(deadline, std::max(bus_->nextEventNs(), now + kMinNapNs)));
  }
}

int32_t Session::write(const void* frames, uint32_t size, double timeoutS) {
  if (frames == nullptr) return driver::kBufferMissing;
  if (!isOutput()) return driver::kWrongSessionMode;
  std::vector<FrameRecord> records;
  const int32_t parsed =
      ParseFrameRecords(setup_, static_cast<const uint8_t*>(frames), size, records);
  if (parsed != driver::kSuccess) return parsed;
  const int64_t deadline = DeadlineOf(timeoutS, NowNs());
  size_t done = 0;
  for (;;) {
    int64_t next = 0;
    {
      std::lock_guard lock(bus_->mutex());
      if (settings_.listenOnly) return driver::kListenOnly;
      const int64_t now = NowNs();
      bus_->advance(now);
      startLocked(now);
      for (; done < records.size() && !output_->full(); ++done) {
        output_->write(records[done].first, *records[done].second, now);
      }
      bus_->changed();
      if (done == records.size()) return driver::kSuccess;
      if (now >= deadline) return driver::kWriteTimeout;
      next = bus_->nextEventNs();
    }
    Nap(deadline, next);
  }
}

bool Session::conditionMet(uint32_t condition, int64_t nowNs) const {
  if (condition == driver::kWaitTransmitComplete) return output_->complete();
  if (!started_ || !rateMatches(bus_->config())) return false;
  if (setup_.cluster.protocol != driver::kProtocolFlexRay) return true;
  // A FlexRay controller integrates into the cluster within two cycles after its start.
  const auto& fr = static_cast<const FlexRayBus&>(*bus_);
  return fr.syncSlots() > 0 && nowNs >= startedAtNs_ + kFlexRayIntegrationCycles * fr.cycleNs();
}

int32_t Session::wait(uint32_t condition, double timeoutS) {
  if (condition != driver::kWaitTransmitComplete &&
      condition != driver::kWaitInterfaceCommunicating) {
    return driver::kInvalidCondition;
  }
  if (condition == driver::kWaitTransmitComplete && !isOutput()) return driver::kWrongSessionMode;
  const int64_t deadline = DeadlineOf(timeoutS, NowNs());
  for (;;) {
    int64_t next = 0;
    {
      std::lock_guard lock(bus_->mutex());
      const int64_t now = NowNs();
      bus_->advance(now);
      if (conditionMet(condition, now)) return driver::kSuccess;
      if (now >= deadline) return driver::kWaitTimeout;
      next = bus_->nextEventNs();
    }
    Nap(deadline, next);
  }
}

}  // namespace tarvix
