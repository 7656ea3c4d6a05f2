// The FlexRay session: subordinate and database opening, frame counting and the FlexRay report.
#include "bus/CFlexRay.h"

#include <memory>
#include <string>

#include "bus/CPollFlexRayDataThread.h"
#include "bus/FlexRayStatistics.h"
#include "bus/OpenSequence.h"
#include "driver/Properties.h"
#include "driver/Sessions.h"
#include "driver/States.h"
#include "driver/tarvix.h"
#include "hostlink/HostConnection.h"

namespace nKV_DLL300 {

CFlexRay::CFlexRay(HostConnection* owner)
    : CTableSession(owner, driver::BusKind::kFlexRay, ReadPacing::kNearlyFullRule) {}

CFlexRay::~CFlexRay() { endForDestruction(); }

void CFlexRay::startPollThread() {
  startPollThreadWith(std::make_unique<CPollFlexRayDataThread>(this));
}

int32_t CFlexRay::openFlexRaySession(const std::string& interfaceName, uint32_t termination) {
  const SessionSettings& settings = connection->settings;
  OpenSequence open(*this);
  if (settings.runMode.contains("SUBORDINATE")) {
    open.create(driver::kDatabaseSubordinate, "", interfaceName);
  } else {
    openDatabase(open, interfaceName, termination);
  }
  open.set(driver::kPropEcho, settings.logTransmittedFrames.load());
  return open.status();
}

void CFlexRay::openDatabase(OpenSequence& open, const std::string& interfaceName,
                            uint32_t termination) {
  SessionSettings& settings = connection->settings;
  open.create(settings.alias.get().c_str(), settings.cluster.get().c_str(), interfaceName);
  uint64_t baudRate = 0;
  if (open.get(driver::kPropBaudRate, baudRate)) settings.baudRate.store(baudRate);
  open.stopInterface();
  open.set(driver::kPropFlexRayTermination, termination);
  open.set(driver::kPropFlexRayNullFrames, settings.showNullFrames.load());
  const uint32_t keySlot = settings.keySlot.load();
  if (keySlot != kNoKeySlot) open.set(driver::kPropKeySlot, keySlot);
  open.start();
  open.step([&] {
    return kxWait(driverSession, driver::kWaitInterfaceCommunicating, 0,
                  kFlexRayCommunicatingWaitSeconds, nullptr);
  });
}

const char* CFlexRay::logHeaderLine() const {
  return "Timestamp\tSlot ID\tPayload\tPayload Length\tCycle "
         "Number\tChannel\tStartup\tSync\tPreamble";
}

uint32_t CFlexRay::batchFrameCount(uint32_t bytes) const {
  driver::RawFrameWalker walker(readBuffer, bytes);
  driver::RawFrameView frame;
  uint32_t frames = 0;
  while (walker.next(frame)) ++frames;
  return frames;
}

void CFlexRay::countFrame(const driver::RawFrameView& frame, bool inWindow) {
  nKV_DLL300::countFrame(statistics, frame.header.type, inWindow);
}

void CFlexRay::readStates() {
  uint32_t faultCode = 0;
  uint32_t state = 0;
  int32_t status =
      kxReadState(driverSession, driver::kStateFlexRay, sizeof state, &state, &faultCode);
  if (status != 0) return recordStatus(status);
  DecodeState(statistics, state, faultCode);
  uint32_t words[6] = {};
  status =
      kxReadState(driverSession, driver::kStateFlexRayCounters, sizeof words, words, &faultCode);
  if (status != 0) return recordStatus(status);
  StoreStatisticsWords(statistics, words, faultCode);
  uint32_t channels = 0;
  status = kxReadState(driverSession, driver::kStateFlexRayChannels, sizeof channels, &channels,
                       &faultCode);
  if (status != 0) return recordStatus(status);
  StoreLastStateWord(statistics, channels, faultCode);
}

void CFlexRay::reportBusState(uint64_t elapsedMilliseconds) {
  beginReport();
  PrepareToSend(statistics, elapsedMilliseconds);
  readStates();  // a failed read leaves its fields and those of the reads after it unchanged
  sendStatistics();
  if (closeWindowIfDue()) EndWindow(statistics);
}

static_assert(driver::kStateFlexRayCountersSize == sizeof(uint32_t[6]));

}  // namespace nKV_DLL300
