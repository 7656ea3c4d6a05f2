// A simulated LIN bus.
#include "tarvix/LinBus.h"

#include <cmath>
#include <limits>

#include "driver/FrameTypes.h"
#include "tarvix/FrameTiming.h"

namespace tarvix {
namespace {

// A header without response ends when the response time-out (1.4 times the nominal response
// time) has passed.
constexpr uint64_t kResponseTimeoutTenths = 14;
constexpr uint8_t kDiagnosticFirst = 0x3C;

}  // namespace

LinBus::LinBus(BusConfig config, int64_t epochNs)
    : Bus(std::move(config), epochNs),
      slotNs_(std::max<int64_t>(1, std::llround(this->config().linSlotMs * 1e6))) {}

int64_t LinBus::slotStartNs(uint64_t k) const {
  return epochNs() + static_cast<int64_t>(k) * slotNs_;
}

int64_t LinBus::slotEndNs(uint64_t k) const {
  const auto& schedule = config().linSchedule;
  const LinSlot& s = schedule[k % schedule.size()];
  uint64_t bits = LinHeaderBits();
  bits += s.response ? LinResponseBits(s.length)
                     : LinResponseBits(s.length) * kResponseTimeoutTenths / 10;
  return slotStartNs(k) + BitsToNs(bits, config().bitRate);
}

SimFrame LinBus::frameOf(uint64_t k) const {
  const auto& schedule = config().linSchedule;
  const LinSlot& s = schedule[k % schedule.size()];
  SimFrame f;
  f.identifier = s.identifier;
  f.endNs = slotEndNs(k);
  if (!s.response) {
    f.type = driver::kFrameLinNoResponse;
    return f;
  }
  f.type = driver::kFrameLinData;
  f.length = static_cast<uint8_t>(s.length);
  s.payload.fill(f.payload.data(), f.length, static_cast<uint8_t>(k / schedule.size()));
  // Diagnostic frames use the classic checksum, every other frame the enhanced one.
  const bool enhanced = s.identifier < kDiagnosticFirst;
  f.info = LinChecksum(s.identifier, f.payload.data(), f.length, enhanced);
  f.flags = enhanced ? driver::kFlagLinEnhancedChecksum : 0;
  return f;
}

void LinBus::simulate(int64_t nowNs) {
  if (config().linSchedule.empty()) return;
  while (slotEndNs(next_) <= nowNs) {
    lastSlot_ = static_cast<uint32_t>(next_ % config().linSchedule.size());
    carry(frameOf(next_));
    ++next_;
  }
}

void LinBus::skip(int64_t nowNs) {
  if (config().linSchedule.empty() || nowNs <= slotStartNs(next_)) return;
  next_ = static_cast<uint64_t>((nowNs - epochNs() + slotNs_ - 1) / slotNs_);
}

int64_t LinBus::nextEventNs() const {
  if (config().linSchedule.empty()) return std::numeric_limits<int64_t>::max();
  return slotEndNs(next_);
}

}  // namespace tarvix
