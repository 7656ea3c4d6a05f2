// The state words of a session's interface, and the locked property entry points of Session.
#include "tarvix/SessionState.h"

#include <algorithm>
#include <cstring>

#include "driver/Properties.h"
#include "driver/States.h"
#include "driver/Status.h"
#include "tarvix/CanBus.h"
#include "tarvix/FlexRayBus.h"
#include "tarvix/LinBus.h"
#include "tarvix/Session.h"
#include "tarvix/SessionProperties.h"
#include "tarvix/SimClock.h"

namespace tarvix {
namespace {

constexpr uint32_t kErrorPassiveLimit = 128;
constexpr int64_t kLinInactiveNs = 4'000'000'000;  // LIN: bus inactive after 4 s without frames

struct StateRule {
  uint32_t id;
  uint32_t size;
  uint32_t protocol;
};

constexpr StateRule kStates[] = {
    {driver::kStateCan, driver::kStateCanSize, driver::kProtocolCan},
    {driver::kStateLin, driver::kStateLinSize, driver::kProtocolLin},
    {driver::kStateFlexRay, driver::kStateFlexRaySize, driver::kProtocolFlexRay},
    {driver::kStateFlexRayCounters, driver::kStateFlexRayCountersSize, driver::kProtocolFlexRay},
    {driver::kStateFlexRayChannels, driver::kStateFlexRayChannelsSize, driver::kProtocolFlexRay},
};

}  // namespace

// Friend access to the session's counters.
class SessionStateWords {
 public:
  static uint32_t Can(const Session& s) {
    uint32_t comm = driver::kCanCommErrorActive;
    if (!s.started_)
      comm = driver::kCanCommStopped;
    else if (std::max(s.receiveErrors_, s.transmitErrors_) >= kErrorPassiveLimit)
      comm = driver::kCanCommErrorPassive;
    return comm | (s.lastError_ & 0xF) << 8 | (std::min(s.transmitErrors_, 255u) << 16) |
           (std::min(s.receiveErrors_, 255u) << 24);
  }

  static uint64_t Lin(const Session& s, int64_t nowNs) {
    const auto& bus = static_cast<const LinBus&>(*s.bus_);
    uint32_t comm = driver::kLinCommIdle;
    if (s.framesSeen_ > 0)
      comm = nowNs - s.lastFrameNs_ > kLinInactiveNs ? driver::kLinCommInactive
                                                     : driver::kLinCommActive;
    const uint32_t word = (s.framesSeen_ > 0 ? 1u : 0u) | (comm << 2) |
                          ((s.lastError_ & 0xF) << 4) | ((s.lastErrorId_ & 0xFF) << 8) |
                          ((s.framesSeen_ & 0xFF) << 16) | ((bus.lastSlot() & 0x3F) << 24) |
                          (s.started_ ? 0u : 1u << 31);
    return word;
  }

  static uint32_t FlexRay(const Session& s, int64_t nowNs) {
    const auto& bus = static_cast<const FlexRayBus&>(*s.bus_);
    uint32_t poc = driver::kFlexRayStateConfig;
    if (s.started_) {
      const bool integrated = s.rateMatches(bus.config()) && bus.syncSlots() > 0 &&
                              nowNs >= s.startedAtNs_ + 2 * bus.cycleNs();
      poc = integrated ? driver::kFlexRayStateNormalActive : driver::kFlexRayStateStartup;
    }
    const uint32_t syncs =
        poc == driver::kFlexRayStateNormalActive ? std::min(bus.syncSlots(), 31u) : 0;
    return poc | (syncs << 8);
  }

  static void FlexRayCounters(const Session& s, int64_t nowNs, uint32_t* words) {
    const auto& bus = static_cast<const FlexRayBus&>(*s.bus_);
    const uint64_t cycles = s.started_ ? bus.cyclesAt(nowNs) - bus.cyclesAt(s.startedAtNs_) : 0;
    words[driver::kFlexRayCounterCycles] = static_cast<uint32_t>(cycles);
    words[driver::kFlexRayCounterDataFrames] = s.dataFramesSeen_;
    words[driver::kFlexRayCounterNullFrames] = s.nullFramesSeen_;
    words[driver::kFlexRayCounterSyntaxErrors] = 0;
    words[driver::kFlexRayCounterContentErrors] = 0;
    words[driver::kFlexRayCounterCurrentCycle] =
        static_cast<uint32_t>(bus.cyclesAt(nowNs) % FlexRayBus::kCyclesPerRound);
  }

  static uint32_t FlexRayChannels(const Session& s) {
    if (!s.started_) return 0;
    uint32_t word = 0;
    for (const FlexRaySlot& slot : s.bus_->config().flexRaySlots) {
      if (slot.channelA) word |= driver::kFlexRayChannelA;
      if (slot.channelB) word |= driver::kFlexRayChannelB;
    }
    return word;
  }
};

int32_t SessionState::Read(const Session& s, uint32_t stateId, uint32_t size, void* state,
                           uint32_t* faultCode, int64_t nowNs) {
  const StateRule* rule = nullptr;
  for (const StateRule& r : kStates) {
    if (r.id == stateId) rule = &r;
  }
  if (rule == nullptr || rule->protocol != s.setup().cluster.protocol) return driver::kUnknownState;
  if (size != rule->size) return driver::kWrongStateSize;
  if (state == nullptr) return driver::kBufferMissing;
  if (faultCode != nullptr) *faultCode = 0;  // the simulated transceivers never fail
  uint32_t words[6] = {};
  uint64_t lin = 0;
  switch (stateId) {
    case driver::kStateCan:
      words[0] = SessionStateWords::Can(s);
      break;
    case driver::kStateLin:
      lin = SessionStateWords::Lin(s, nowNs);
      break;
    case driver::kStateFlexRay:
      words[0] = SessionStateWords::FlexRay(s, nowNs);
      break;
    case driver::kStateFlexRayCounters:
      SessionStateWords::FlexRayCounters(s, nowNs, words);
      break;
    default:
      words[0] = SessionStateWords::FlexRayChannels(s);
      break;
  }
  if (stateId == driver::kStateLin)
    std::memcpy(state, &lin, sizeof lin);
  else
    std::memcpy(state, words, size);
  return driver::kSuccess;
}

void Session::claimAddress(int64_t nowNs) {
  auto& bus = static_cast<CanBus&>(*bus_);
  bus.release(this);
  // An address held by another node stays unclaimed: reads give 0xFE.
  if (settings_.nodeAddress < driver::kJ1939NullAddress) {
    bus.claim(this, static_cast<uint8_t>(settings_.nodeAddress), settings_.nodeName,
              setup_.interfaceIndex, nowNs);
  }
}

int32_t Session::setProperty(uint32_t id, uint32_t size, const void* value) {
  std::lock_guard lock(bus_->mutex());
  const int64_t now = NowNs();
  bus_->advance(now);
  const int32_t status =
      SessionProperties::Store({setup_, isOutput(), started_, settings_}, id, size, value);
  if (status != driver::kSuccess) return status;
  if (id == driver::kPropJ1939NodeAddress) claimAddress(now);
  updateOutputBlock();
  bus_->changed();
  return driver::kSuccess;
}

int32_t Session::getProperty(uint32_t id, uint32_t size, void* value) {
  std::lock_guard lock(bus_->mutex());
  const int64_t now = NowNs();
  bus_->advance(now);
  const int32_t status =
      SessionProperties::Load({setup_, isOutput(), started_, settings_}, id, size, value);
  if (status == driver::kSuccess && id == driver::kPropJ1939NodeAddress) {
    const uint32_t claimed = static_cast<const CanBus&>(*bus_).claimedAddress(this, now);
    std::memcpy(value, &claimed, sizeof claimed);
  }
  return status;
}

int32_t Session::readState(uint32_t stateId, uint32_t size, void* state, uint32_t* faultCode) {
  std::lock_guard lock(bus_->mutex());
  const int64_t now = NowNs();
  bus_->advance(now);
  return SessionState::Read(*this, stateId, size, state, faultCode, now);
}

}  // namespace tarvix
