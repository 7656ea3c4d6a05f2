// Starts one thread body on a new operating-system thread, names it, waits for it, owns its handle.
#pragma once

#include <atomic>
#include <cstdint>

#include "platform/Thread.h"
#include "qvapal/StatusBlock.h"
#include "qvapal/iThread.h"

namespace nQVAPAL000 {

// States: idle (nothing started), running (started, not joined), joined (ended, handle still
// held), detached (started but its priority could not be set: the controller lets it go).
// start, join and the destructor are called by one thread at a time; isRunning may be read by
// any thread. The controller has no lock.
class tThreadController {
 public:
  using Entry = void (*)(iThread* body);

  tThreadController();
  // Uses `threads` instead of the system's threads (tests inject failures); it must outlive this.
  explicit tThreadController(platform::ThreadSystem& threads);
  virtual ~tThreadController();  // releases the handle; never waits for the thread
  tThreadController(const tThreadController&) = delete;
  tThreadController& operator=(const tThreadController&) = delete;

  // Starts body->run() on a new thread named "kelvanert". Failures go only to `status`:
  // -52016 while a thread runs, -52008 when the system cannot create it or refuses normal
  // priority. Creates nothing when `status` already holds an error.
  void start(iThread* body, StatusBlock& status);
  // Waits without time limit for the started thread to end; the handle stays owned.
  void join();
  bool isRunning() const { return running.load(); }
  bool ownsThreadHandle() const { return ownsHandle; }
  uint32_t threadIdentifier() const { return threadId; }

 private:
  void releaseHandle();
  void forceNormalPriority(StatusBlock& status);

  platform::ThreadSystem& threads;  // set at construction
  uint32_t threadId = 0;            // managing thread only
  iThread* body = nullptr;          // not owned; managing thread only
  Entry entry = nullptr;            // managing thread only
  platform::ThreadHandle handle;    // managing thread only
  std::atomic<bool> running{false};
  bool ownsHandle = false;  // managing thread only
};

}  // namespace nQVAPAL000
