// A simulated FlexRay bus: a fixed cycle of static slots on channels A and B.
#pragma once

#include "tarvix/Bus.h"

namespace tarvix {

class FlexRayBus final : public Bus {
 public:
  static constexpr uint32_t kCyclesPerRound = 64;

  FlexRayBus(BusConfig config, int64_t epochNs);
  int64_t nextEventNs() const override;
  int64_t cycleNs() const { return cycleNs_; }
  // Cycles begun since the bus started, at `nowNs`.
  uint64_t cyclesAt(int64_t nowNs) const;
  uint32_t syncSlots() const;

 protected:
  void simulate(int64_t nowNs) override;
  void skip(int64_t nowNs) override;

 private:
  // Position of the next frame: cycle, slot entry, channel (0 A, 1 B).
  struct Position {
    uint64_t cycle = 0;
    size_t entry = 0;
    int channel = 0;
  };
  int64_t endNs(const Position& p) const;
  SimFrame frameAt(const Position& p) const;
  bool valid(const Position& p) const;
  void step(Position& p) const;
  void normalise(Position& p) const;

  int64_t cycleNs_;
  int64_t slotNs_;
  Position next_;  // guarded by mutex()
};

}  // namespace tarvix
