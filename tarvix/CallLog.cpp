// The call recorder and injected faults.
#include "tarvix/CallLog.h"

namespace tarvix {

CallLog& CallLog::Instance() {
  static CallLog* log = new CallLog();  // never destroyed: driver calls may come from late threads
  return *log;
}

void CallLog::refreshActive() {
  active_.store(recording_ || !faults_.empty(), std::memory_order_release);
}

std::optional<int32_t> CallLog::injected(const std::string& operation,
                                         const std::string& interfaceName) {
  std::lock_guard lock(mutex_);
  for (auto it = faults_.begin(); it != faults_.end(); ++it) {
    if (it->operation != operation) continue;
    if (!it->interfaceName.empty() && it->interfaceName != interfaceName) continue;
    const int32_t status = it->status;
    if (!it->always) {
      faults_.erase(it);
      refreshActive();
    }
    return status;
  }
  return std::nullopt;
}

void CallLog::record(CallRecord call) {
  std::lock_guard lock(mutex_);
  if (recording_) calls_.push_back(std::move(call));
}

void CallLog::startRecording() {
  std::lock_guard lock(mutex_);
  calls_.clear();
  recording_ = true;
  refreshActive();
}

void CallLog::stopRecording() {
  std::lock_guard lock(mutex_);
  recording_ = false;
  refreshActive();
}

std::vector<CallRecord> CallLog::calls() const {
  std::lock_guard lock(mutex_);
  return calls_;
}

void CallLog::inject(FaultConfig fault) {
  std::lock_guard lock(mutex_);
  faults_.push_back(std::move(fault));
  refreshActive();
}

void CallLog::setFaults(const std::vector<FaultConfig>& faults) {
  std::lock_guard lock(mutex_);
  faults_ = faults;
  refreshActive();
}

void CallLog::clearFaults() { setFaults({}); }

void CallLog::reset() {
  std::lock_guard lock(mutex_);
  recording_ = false;
  calls_.clear();
  faults_.clear();
  refreshActive();
}

}  // namespace tarvix
