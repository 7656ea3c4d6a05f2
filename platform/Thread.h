// Operating-system threads for the thread controller: create, name, prioritise, wait, release.
#pragma once

#include <cstdint>

namespace platform {

struct ThreadRecord;  // one started thread; owned through a ThreadHandle

// A started thread as the controller holds it: waited for any number of times, released once.
// A null handle (record == nullptr) stands for "no thread".
struct ThreadHandle {
  ThreadRecord* record = nullptr;
  explicit operator bool() const { return record != nullptr; }
};

using ThreadStartRoutine = void (*)(void* argument);

// The priority every thread of the runtime runs at; the default scheduling class.
constexpr int32_t kNormalThreadPriority = 0;

// The thread operations the controller needs. The system implementation is SystemThreads();
// tests substitute their own to make creation or the priority change fail.
// Every operation may be called from any thread; one handle is used by one thread at a time.
class ThreadSystem {
 public:
  virtual ~ThreadSystem() = default;
  // Starts routine(argument) on a new thread; false when the system refuses.
  virtual bool create(ThreadStartRoutine routine, void* argument, ThreadHandle& handle,
                      uint32_t& threadId) = 0;
  virtual int32_t getPriority(ThreadHandle handle) = 0;
  virtual bool setPriority(ThreadHandle handle, int32_t priority) = 0;
  // Debug name shown by the system tools; at most 15 characters are kept.
  virtual bool setName(ThreadHandle handle, const char* name) = 0;
  // Waits without limit until the thread has ended; returns at once if it was waited for before.
  virtual void wait(ThreadHandle handle) = 0;
  // Releases the handle; a thread still running goes on running on its own.
  virtual void close(ThreadHandle& handle) = 0;
};

// The pthread implementation, shared by the whole process.
ThreadSystem& SystemThreads();

// Blocks the calling thread; 0 gives up the rest of the time slice.
void SleepMilliseconds(uint32_t milliseconds);

}  // namespace platform
