// Something that puts frames on a simulated CAN bus: configured traffic, a replayed log, an output
// session, the driver's own J1939 claims.
#pragma once

#include <cstdint>
#include <deque>
#include <vector>

#include "tarvix/CandumpLog.h"
#include "tarvix/HardwareConfig.h"
#include "tarvix/SimFrame.h"

namespace tarvix {

// The frame a source wants to send next: ready at dueNs, competing with priority key (lower wins).
struct Pending {
  int64_t dueNs = 0;
  uint64_t key = 0;
  SimFrame frame;
};

// Arbitration key of a CAN frame: the bits of its arbitration field in transmission order, so that
// a numerically lower key wins as a dominant bit does. Bus-error frames have key 0.
uint64_t ArbitrationKey(const SimFrame& frame);

// Thread safety: every call is made with the owning bus's mutex held.
class CanSource {
 public:
  virtual ~CanSource() = default;
  // The pending frame, or null when the source has nothing to send (now or ever).
  virtual const Pending* peek() = 0;
  // The pending frame went out on the bus from startNs to endNs.
  virtual void sent(int64_t startNs, int64_t endNs) = 0;
  // Nobody listens: drop every frame that would have been due before nowNs.
  virtual void skipTo(int64_t nowNs) = 0;
};

class PeriodicSource final : public CanSource {
 public:
  PeriodicSource(const PeriodicFrame& config, int64_t epochNs);
  const Pending* peek() override { return &pending_; }
  void sent(int64_t startNs, int64_t endNs) override;
  void skipTo(int64_t nowNs) override;

 private:
  void build();
  PeriodicFrame config_;
  int64_t periodNs_;
  uint8_t counter_ = 0;
  Pending pending_;
};

class ReplaySource final : public CanSource {
 public:
  ReplaySource(std::vector<LoggedFrame> frames, const ReplayConfig& config, int64_t epochNs);
  const Pending* peek() override { return done_ ? nullptr : &pending_; }
  void sent(int64_t startNs, int64_t endNs) override;
  void skipTo(int64_t nowNs) override;

 private:
  void build();
  void step();
  std::vector<LoggedFrame> frames_;
  bool loop_;
  int64_t startNs_;
  int64_t spanNs_ = 0;
  size_t index_ = 0;
  int64_t round_ = 0;
  bool done_ = false;
  Pending pending_;
};

// Frames the driver itself sends for an interface (J1939 address claims), in order.
class InjectedSource final : public CanSource {
 public:
  void push(const SimFrame& frame, int64_t dueNs);
  const Pending* peek() override { return queue_.empty() ? nullptr : &queue_.front(); }
  void sent(int64_t, int64_t) override { queue_.pop_front(); }
  void skipTo(int64_t nowNs) override;

 private:
  std::deque<Pending> queue_;
};

}  // namespace tarvix
