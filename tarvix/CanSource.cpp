// Sources of frames on a simulated CAN bus.
#include "tarvix/CanSource.h"

#include <algorithm>
#include <cmath>

#include "driver/FrameTypes.h"

namespace tarvix {
namespace {

int64_t MsToNs(double ms) { return static_cast<int64_t>(std::llround(ms * 1e6)); }

}  // namespace

uint64_t ArbitrationKey(const SimFrame& f) {
  if (f.type == driver::kFrameCanBusError) return 0;
  const bool remote = f.type == driver::kFrameCanRemote;
  uint64_t key;
  if (f.identifier & driver::kExtendedIdFlag) {
    const uint64_t id = f.identifier & driver::kExtendedIdMask;
    // base identifier, SRR (1), IDE (1), extension, RTR
    key =
        ((id >> 18) << 21) | (1ULL << 20) | (1ULL << 19) | ((id & 0x3FFFF) << 1) | (remote ? 1 : 0);
  } else {
    // base identifier, RTR, IDE (0)
    key = (static_cast<uint64_t>(f.identifier & driver::kStandardIdMask) << 21) |
          (remote ? (1ULL << 20) : 0);
  }
  return key + 1;  // bus-error frames (0) come first
}

PeriodicSource::PeriodicSource(const PeriodicFrame& config, int64_t epochNs)
    : config_(config), periodNs_(MsToNs(config.periodMs)) {
  pending_.dueNs = epochNs + MsToNs(config.offsetMs);
  build();
}

void PeriodicSource::build() {
  SimFrame& f = pending_.frame;
  f.type = config_.type;
  const bool error = config_.type == driver::kFrameCanBusError;
  f.identifier = error ? 0 : config_.identifier | (config_.extended ? driver::kExtendedIdFlag : 0);
  f.length = static_cast<uint8_t>(error ? 0 : config_.length);
  f.flags = 0;
  f.info = 0;
  f.origin = -1;
  if (config_.type != driver::kFrameCanRemote)
    config_.payload.fill(f.payload.data(), f.length, counter_);
  pending_.key = ArbitrationKey(f);
}

void PeriodicSource::sent(int64_t startNs, int64_t) {
  pending_.dueNs += periodNs_;
  // A frame held back by the bus longer than its period goes out once; the schedule moves on.
  if (pending_.dueNs < startNs) pending_.dueNs = startNs;
  ++counter_;
  build();
}

void PeriodicSource::skipTo(int64_t nowNs) {
  if (pending_.dueNs >= nowNs) return;
  if (periodNs_ <= 0) {
    pending_.dueNs = nowNs;
    return;
  }
  const int64_t missed = (nowNs - pending_.dueNs + periodNs_ - 1) / periodNs_;
  pending_.dueNs += missed * periodNs_;
  counter_ = static_cast<uint8_t>(counter_ + missed);
  build();
}

ReplaySource::ReplaySource(std::vector<LoggedFrame> frames, const ReplayConfig& config,
                           int64_t epochNs)
    : frames_(std::move(frames)), loop_(config.loop), startNs_(epochNs + MsToNs(config.offsetMs)) {
  done_ = frames_.empty();
  if (done_) return;
  // A looping log repeats one millisecond after its latest frame. Logs are in time order, but a
  // damaged or hand-made one need not be: a round must still move forward.
  const auto latest = std::max_element(
      frames_.begin(), frames_.end(),
      [](const LoggedFrame& a, const LoggedFrame& b) { return a.timeUs < b.timeUs; });
  spanNs_ = (latest->timeUs - frames_.front().timeUs) * 1000 + 1000000;
  build();
}

void ReplaySource::build() {
  const LoggedFrame& lf = frames_[index_];
  pending_.frame = lf.frame;
  pending_.frame.origin = -1;
  pending_.dueNs = startNs_ + round_ * spanNs_ + (lf.timeUs - frames_.front().timeUs) * 1000;
  pending_.key = ArbitrationKey(pending_.frame);
}

void ReplaySource::step() {
  if (++index_ < frames_.size()) return;
  index_ = 0;
  ++round_;
  if (!loop_) done_ = true;
}

void ReplaySource::sent(int64_t, int64_t) {
  step();
  if (!done_) build();
}

void ReplaySource::skipTo(int64_t nowNs) {
  if (!done_ && loop_ && nowNs - pending_.dueNs > spanNs_) {
    round_ += (nowNs - pending_.dueNs) / spanNs_;  // whole rounds nobody heard
    build();
  }
  while (!done_ && pending_.dueNs < nowNs) {
    step();
    if (!done_) build();
  }
}

void InjectedSource::push(const SimFrame& frame, int64_t dueNs) {
  queue_.push_back(Pending{dueNs, ArbitrationKey(frame), frame});
}

void InjectedSource::skipTo(int64_t nowNs) {
  while (!queue_.empty() && queue_.front().dueNs < nowNs) queue_.pop_front();
}

}  // namespace tarvix
