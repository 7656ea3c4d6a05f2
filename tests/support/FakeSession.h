// A bus session that runs no thread and touches no driver, counting the calls it gets.
#pragma once

#include "bus/CBusSystem.h"

namespace kvtest {

class FakeSession : public nKV_DLL300::CBusSystem {
 public:
  struct Calls {
    int stops = 0;
    bool destroyed = false;
  };
  FakeSession(nKV_DLL300::HostConnection* owner, Calls& calls,
              driver::BusKind kind = driver::BusKind::kCan)
      : CBusSystem(owner, kind), calls_(calls) {}
  ~FakeSession() override { calls_.destroyed = true; }
  int32_t pollOnce() override { return 0; }
  int32_t stop() override {
    ++calls_.stops;
    return 0;
  }
  void startPollThread() override {}
  int32_t clearDriverSession() override { return 0; }
  int32_t pollLoop() override { return 0; }
  void reportBusState(uint64_t) override {}

 private:
  Calls& calls_;
};

}  // namespace kvtest
