// A simulated LIN bus: the master runs its schedule table, one frame per slot.
#pragma once

#include "tarvix/Bus.h"

namespace tarvix {

class LinBus final : public Bus {
 public:
  LinBus(BusConfig config, int64_t epochNs);
  int64_t nextEventNs() const override;
  // Index in the schedule of the last frame carried (mutex() held).
  uint32_t lastSlot() const { return lastSlot_; }

 protected:
  void simulate(int64_t nowNs) override;
  void skip(int64_t nowNs) override;

 private:
  int64_t slotStartNs(uint64_t k) const;
  int64_t slotEndNs(uint64_t k) const;
  SimFrame frameOf(uint64_t k) const;

  int64_t slotNs_;
  uint64_t next_ = 0;      // guarded by mutex(): the next slot to carry
  uint32_t lastSlot_ = 0;  // guarded by mutex()
};

}  // namespace tarvix
