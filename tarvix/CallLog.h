// The call recorder and the injected faults behind the test-control interface.
#pragma once

#include <atomic>
#include <mutex>
#include <optional>
#include <vector>

#include "tarvix/HardwareConfig.h"
#include "tarvix/TarvixControl.h"

namespace tarvix {

// Thread-safe. active() is a cheap check that lets the driver skip bookkeeping when neither
// recording nor any fault is on.
class CallLog {
 public:
  static CallLog& Instance();

  bool active() const { return active_.load(std::memory_order_acquire); }
  // The injected status for this call, consuming a "once" fault.
  std::optional<int32_t> injected(const std::string& operation, const std::string& interfaceName);
  void record(CallRecord call);

  void startRecording();
  void stopRecording();
  std::vector<CallRecord> calls() const;
  void inject(FaultConfig fault);
  void setFaults(const std::vector<FaultConfig>& faults);
  void clearFaults();
  void reset();

 private:
  void refreshActive();

  mutable std::mutex mutex_;
  bool recording_ = false;           // guarded by mutex_
  std::vector<CallRecord> calls_;    // guarded by mutex_
  std::vector<FaultConfig> faults_;  // guarded by mutex_
  std::atomic<bool> active_{false};
};

}  // namespace tarvix
