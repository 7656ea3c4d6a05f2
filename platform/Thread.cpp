// Threads on pthreads: a handle may be waited for repeatedly and is released (detached) once.
#include "platform/Thread.h"

#include <pthread.h>
#include <sched.h>
#include <time.h>

#include <atomic>
#include <cerrno>
#include <cstring>
#include <mutex>
#include <new>

namespace platform {

struct ThreadRecord {
  pthread_t thread{};
  std::mutex waitMutex;
  bool joined = false;  // guarded by waitMutex
};

namespace {

struct Launch {
  ThreadStartRoutine routine;
  void* argument;
};

void* RunLaunch(void* raw) {
  Launch launch = *static_cast<Launch*>(raw);
  delete static_cast<Launch*>(raw);
  launch.routine(launch.argument);
  return nullptr;
}

std::atomic<uint32_t> nextThreadId{1};

class PosixThreads final : public ThreadSystem {
 public:
  bool create(ThreadStartRoutine routine, void* argument, ThreadHandle& handle,
              uint32_t& threadId) override {
    auto* record = new (std::nothrow) ThreadRecord;
    auto* launch = new (std::nothrow) Launch{routine, argument};
    if (record == nullptr || launch == nullptr ||
        pthread_create(&record->thread, nullptr, RunLaunch, launch) != 0) {
      delete record;
      delete launch;
      return false;
    }
    handle.record = record;
    threadId = nextThreadId.fetch_add(1);
    return true;
  }

  // Threads run in the default scheduling class, which is the normal priority.
  int32_t getPriority(ThreadHandle) override { return kNormalThreadPriority; }

  bool setPriority(ThreadHandle handle, int32_t priority) override {
    return handle && priority == kNormalThreadPriority;
  }

  bool setName(ThreadHandle handle, const char* name) override {
    if (!handle || name == nullptr) return false;
    char shortName[16] = {};
    std::strncpy(shortName, name, sizeof shortName - 1);
    return pthread_setname_np(handle.record->thread, shortName) == 0;
  }

  void wait(ThreadHandle handle) override {
    if (!handle) return;
    std::lock_guard<std::mutex> lock(handle.record->waitMutex);
    if (handle.record->joined) return;
    pthread_join(handle.record->thread, nullptr);
    handle.record->joined = true;
  }

  void close(ThreadHandle& handle) override {
    if (!handle) return;
    {
      std::lock_guard<std::mutex> lock(handle.record->waitMutex);
      if (!handle.record->joined) pthread_detach(handle.record->thread);
    }
    delete handle.record;
    handle.record = nullptr;
  }
};

}  // namespace

ThreadSystem& SystemThreads() {
  static PosixThreads threads;
  return threads;
}

void SleepMilliseconds(uint32_t milliseconds) {
  if (milliseconds == 0) {
    sched_yield();
    return;
  }
  timespec remaining{static_cast<time_t>(milliseconds / 1000),
                     static_cast<long>(milliseconds % 1000) * 1000000L};
  while (nanosleep(&remaining, &remaining) != 0 && errno == EINTR) {
  }
}

}  // namespace platform
