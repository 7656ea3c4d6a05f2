// A receive session on a bound interface: reading frames, and a device that goes and comes back.
#include <linux/can.h>
#include <linux/can/error.h>

#include <algorithm>
#include <cerrno>
#include <chrono>

#include "driver/FrameTypes.h"
#include "driver/Status.h"
#include "tarvix/SimClock.h"
#include "tarvix/socketcan/FrameConversion.h"
#include "tarvix/socketcan/LinkQuery.h"
#include "tarvix/socketcan/SocketCanReceiver.h"

namespace tarvix {
namespace {

constexpr int kBatch = 64;
constexpr int kJ1939Batch = 64;
constexpr int64_t kProbeNs = 100'000'000;       // a lost device is looked for this often
constexpr int64_t kBytesPerQueuedFrame = 1024;  // kernel memory a queued frame takes, about
constexpr int64_t kMinReceiveBuffer = 1 << 18;
constexpr int64_t kMaxReceiveBuffer = 1 << 26;

int64_t WallNowNs() {
  return std::chrono::duration_cast<std::chrono::nanoseconds>(
             std::chrono::system_clock::now().time_since_epoch())
      .count();
}

// The socket's receive queue holds about as many frames as the session's queue.
int ReceiveBufferBytes(uint32_t frames) {
  return static_cast<int>(std::clamp(static_cast<int64_t>(frames) * kBytesPerQueuedFrame,
                                     kMinReceiveBuffer, kMaxReceiveBuffer));
}

bool DeviceGone(int error) { return error == ENETDOWN || error == ENODEV || error == ENXIO; }

}  // namespace

int SocketCanReceiver::openSockets(int index) {
  auto s = std::make_shared<Sockets>();
  s->index = index;
  RawSocketOptions options;
  options.fdFrames = fdFrames_;
  options.errorFrames = true;
  options.receiveBufferBytes = ReceiveBufferBytes(setup_.receiveQueueFrames);
  // J1939 traffic comes reassembled from the J1939 socket; the raw socket keeps the rest.
  if (setup_.cluster.j1939 && s->j1939.openMonitor(index, options.receiveBufferBytes) == 0)
    options.standardOnly = true;
  if (const int status = s->raw.open(index, options); status != 0) return status;
  sockets_ = std::move(s);
  drops_ = 0;
  return 0;
}

void SocketCanReceiver::pushDeviceEvent(uint32_t errorClass) {
  WireFrame f;
  f.canId = CAN_ERR_FLAG | errorClass;
  f.length = CAN_ERR_DLC;
  state_.observe(f);
  if (settings_.busErrorFrames) keepDriverFrame(ToDriverFrame(f, DriverTimestamp(WallNowNs())));
}

// The device went down or away: the bus is lost (a bus-off error frame) until it is back.
void SocketCanReceiver::noteLost() {
  if (lost_) return;
  lost_ = true;
  nextProbeNs_ = NowNs() + kProbeNs;
  pushDeviceEvent(CAN_ERR_BUSOFF);
}

void SocketCanReceiver::noteFound(int index) {
  if (configurePending_) {
    LinkReport link;
    const CanTiming timing{
        static_cast<uint32_t>(settings_.baudRate),
        static_cast<uint32_t>(settings_.dataBaudRate ? settings_.dataBaudRate : settings_.baudRate),
        fdFrames_, settings_.listenOnly};
    if (QueryLink(port_->device(), link) == 0 && link.canController)
      (void)ConfigureCanLink(index, timing);
    configurePending_ = false;
  }
  const bool newDevice = sockets_ != nullptr && sockets_->index != index;
  if (sockets_ == nullptr || newDevice) {
    if (openSockets(index) != 0) return;
    if (newDevice) port_->deviceReturned();
  }
  lost_ = false;
  pushDeviceEvent(CAN_ERR_RESTARTED);
}

// True when the sockets are open on a present device; a lost device is looked for again every
// kProbeNs (a device that came back under a new index gets new sockets).
bool SocketCanReceiver::ensureOpen(int64_t nowNs) {
  if (sockets_ != nullptr && !lost_) return true;
  if (nowNs < nextProbeNs_) return false;
  nextProbeNs_ = nowNs + kProbeNs;
  DeviceLookup device;
  if (!LookUpDevice(port_->device(), device) || !device.up) return false;
  noteFound(device.index);
  return !lost_;
}

void SocketCanReceiver::keepDriverFrame(DriverFrame frame) {
  if (pending_.size() >= setup_.receiveQueueFrames) {
    pendingBytes_ -= pending_.front().rawSize();
    pending_.pop_front();
    overflowed_ = true;
  }
  pendingBytes_ += frame.rawSize();
  pending_.push_back(std::move(frame));
}

void SocketCanReceiver::keep(const Reception& r, bool own) {
  if (r.hasDrops && r.drops != drops_) {
    overflowed_ = true;  // the kernel dropped frames: the socket's queue was full
    drops_ = r.drops;
  }
  const WireFrame& f = r.frame;
  if (f.canId & CAN_ERR_FLAG) {
    state_.observe(f);
    if (!settings_.busErrorFrames) return;
  } else if ((own && !settings_.echo) || (f.fd && !fdFrames_)) {
    return;
  }
  DriverFrame d = ToDriverFrame(f, DriverTimestamp(ReceptionTimeNs(r)));
  if (own) d.flags |= driver::kFlagEcho;
  const bool data = d.type == driver::kFrameCanData || d.type == driver::kFrameCanFdData ||
                    d.type == driver::kFrameCanFdBrsData;
  if (setup_.cluster.j1939 && data && (d.identifier & driver::kExtendedIdFlag))
    d.type = driver::kFrameJ1939;
  keepDriverFrame(std::move(d));
}

// One batch from the raw socket: the number of frames taken, or -errno.
int SocketCanReceiver::takeRaw() {
  Reception batch[kBatch];
  const int n = sockets_->raw.receive(batch, kBatch);
  if (n < 0) {
    if (!DeviceGone(-n)) return n;
    if (-n != ENETDOWN) sockets_.reset();  // unbound by the kernel: a new socket is due
    noteLost();
    return n;
  }
  const uint64_t own = port_->ownFrames(batch, n);
  for (int i = 0; i < n; ++i) keep(batch[i], (own >> i) & 1);
  return n;
}

int SocketCanReceiver::takeJ1939() {
  J1939Message m;
  int taken = 0;
  while (taken < kJ1939Batch && sockets_->j1939.receive(m, driver::kMaxJ1939Payload) > 0) {
    ++taken;
    const bool own = port_->isOwnClaim(m.pgn, m.source, m.data.data(), m.data.size());
    if (own && !settings_.echo) continue;
    DriverFrame d;
    d.timestamp = DriverTimestamp(m.softwareNs);
    d.identifier = J1939Identifier(m) | driver::kExtendedIdFlag;
    d.type = driver::kFrameJ1939;
    d.flags = own ? driver::kFlagEcho : 0;
    d.length = static_cast<uint16_t>(m.data.size());
    if (m.data.size() <= d.data.size()) {
      std::copy(m.data.begin(), m.data.end(), d.data.begin());
    } else {
      d.longData = std::move(m.data);
    }
    keepDriverFrame(std::move(d));
  }
  return taken;
}

// Takes what the sockets hold until `room` bytes of frames (or a full session queue) wait, or the
// sockets are empty. Frames of the raw and the J1939 socket are merged in time order.
void SocketCanReceiver::takeAvailable(uint32_t room) {
  if (!ensureOpen(NowNs())) return;
  for (;;) {
    const size_t before = pending_.size();
    const int raw = takeRaw();
    const int j1939 = sockets_ && sockets_->j1939.isOpen() ? takeJ1939() : 0;
    if (j1939 > 0) {
      std::stable_sort(
          pending_.begin() + static_cast<std::ptrdiff_t>(std::min(before, pending_.size())),
          pending_.end(),
          [](const DriverFrame& a, const DriverFrame& b) { return a.timestamp < b.timestamp; });
    }
    const bool full = pendingBytes_ >= room || pending_.size() >= setup_.receiveQueueFrames;
    if (sockets_ == nullptr || (raw < kBatch && j1939 < kJ1939Batch) || full) return;
  }
}

int32_t SocketCanReceiver::deliver(uint8_t* buffer, uint32_t size, uint32_t& bytes) {
  bytes = 0;
  if (pending_.empty()) return driver::kReadTimeout;
  if (pending_.front().rawSize() > size) return driver::kBufferTooSmall;
  while (!pending_.empty() && pending_.front().rawSize() <= size - bytes) {
    bytes += pending_.front().encode(buffer + bytes);
    pendingBytes_ -= pending_.front().rawSize();
    pending_.pop_front();
  }
  if (!overflowed_) return driver::kSuccess;
  overflowed_ = false;
  return driver::kWarnReceiveQueueOverflow;
}

std::vector<int> SocketCanReceiver::waitFds() const {
  std::vector<int> fds{wake_.fd()};
  if (sockets_ != nullptr) {
    fds.push_back(sockets_->raw.fd());
    fds.push_back(sockets_->j1939.fd());
  }
  return fds;
}

int32_t SocketCanReceiver::read(void* buffer, uint32_t size, double timeoutS, uint32_t* bytesRead) {
  if (bytesRead == nullptr || (buffer == nullptr && size > 0)) return driver::kBufferMissing;
  *bytesRead = 0;
  const int64_t deadline = DeadlineOf(timeoutS, NowNs());
  for (;;) {
    std::shared_ptr<Sockets> held;  // kept open while this read waits on them
    std::vector<int> fds;
    int64_t slice = 0;
    {
      std::lock_guard lock(mutex_);
      if (closed_) return driver::kInvalidReference;
      if (!started_) (void)startLocked();
      takeAvailable(size);
      const int32_t status = deliver(static_cast<uint8_t*>(buffer), size, *bytesRead);
      const int64_t now = NowNs();
      if (status != driver::kReadTimeout || timeoutS == 0.0 || now >= deadline) return status;
      held = sockets_;
      fds = waitFds();
      slice = lost_ || sockets_ == nullptr ? std::min(deadline - now, kProbeNs) : deadline - now;
    }
    WaitReadable(fds, slice);
  }
}

}  // namespace tarvix
