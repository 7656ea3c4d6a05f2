// What the sessions of one bound interface share.
#include "tarvix/socketcan/DevicePort.h"

#include <linux/can.h>

#include <algorithm>
#include <vector>

#include "driver/Properties.h"
#include "tarvix/socketcan/FrameConversion.h"
#include "tarvix/socketcan/LinkQuery.h"

namespace tarvix {
namespace {

constexpr size_t kMaxSentFrames = 4096;
constexpr int64_t kSentFrameLifeNs = 2'000'000'000;  // confirmations older than a frame by this
constexpr int kDrainBatch = 64;
constexpr uint32_t kAddressClaimedPgn = 0x0EE00;
constexpr uint32_t kClaimIdMask = 0x03FFFF00;
constexpr uint32_t kClaimId = 0x00EEFF00;
constexpr size_t kNameBytes = 8;

bool NameIs(const uint8_t* data, size_t size, uint64_t name) {
  if (size != kNameBytes) return false;
  for (size_t i = 0; i < kNameBytes; ++i) {
    if (data[i] != static_cast<uint8_t>(name >> (8 * i))) return false;
  }
  return true;
}

}  // namespace

uint32_t DevicePort::canFd() const {
  DeviceLookup device;
  return LookUpDevice(device_, device) && device.mtu == CANFD_MTU ? 1 : 0;
}

ClusterSettings DevicePort::runningSettings(bool j1939) const {
  ClusterSettings c;
  c.protocol = driver::kProtocolCan;
  c.j1939 = j1939;
  LinkReport link;
  if (QueryLink(device_, link) != 0) return c;
  c.baudRate = link.bitRate;
  c.dataBaudRate = link.dataBitRate;
  c.canIoMode = link.mtu == CANFD_MTU ? driver::kCanIoModeFdBrs : driver::kCanIoModeClassic;
  return c;
}

void DevicePort::addOutput(const void* owner, std::shared_ptr<RawCanSocket> socket,
                           std::function<void()> restart) {
  std::lock_guard lock(mutex_);
  Output& o = outputs_[owner];
  o.socket = std::move(socket);
  o.restart = std::move(restart);
  anyOwn_ = true;
}

void DevicePort::removeOutput(const void* owner) {
  std::lock_guard lock(mutex_);
  outputs_.erase(owner);
  anyOwn_ = !outputs_.empty() || !claims_.empty();
}

void DevicePort::setRepeated(const void* owner, std::optional<WireFrame> frame) {
  std::lock_guard lock(mutex_);
  auto it = outputs_.find(owner);
  if (it != outputs_.end()) it->second.repeated = std::move(frame);
}

uint64_t DevicePort::confirmed(const void* owner) {
  std::lock_guard lock(mutex_);
  drainLocked();
  auto it = outputs_.find(owner);
  return it == outputs_.end() ? 0 : it->second.confirmed;
}

// Takes the confirmations waiting on the output sockets: each is a frame the device has sent.
void DevicePort::drainLocked() {
  Reception batch[kDrainBatch];
  for (auto& [owner, o] : outputs_) {
    if (!o.socket || !o.socket->isOpen()) continue;
    for (int n = kDrainBatch; n == kDrainBatch;) {
      n = std::max(0, o.socket->receive(batch, kDrainBatch));
      for (int i = 0; i < n; ++i) {
        if (!batch[i].confirm) continue;
        ++o.confirmed;
        sent_.push_back(Sent{batch[i].softwareNs, batch[i].frame});
      }
    }
  }
  while (sent_.size() > kMaxSentFrames) sent_.pop_front();
}

uint64_t DevicePort::ownFrames(const Reception* batch, int count) {
  if (!anyOwn_) return 0;
  const bool anyLocal =
      std::any_of(batch, batch + count, [](const Reception& r) { return r.local; });
  if (!anyLocal) return 0;
  std::lock_guard lock(mutex_);
  drainLocked();
  uint64_t own = 0;
  for (int i = 0; i < count && i < 64; ++i) {
    if (batch[i].local && isOwnLocked(batch[i])) own |= uint64_t{1} << i;
  }
  return own;
}

bool DevicePort::isOwnLocked(const Reception& r) {
  // The device's copy of a sent frame reaches every socket with the same kernel time stamp.
  while (!sent_.empty() && sent_.front().timeNs < r.softwareNs - kSentFrameLifeNs)
    sent_.pop_front();
  const bool sent = std::any_of(sent_.begin(), sent_.end(), [&r](const Sent& s) {
    return s.timeNs == r.softwareNs && SameFrame(s.frame, r.frame);
  });
  if (sent) return true;
  for (const auto& [owner, o] : outputs_) {
    if (o.repeated && SameFrame(*o.repeated, r.frame)) return true;
  }
  const uint32_t id = r.frame.canId;
  if ((id & CAN_EFF_FLAG) == 0 || (id & kClaimIdMask) != kClaimId) return false;
  return std::any_of(claims_.begin(), claims_.end(), [&](const auto& c) {
    return c.second.address == (id & 0xFF) &&
           NameIs(r.frame.data.data(), r.frame.length, c.second.name);
  });
}

bool DevicePort::isOwnClaim(uint32_t pgn, uint8_t source, const uint8_t* data, size_t size) {
  if (pgn != kAddressClaimedPgn || !anyOwn_) return false;
  std::lock_guard lock(mutex_);
  return std::any_of(claims_.begin(), claims_.end(), [&](const auto& c) {
    return c.second.address == source && NameIs(data, size, c.second.name);
  });
}

bool DevicePort::reserve(const void* owner, uint8_t address, uint64_t name) {
  std::lock_guard lock(mutex_);
  for (const auto& [other, c] : claims_) {
    if (other != owner && c.address == address) return false;
  }
  claims_[owner] = Claim{address, name};
  anyOwn_ = true;
  return true;
}

void DevicePort::release(const void* owner) {
  std::lock_guard lock(mutex_);
  claims_.erase(owner);
  anyOwn_ = !outputs_.empty() || !claims_.empty();
}

void DevicePort::setListenOnly(const void* owner, bool on) {
  std::lock_guard lock(mutex_);
  if (on) {
    listenOnly_[owner] = true;
  } else {
    listenOnly_.erase(owner);
  }
}

bool DevicePort::listenOnly() {
  std::lock_guard lock(mutex_);
  return !listenOnly_.empty();
}

void DevicePort::deviceReturned() {
  std::vector<std::function<void()>> restarts;
  {
    std::lock_guard lock(mutex_);
    for (auto& [owner, o] : outputs_) {
      if (o.restart) restarts.push_back(o.restart);
    }
  }
  for (auto& restart : restarts) restart();
}

}  // namespace tarvix
