// A simulated FlexRay bus.
#include "tarvix/FlexRayBus.h"

#include <algorithm>
#include <cmath>
#include <limits>

#include "driver/FrameTypes.h"
#include "tarvix/FrameTiming.h"

namespace tarvix {
namespace {

bool IsNullCycle(NullCycles rule, uint64_t cycle) {
  switch (rule) {
    case NullCycles::None:
      return false;
    case NullCycles::Odd:
      return cycle % 2 == 1;
    case NullCycles::Even:
      return cycle % 2 == 0;
    case NullCycles::All:
      return true;
  }
  return false;
}

}  // namespace

FlexRayBus::FlexRayBus(BusConfig config, int64_t epochNs)
    : Bus(std::move(config), epochNs),
      cycleNs_(std::max<int64_t>(1, std::llround(this->config().flexRayCycleMs * 1e6))),
      slotNs_(std::max<int64_t>(1, std::llround(this->config().flexRaySlotUs * 1e3))) {
  normalise(next_);
}

bool FlexRayBus::valid(const Position& p) const {
  const FlexRaySlot& s = config().flexRaySlots[p.entry];
  return p.channel == 0 ? s.channelA : s.channelB;
}

void FlexRayBus::step(Position& p) const {
  if (++p.channel > 1) {
    p.channel = 0;
    if (++p.entry >= config().flexRaySlots.size()) {
      p.entry = 0;
      ++p.cycle;
    }
  }
}

void FlexRayBus::normalise(Position& p) const {
  if (config().flexRaySlots.empty()) return;
  while (!valid(p)) step(p);
}

int64_t FlexRayBus::endNs(const Position& p) const {
  const FlexRaySlot& s = config().flexRaySlots[p.entry];
  const int64_t start =
      epochNs() + static_cast<int64_t>(p.cycle) * cycleNs_ + (s.slot - 1) * slotNs_;
  return start + BitsToNs(FlexRayFrameBits(s.length), config().bitRate);
}

SimFrame FlexRayBus::frameAt(const Position& p) const {
  const FlexRaySlot& s = config().flexRaySlots[p.entry];
  SimFrame f;
  f.endNs = endNs(p);
  f.identifier = s.slot;
  f.info = static_cast<uint8_t>(p.cycle % kCyclesPerRound);
  f.length = static_cast<uint8_t>(std::min<uint32_t>(s.length, driver::kMaxCanFdPayload));
  f.flags = (p.channel == 0 ? driver::kFlagFlexRayChannelA : driver::kFlagFlexRayChannelB) |
            (s.startup ? driver::kFlagFlexRayStartup : 0) |
            (s.sync ? driver::kFlagFlexRaySync : 0) |
            (s.preamble ? driver::kFlagFlexRayPreamble : 0);
  if (IsNullCycle(s.nullCycles, p.cycle)) {
    f.type = driver::kFrameFlexRayNull;  // a null frame carries its slot's length, all zero
  } else {
    f.type = driver::kFrameFlexRayData;
    s.payload.fill(f.payload.data(), f.length, static_cast<uint8_t>(p.cycle));
  }
  return f;
}

void FlexRayBus::simulate(int64_t nowNs) {
  if (config().flexRaySlots.empty()) return;
  while (endNs(next_) <= nowNs) {
    carry(frameAt(next_));
    step(next_);
    normalise(next_);
  }
}

void FlexRayBus::skip(int64_t nowNs) {
  if (config().flexRaySlots.empty()) return;
  const uint64_t cycle = cyclesAt(nowNs);
  if (cycle > next_.cycle) next_ = Position{cycle, 0, 0};
  normalise(next_);
  while (endNs(next_) <= nowNs) {
    step(next_);
    normalise(next_);
  }
}

uint64_t FlexRayBus::cyclesAt(int64_t nowNs) const {
  return nowNs <= epochNs() ? 0 : static_cast<uint64_t>((nowNs - epochNs()) / cycleNs_);
}

uint32_t FlexRayBus::syncSlots() const {
  return static_cast<uint32_t>(std::count_if(config().flexRaySlots.begin(),
                                             config().flexRaySlots.end(),
                                             [](const FlexRaySlot& s) { return s.sync; }));
}

int64_t FlexRayBus::nextEventNs() const {
  if (config().flexRaySlots.empty()) return std::numeric_limits<int64_t>::max();
  return endNs(next_);
}

}  // namespace tarvix
