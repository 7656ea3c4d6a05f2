// The abstract bus session that a host connection owns while a CAN, LIN or FlexRay session runs.
#pragma once

#include <atomic>
#include <condition_variable>
#include <cstdint>
#include <memory>
#include <memory_resource>
#include <mutex>

#include "hostlink/LinkedSession.h"
#include "logging/LogFile.h"
#include "qvapal/iThread.h"
#include "qvapal/tThreadController.h"
#include "timing/Stopwatch.h"

namespace nKV_DLL300 {

class HostConnection;

// The read status that only says "no frame yet": never recorded as lastStatus.
inline constexpr int32_t kReadNothingYet = static_cast<int32_t>(0xBFF6300A);
// The identifier table of a poll loop could not be allocated.
inline constexpr int32_t kStatusTableNotAllocated = -22;

// Life cycle: constructed by CMD_SESSION_START (service thread) with pollActive and threadRunning
// true; the bus's open operation creates the driver session; startPollThread starts the poll
// thread, which calls pollOnce every 10 ms until threadRunning is cleared (after a stopped loop it
// only waits for its end). stop() (service thread) clears the driver session's reference in the
// driver while the thread may still wait in a read, which ends that read at once, then joins the
// thread; only then is driverSession set to 0.
//
// Two threads share a session: the poll thread (run, pollLoop, reportBusState) and the service
// thread (commands, watchdog, stop, destructor). The flags, idCount and lastStatus are atomics;
// everything else is one thread's at a time as noted. The connection outlives the session. The
// bus kind, the connection, idCount and lastStatus are the LinkedSession part.
//
// The virtual operations keep this slot order in every bus class.
class CBusSystem : public LinkedSession {
 public:
  explicit CBusSystem(HostConnection* owner, driver::BusKind kind = driver::BusKind::kNone);
  CBusSystem(const CBusSystem&) = delete;
  CBusSystem& operator=(const CBusSystem&) = delete;

  // Slot 0. endForDestruction(); never closes the log file (stop() does).
  virtual ~CBusSystem();
  // Slot 1. Runs pollLoop while pollActive; returns its status, or 0 at once when paused.
  virtual int32_t pollOnce();
  // Slot 2. Stops polling, joins the poll thread, clears the driver session, closes the log
  // file. Returns the clear's status, 0 when the thread had already been ended. Service thread.
  virtual int32_t stop();
  // Slot 3. Creates and starts the poll thread of the bus. Service thread, once.
  virtual void startPollThread() = 0;
  // Slot 4. kxClear of the driver session: 0 and driverSession 0, or the failure, kept in
  // lastStatus with driverSession unchanged. A session that holds no driver reference has
  // nothing to close and returns 0.
  virtual int32_t clearDriverSession();
  // Slot 5. The read loop of the bus; poll thread.
  virtual int32_t pollLoop() = 0;
  // Slot 6. Per-second rates, driver state and the bus-statistics message; poll thread.
  virtual void reportBusState(uint64_t elapsedMilliseconds) = 0;

  // The poll thread's body: pollOnce every 10 ms while threadRunning; a non-zero status goes to
  // lastStatus.
  void run();

  // Ends a pause of the poll thread at once (pausePollThread): CMD_SESSION_STOP and stop(). Any
  // thread.
  void wakePollThread();

  // Stores a non-zero status as lastStatus. Any thread.
  void recordStatus(int32_t status) {
    if (status != 0) lastStatus.store(status);
  }

  // The poll loop runs while true; cleared by CMD_SESSION_STOP and stop(). Never set again.
  std::atomic<bool> pollActive{true};
  // The poll thread runs while true; cleared by stop(), the destructor and a failed start.
  std::atomic<bool> threadRunning{true};
  // Set by CMD_SESSION_RESET; the next identifier-record send empties the table and clears it.
  std::atomic<bool> resetRequested{false};
  // Reference of kxCreateSession; 0 when none is held. Written by the service thread while no poll
  // thread runs (open, stop); the poll thread only reads it.
  uint32_t driverSession = 0;
  // Where identifier tables are allocated; tests give a resource that refuses. Set before the
  // poll thread starts.
  std::pmr::memory_resource* tableResource = std::pmr::get_default_resource();

 protected:
  // Starts `body` (which points at this session) on a thread named "kelvanert"; keeps both.
  void startPollThreadWith(std::unique_ptr<nQVAPAL000::iThread> body);
  // If the poll thread still runs: clears both flags, waits for it, deletes it. True if it ran.
  bool endPollThread();
  // If the poll thread still runs: clears the driver session (which ends a read the thread waits
  // in), ends the thread, and then forgets the reference; a failed clear keeps it and is recorded.
  // Returns the clear's status, 0 when the thread had already ended (nothing is cleared then).
  int32_t endPollThreadAndClear();
  // What a destructor does: a thread that stop() did not end is ended and its driver session
  // cleared (result ignored). Every class that adds state the poll thread uses calls this first
  // in its own destructor, so the thread never runs on a half-destroyed object.
  void endForDestruction();

  // Poll thread: pauses up to `milliseconds`, or less when wakePollThread is called (a wake that
  // came while the thread was busy ends its next pause at once).
  void pausePollThread(uint64_t milliseconds);

  // Closes the log file of the session, if one is open.
  void closeLogFile() { CloseLogFile(sessionLog); }

  // Restarted at construction (service thread, before the poll thread starts); read by the poll
  // thread when its loop begins.
  Stopwatch createdWatch;
  // Poll thread only, from the start of each poll loop.
  Stopwatch dataWatch;    // period of the identifier-record messages
  Stopwatch stateWatch;   // period of the bus-statistics messages
  Stopwatch windowWatch;  // counting window of the per-second rates

  // The session's log file (logFile, voraFile, voraChannel): the poll thread's while a loop runs,
  // the stopping thread's in stop() after the join.
  SessionLog sessionLog{*this};

 private:
  std::mutex wakeMutex;
  std::condition_variable wakeSignal;
  bool wakeRequested = false;                                           // guarded by wakeMutex
  std::unique_ptr<nQVAPAL000::tThreadController> pollThreadController;  // service thread
  std::unique_ptr<nQVAPAL000::iThread> pollThread;                      // service thread
};

}  // namespace nKV_DLL300
