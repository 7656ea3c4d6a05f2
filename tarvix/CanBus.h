// A simulated CAN bus: frames compete by identifier priority and take their bit time.
#pragma once

#include <memory>
#include <vector>

#include "tarvix/Bus.h"
#include "tarvix/CanSource.h"

namespace tarvix {

class CanBus final : public Bus {
 public:
  // `replays` holds the parsed log of each configured replay, in order.
  CanBus(BusConfig config, int64_t epochNs, std::vector<std::vector<LoggedFrame>> replays);

  // Output sessions put their frames on the bus through these (mutex() held).
  void addSource(CanSource* source);
  void removeSource(CanSource* source);

  // J1939 address claiming (mutex() held). claim() returns false when the address is held by
  // another node; otherwise the address is claimed 250 ms after the claim frame is sent.
  bool claim(const Session* owner, uint8_t address, uint64_t name, int32_t origin, int64_t nowNs);
  void release(const Session* owner);
  uint32_t claimedAddress(const Session* owner, int64_t nowNs) const;

  int64_t nextEventNs() const override;

 protected:
  void simulate(int64_t nowNs) override;
  void skip(int64_t nowNs) override;

 private:
  struct Claim {
    const Session* owner;
    uint8_t address;
    int64_t doneNs;
  };
  bool pickNext(int64_t& startNs, CanSource*& source);
  int64_t durationNs(const SimFrame& frame) const;

  std::vector<std::unique_ptr<CanSource>> owned_;  // guarded by mutex()
  std::vector<CanSource*> sources_;                // guarded by mutex(); owned_ and output sessions
  InjectedSource* injected_ = nullptr;             // one of owned_
  std::vector<Claim> claims_;                      // guarded by mutex()
  int64_t freeAtNs_;                               // guarded by mutex(): end of the last frame
};

}  // namespace tarvix
