// The CAN session's poll loop specifics: frame-time tables, frame counting and the bus report.
#include "bus/CCAN.h"

#include <memory>

#include "bus/CPollCANDataThread.h"
#include "bus/CanStatistics.h"
#include "driver/tarvix.h"
#include "hostlink/HostConnection.h"

namespace nKV_DLL300 {

namespace {
constexpr uint32_t kClassicFrameBytes = 24;
}  // namespace

CCAN::CCAN(HostConnection* owner)
    : CTableSession(owner, driver::BusKind::kCan, ReadPacing::kNearlyFullRule) {}

CCAN::~CCAN() { endForDestruction(); }

void CCAN::startPollThread() { startPollThreadWith(std::make_unique<CPollCANDataThread>(this)); }

const char* CCAN::logHeaderLine() const {
  return "Timestamp\tID\tPayload\tPayload Length\tType\tName";
}

void CCAN::prepareLoop() {
  const SessionSettings& settings = connection->settings;
  CanFrameTimeSettings rates;
  rates.canIoMode = settings.canIoMode.load();
  rates.applicationProtocol = settings.applicationProtocol.load();
  rates.baudRate = settings.baudRate.load();
  rates.canFdBaudRate = settings.canFdBaudRate.load();
  frameTimes = CanFrameTimes{};
  frameTimes.buildFrameTimeTables(rates);
  classicFrames = rates.canIoMode == 0 && rates.applicationProtocol == 0;
}

uint32_t CCAN::batchFrameCount(uint32_t bytes) const {
  if (classicFrames) return bytes / kClassicFrameBytes;
  driver::RawFrameWalker walker(readBuffer, bytes);
  driver::RawFrameView frame;
  uint32_t frames = 0;
  while (walker.next(frame)) ++frames;
  return frames;
}

void CCAN::countFrame(const driver::RawFrameView& frame, bool inWindow) {
  nKV_DLL300::countFrame(statistics, frameTimes, frame.header, inWindow);
}

void CCAN::reportBusState(uint64_t elapsedMilliseconds) {
  beginReport();
  PrepareToSend(statistics, frameTimes, elapsedMilliseconds);
  uint32_t state = 0;
  uint32_t faultCode = 0;
  const int32_t status = kxReadState(driverSession, kCanStateId, sizeof state, &state, &faultCode);
  if (status == 0) {
    DecodeState(statistics, state, faultCode);
  } else {
    recordStatus(status);  // the state fields keep their values
  }
  sendStatistics();
  if (closeWindowIfDue()) EndWindow(statistics, frameTimes);
}

}  // namespace nKV_DLL300
