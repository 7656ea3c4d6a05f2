// The thread controller's start, join and handle life cycle.
#include "qvapal/tThreadController.h"

#include <new>

#include "qvapal/ErrorCodes.h"

namespace nQVAPAL000 {

namespace {

constexpr const char* kControllerSource = "qvapal\\protons\\thread\\tThreadController";
constexpr uint32_t kLineAlreadyRunning = 56;
constexpr const char* kThreadSource = "qvapal/quarks/thread";
constexpr uint32_t kLineCreateFailed = 536;
constexpr uint32_t kLineHandleNotOwned = 968;
constexpr uint32_t kLinePriorityRefused = 975;
constexpr const char* kDebugName = "kelvanert";

// The new thread gets its own copy of entry and body rather than a pointer to the controller,
// so a controller destroyed right after start (it never waits) cannot be read by the thread.
struct Launch {
  tThreadController::Entry entry;
  iThread* body;
};

void runBody(iThread* body) { body->run(); }

void threadStart(void* raw) {
  const Launch launch = *static_cast<Launch*>(raw);
  delete static_cast<Launch*>(raw);
  launch.entry(launch.body);
}

}  // namespace

tThreadController::tThreadController() : tThreadController(platform::SystemThreads()) {}

tThreadController::tThreadController(platform::ThreadSystem& threadSystem)
    : threads(threadSystem) {}

tThreadController::~tThreadController() { releaseHandle(); }

void tThreadController::releaseHandle() {
  if (!ownsHandle) return;
  threads.close(handle);
  handle = {};
  threadId = 0;
  ownsHandle = false;
}

void tThreadController::start(iThread* threadBody, StatusBlock& status) {
  if (running.load()) {
    setStatus(status, qvapalerr_threadRunning, kControllerSource, kLineAlreadyRunning);
    return;
  }
  releaseHandle();
  running.store(false);
  ownsHandle = false;
  if (status.isError()) return;

  body = threadBody;
  entry = runBody;
  auto* launch = new (std::nothrow) Launch{entry, body};
  platform::ThreadHandle created;
  if (launch == nullptr || !threads.create(threadStart, launch, created, threadId)) {
    delete launch;
    setStatus(status, qvapalerr_osFault, kThreadSource, kLineCreateFailed);
    return;
  }
  handle = created;
  ownsHandle = true;
  forceNormalPriority(status);
  threads.setName(handle, kDebugName);  // a missing debug name is harmless

  const bool healthy = status.code >= 0;
  if (!healthy) {
    // Detached: the thread runs on, but its handle is released here so that it does not leak.
    releaseHandle();
  }
  running.store(healthy);
  ownsHandle = healthy;
}

void tThreadController::forceNormalPriority(StatusBlock& status) {
  if (threads.getPriority(handle) == platform::kNormalThreadPriority || status.isError()) return;
  if (!ownsHandle) {
    setStatus(status, qvapalerr_handleNotOwned, kThreadSource, kLineHandleNotOwned);
  } else if (!threads.setPriority(handle, platform::kNormalThreadPriority)) {
    setStatus(status, qvapalerr_osFault, kThreadSource, kLinePriorityRefused);
  }
}

void tThreadController::join() {
  if (!ownsHandle) return;
  threads.wait(handle);
  running.store(false);
}

}  // namespace nQVAPAL000
