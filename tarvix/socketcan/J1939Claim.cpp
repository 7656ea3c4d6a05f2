// The J1939 address claim of a session on a bound interface.
#include "tarvix/socketcan/J1939Claim.h"

#include <linux/can.h>

#include <algorithm>

#include "driver/Properties.h"

namespace tarvix {
namespace {

constexpr int64_t kClaimDelayNs = 250'000'000;
constexpr uint32_t kClaimFrameId = 0x18EEFF00;  // priority 6, PGN 0xEE00, to everybody
constexpr uint32_t kClaimIdMask = 0x03FFFF00;
constexpr uint32_t kAddressClaimedPgn = 0x0EE00;
constexpr size_t kNameBytes = 8;
constexpr int kBatch = 16;

uint64_t NameOf(const uint8_t* data) {
  uint64_t name = 0;
  for (size_t i = 0; i < kNameBytes; ++i) name |= static_cast<uint64_t>(data[i]) << (8 * i);
  return name;
}

}  // namespace

void J1939Claim::begin(DevicePort& port, const void* owner, int index, uint64_t name,
                       uint8_t address, bool listenOnly, int64_t nowNs) {
  end(port, owner);
  name_ = name;
  address_ = address;
  if (listenOnly || index <= 0 || !port.reserve(owner, address, name)) return;
  if (node_.openNode(index, name, address) != 0) {
    RawSocketOptions options;
    options.filters = {
        {(kClaimFrameId & kClaimIdMask) | CAN_EFF_FLAG, kClaimIdMask | CAN_EFF_FLAG}};
    if (raw_.open(index, options) != 0) return;
  }
  active_ = true;
  lost_ = !send();
  standsAtNs_ = nowNs + kClaimDelayNs;
}

void J1939Claim::end(DevicePort& port, const void* owner) {
  port.release(owner);
  node_ = J1939Socket{};
  raw_ = RawCanSocket{};
  active_ = false;
  lost_ = false;
}

bool J1939Claim::send() {
  if (node_.isOpen()) return node_.sendAddressClaim(name_) == 0;
  WireFrame f;
  f.canId = (kClaimFrameId | address_) | CAN_EFF_FLAG;
  f.length = kNameBytes;
  for (size_t i = 0; i < kNameBytes; ++i) f.data[i] = static_cast<uint8_t>(name_ >> (8 * i));
  return raw_.send(f) == 0;
}

// Another node's claim of our address: the lower NAME keeps it.
void J1939Claim::observe(uint8_t address, const uint8_t* data, size_t size) {
  if (lost_ || address != address_ || size != kNameBytes) return;
  const uint64_t theirs = NameOf(data);
  if (theirs == name_) return;  // our own claim
  if (theirs < name_) {
    lost_ = true;
  } else {
    (void)send();
  }
}

uint32_t J1939Claim::address(int64_t nowNs) {
  if (!active_) return driver::kJ1939NullAddress;
  if (node_.isOpen()) {
    J1939Message m;
    while (node_.receive(m, kNameBytes) > 0) {
      if (m.pgn == kAddressClaimedPgn) observe(m.source, m.data.data(), m.data.size());
    }
  } else {
    Reception batch[kBatch];
    for (int n = kBatch; n == kBatch;) {
      n = std::max(0, raw_.receive(batch, kBatch));
      for (int i = 0; i < n; ++i) {
        if (batch[i].confirm) continue;
        const WireFrame& f = batch[i].frame;
        if ((f.canId & kClaimIdMask) == (kClaimFrameId & kClaimIdMask))
          observe(static_cast<uint8_t>(f.canId & 0xFF), f.data.data(), f.length);
      }
    }
  }
  if (lost_ || nowNs < standsAtNs_) return driver::kJ1939NullAddress;
  return address_;
}

}  // namespace tarvix
