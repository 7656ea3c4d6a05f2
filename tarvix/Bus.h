// A simulated bus: carries frames in virtual time to the sessions of its interfaces.
#pragma once

#include <condition_variable>
#include <cstdint>
#include <cstdio>
#include <memory>
#include <mutex>
#include <string>
#include <vector>

#include "tarvix/HardwareConfig.h"
#include "tarvix/SimFrame.h"

namespace tarvix {

class Session;

// The bus simulates lazily: every operation that looks at the bus first calls advance(now), which
// computes the frames that ended up to now and hands them to the attached sessions.
// Thread safety: mutex() guards the bus and the queues and settings of every attached session;
// callers hold it around attach/detach/advance and every session operation.
class Bus {
 public:
  Bus(BusConfig config, int64_t epochNs);
  virtual ~Bus();
  Bus(const Bus&) = delete;
  Bus& operator=(const Bus&) = delete;

  std::mutex& mutex() { return mutex_; }
  const BusConfig& config() const { return config_; }
  int64_t epochNs() const { return epochNs_; }

  // Opens the capture file of the configuration; false with a message when it cannot be opened.
  bool openCapture(std::string& error);

  void attach(Session* session);
  void detach(Session* session);
  void advance(int64_t nowNs);

  // Earliest monotonic time at which the bus may carry its next frame (for waiting callers).
  virtual int64_t nextEventNs() const = 0;

  // Waiting reads sleep here (with `lock` on mutex()) until `untilNs`, or until an operation
  // changed what the bus will carry or who listens (changed(): writes, starts, stops, settings,
  // sessions created and closed).
  void waitForChange(std::unique_lock<std::mutex>& lock, int64_t untilNs);
  void changed() { changed_.notify_all(); }

 protected:
  // Computes and carries every frame that ends at or before `nowNs`.
  virtual void simulate(int64_t nowNs) = 0;
  // Moves the bus to `nowNs` without carrying frames (nobody listens).
  virtual void skip(int64_t nowNs) = 0;
  // Hands a finished frame to every session and to the capture file.
  void carry(const SimFrame& frame);
  bool anyListener() const;

  std::vector<Session*> sessions_;  // guarded by mutex_

 private:
  void capture(const SimFrame& frame);

  const BusConfig config_;
  const int64_t epochNs_;
  std::mutex mutex_;
  std::condition_variable changed_;
  std::FILE* captureFile_ = nullptr;  // guarded by mutex_
};

}  // namespace tarvix
