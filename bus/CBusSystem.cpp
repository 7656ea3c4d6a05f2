// The shared life cycle of a bus session: poll thread, pollOnce, stop and the driver session.
#include "bus/CBusSystem.h"

#include "driver/tarvix.h"
#include "qvapal/StatusBlock.h"
#include "timing/Time.h"

namespace nKV_DLL300 {

namespace {
constexpr uint64_t kPollPeriodMs = 10;
}  // namespace

CBusSystem::CBusSystem(HostConnection* owner, driver::BusKind kind) : LinkedSession(owner, kind) {
  createdWatch.Restart();
}

CBusSystem::~CBusSystem() { endForDestruction(); }

void CBusSystem::endForDestruction() {
  if (!endPollThread() || driverSession == 0) return;
  (void)kxClear(driverSession);
  driverSession = 0;
}

int32_t CBusSystem::pollOnce() {
  if (!pollActive.load()) return 0;
  return pollLoop();
}

void CBusSystem::run() {
  while (threadRunning.load()) {
    const int32_t status = pollOnce();
    SleepFor(kPollPeriodMs);
    recordStatus(status);
  }
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
  pollActive.store(false);
  int32_t status = 0;
  if (endPollThread()) status = clearDriverSession();
  closeLogFile();
  return status;
}

}  // namespace nKV_DLL300
