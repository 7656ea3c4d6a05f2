// A simulated CAN bus with arbitration and J1939 address claims.
#include "tarvix/CanBus.h"

#include <algorithm>
#include <limits>

#include "driver/FrameTypes.h"
#include "driver/Properties.h"
#include "tarvix/FrameTiming.h"

namespace tarvix {
namespace {

constexpr int64_t kClaimDelayNs = 250'000'000;  // J1939: claim stands after 250 ms unopposed
constexpr uint32_t kAddressClaimedPgnId = 0x18EEFF00;

}  // namespace

CanBus::CanBus(BusConfig config, int64_t epochNs, std::vector<std::vector<LoggedFrame>> replays)
    : Bus(std::move(config), epochNs), freeAtNs_(epochNs) {
  for (const PeriodicFrame& f : this->config().traffic) {
    owned_.push_back(std::make_unique<PeriodicSource>(f, epochNs));
  }
  for (size_t i = 0; i < replays.size() && i < this->config().replays.size(); ++i) {
    owned_.push_back(
        std::make_unique<ReplaySource>(std::move(replays[i]), this->config().replays[i], epochNs));
  }
  auto injected = std::make_unique<InjectedSource>();
  injected_ = injected.get();
  owned_.push_back(std::move(injected));
  for (auto& s : owned_) sources_.push_back(s.get());
}

void CanBus::addSource(CanSource* source) { sources_.push_back(source); }

void CanBus::removeSource(CanSource* source) {
  sources_.erase(std::remove(sources_.begin(), sources_.end(), source), sources_.end());
}

int64_t CanBus::durationNs(const SimFrame& frame) const {
  return CanFrameNs(frame, config().bitRate, config().dataBitRate);
}

// The frame that wins the bus next: it starts when the bus is free and its source is ready; among
// the sources ready by then the lowest arbitration key wins.
bool CanBus::pickNext(int64_t& startNs, CanSource*& source) {
  int64_t earliest = std::numeric_limits<int64_t>::max();
  for (CanSource* s : sources_) {
    if (const Pending* p = s->peek()) earliest = std::min(earliest, p->dueNs);
  }
  if (earliest == std::numeric_limits<int64_t>::max()) return false;
  startNs = std::max(freeAtNs_, earliest);
  const Pending* best = nullptr;
  for (CanSource* s : sources_) {
    const Pending* p = s->peek();
    if (p != nullptr && p->dueNs <= startNs && (best == nullptr || p->key < best->key)) {
      best = p;
      source = s;
    }
  }
  return best != nullptr;
}

void CanBus::simulate(int64_t nowNs) {
  int64_t startNs = 0;
  CanSource* source = nullptr;
  while (pickNext(startNs, source) && startNs < nowNs) {
    SimFrame frame = source->peek()->frame;
    const int64_t endNs = startNs + durationNs(frame);
    if (endNs > nowNs) break;
    frame.endNs = endNs;
    source->sent(startNs, endNs);
    freeAtNs_ = endNs;
    carry(frame);
  }
}

void CanBus::skip(int64_t nowNs) {
  for (CanSource* s : sources_) s->skipTo(nowNs);
  freeAtNs_ = std::max(freeAtNs_, nowNs);
}

int64_t CanBus::nextEventNs() const {
  int64_t earliest = std::numeric_limits<int64_t>::max();
  for (CanSource* s : sources_) {
    if (const Pending* p = s->peek()) earliest = std::min(earliest, std::max(p->dueNs, freeAtNs_));
  }
  return earliest;
}

bool CanBus::claim(const Session* owner, uint8_t address, uint64_t name, int32_t origin,
                   int64_t nowNs) {
  release(owner);
  const auto& held = config().claimedAddresses;
  if (std::find(held.begin(), held.end(), address) != held.end()) return false;
  for (const Claim& c : claims_) {
    if (c.address == address) return false;
  }
  claims_.push_back(Claim{owner, address, nowNs + kClaimDelayNs});
  SimFrame frame;
  frame.identifier = (kAddressClaimedPgnId | address) | driver::kExtendedIdFlag;
  frame.type = driver::kFrameCanData;
  frame.length = 8;
  frame.origin = origin;
  for (int i = 0; i < 8; ++i) frame.payload[i] = static_cast<uint8_t>(name >> (8 * i));
  injected_->push(frame, nowNs);
  return true;
}

void CanBus::release(const Session* owner) {
  claims_.erase(std::remove_if(claims_.begin(), claims_.end(),
                               [owner](const Claim& c) { return c.owner == owner; }),
                claims_.end());
}

uint32_t CanBus::claimedAddress(const Session* owner, int64_t nowNs) const {
  for (const Claim& c : claims_) {
    if (c.owner == owner) return c.doneNs <= nowNs ? c.address : driver::kJ1939NullAddress;
  }
  return driver::kJ1939NullAddress;
}

}  // namespace tarvix
