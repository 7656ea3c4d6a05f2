// The shared life cycle of a bus session: poll thread, pollOnce, stop and the driver session.
#include "bus/CBusSystem.h"

#include <chrono>

#include "driver/tarvix.h"
#include "qvapal/StatusBlock.h"

namespace nKV_DLL300 {

namespace {
constexpr uint64_t kPollPeriodMs = 10;
// A stopped loop never runs again; its thread only waits to be ended (and looks once a second).
constexpr uint64_t kStoppedWaitMs = 1000;
}  // namespace

CBusSystem::CBusSystem(HostConnection* owner, driver::BusKind kind) : LinkedSession(owner, kind) {
  createdWatch.Restart();
}

CBusSystem::~CBusSystem() { endForDestruction(); }

void CBusSystem::endForDestruction() { (void)endPollThreadAndClear(); }

int32_t CBusSystem::endPollThreadAndClear() {
  pollActive.store(false);
  if (!threadRunning.load()) return 0;
  // The clear comes first: it ends a read the thread may be waiting in. The thread only reads
  // driverSession, which is set to 0 once it has ended.
  const int32_t status = driverSession == 0 ? 0 : kxClear(driverSession);
  (void)endPollThread();
  if (status != 0) {
    recordStatus(status);
    return status;
  }
  driverSession = 0;
  return 0;
}

int32_t CBusSystem::pollOnce() {
  if (!pollActive.load()) return 0;
  return pollLoop();
}

void CBusSystem::run() {
  while (threadRunning.load()) {
    const int32_t status = pollOnce();
    pausePollThread(pollActive.load() ? kPollPeriodMs : kStoppedWaitMs);
    recordStatus(status);
  }
}

void CBusSystem::wakePollThread() {
  {
    std::lock_guard lock(wakeMutex);
    wakeRequested = true;
  }
  wakeSignal.notify_all();
}

void CBusSystem::pausePollThread(uint64_t milliseconds) {
  std::unique_lock lock(wakeMutex);
  wakeSignal.wait_for(lock, std::chrono::milliseconds(milliseconds), [&] { return wakeRequested; });
  wakeRequested = false;
}

void CBusSystem::startPollThreadWith(std::unique_ptr<nQVAPAL000::iThread> body) {
  pollThread = std::move(body);
  pollThreadController = std::make_unique<nQVAPAL000::tThreadController>();
  nQVAPAL000::StatusBlock status;  // structSize 164, code 0, the other fields empty
  pollThreadController->start(pollThread.get(), status);
  // The host sees a thread that could not be started in the header of every later message.
  recordStatus(status.code < 0 ? status.code : 0);
}

bool CBusSystem::endPollThread() {
  pollActive.store(false);
  if (!threadRunning.exchange(false)) return false;
  wakePollThread();
  if (pollThreadController) pollThreadController->join();
  pollThreadController.reset();
  pollThread.reset();
  return true;
}

int32_t CBusSystem::clearDriverSession() {
  if (driverSession == 0) return 0;
  const int32_t status = kxClear(driverSession);
  if (status != 0) {
    recordStatus(status);
    return status;
  }
  driverSession = 0;
  return 0;
}

int32_t CBusSystem::stop() {
  const int32_t status = endPollThreadAndClear();
  closeLogFile();
  return status;
}

}  // namespace nKV_DLL300
