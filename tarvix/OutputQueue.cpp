// The transmit side of an output session.
#include "tarvix/OutputQueue.h"

#include <cmath>

#include "driver/Properties.h"
#include "driver/Sessions.h"

namespace tarvix {
namespace {

bool IsCyclic(uint32_t timingType) {
  return timingType == driver::kTimingCyclicData || timingType == driver::kTimingCyclicRemote ||
         timingType == driver::kTimingCyclicAndEvent;
}

}  // namespace

OutputQueue::OutputQueue(uint32_t mode, uint32_t capacity) : mode_(mode), capacity_(capacity) {}

bool OutputQueue::full() const {
  return mode_ == driver::kModeOutputQueued && queue_.size() >= capacity_;
}

void OutputQueue::write(const SimFrame& frame, const FrameDefinition& definition, int64_t nowNs) {
  Pending p{nowNs, ArbitrationKey(frame), frame};
  if (mode_ == driver::kModeOutputQueued) {
    queue_.push_back(p);
    return;
  }
  const bool cyclic = IsCyclic(definition.timingType) && definition.cyclicRateS > 0.0;
  periodNs_ = cyclic ? std::max<int64_t>(1, std::llround(definition.cyclicRateS * 1e9)) : 0;
  // A cyclic frame keeps its rhythm when its value changes; the first write starts it, and
  // "cyclic and event" frames also go out at once on every write.
  const bool keepSchedule =
      cyclic && due_ && definition.timingType != driver::kTimingCyclicAndEvent;
  if (keepSchedule) p.dueNs = latest_.dueNs;
  latest_ = p;
  due_ = true;
  sentSinceWrite_ = false;
}

bool OutputQueue::complete() const {
  return mode_ == driver::kModeOutputQueued ? queue_.empty() : sentSinceWrite_;
}

void OutputQueue::halt() {
  queue_.clear();
  due_ = false;
  sentSinceWrite_ = true;
}

const Pending* OutputQueue::peek() {
  if (blocked_) return nullptr;
  if (mode_ == driver::kModeOutputQueued) return queue_.empty() ? nullptr : &queue_.front();
  return due_ ? &latest_ : nullptr;
}

void OutputQueue::sent(int64_t startNs, int64_t) {
  if (mode_ == driver::kModeOutputQueued) {
    queue_.pop_front();
    return;
  }
  sentSinceWrite_ = true;
  if (periodNs_ == 0) {
    due_ = false;
    return;
  }
  latest_.dueNs += periodNs_;
  if (latest_.dueNs < startNs) latest_.dueNs = startNs;
}

void OutputQueue::skipTo(int64_t nowNs) {
  if (blocked_) return;
  while (!queue_.empty() && queue_.front().dueNs < nowNs) queue_.pop_front();
  if (mode_ == driver::kModeOutputQueued || !due_ || latest_.dueNs >= nowNs) return;
  sentSinceWrite_ = true;
  if (periodNs_ == 0) {
    due_ = false;
    return;
  }
  latest_.dueNs += (nowNs - latest_.dueNs + periodNs_ - 1) / periodNs_ * periodNs_;
}

}  // namespace tarvix
