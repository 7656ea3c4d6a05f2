// The LIN session: its three ways of opening, frame counting and the LIN bus report.
#include "bus/CLIN.h"

#include <memory>
#include <string>

#include "bus/CPollLINDataThread.h"
#include "bus/LinStatistics.h"
#include "bus/OpenSequence.h"
#include "driver/Properties.h"
#include "driver/Sessions.h"
#include "driver/States.h"
#include "driver/tarvix.h"
#include "hostlink/HostConnection.h"

namespace nKV_DLL300 {

namespace {

constexpr uint32_t kLinFrameBytes = 24;

}  // namespace

CLIN::CLIN(HostConnection* owner)
    : CTableSession(owner, driver::BusKind::kLin, ReadPacing::kAlwaysSleep) {}

CLIN::~CLIN() { endForDestruction(); }

void CLIN::startPollThread() { startPollThreadWith(std::make_unique<CPollLINDataThread>(this)); }

int32_t CLIN::openLinSession(const std::string& interfaceName, uint64_t baudRate) {
  const SessionSettings& settings = connection->settings;
  OpenSequence open(*this);
  if (settings.runMode.contains("SUBORDINATE")) {
    open.create(driver::kDatabaseSubordinate, "", interfaceName);
  } else if (!settings.alias.empty() && !settings.cluster.empty()) {
    openDatabase(open, interfaceName);
  } else {
    openBuiltIn(open, interfaceName, baudRate);
  }
  setReceiveProperties(open);
  return open.status();
}

void CLIN::openDatabase(OpenSequence& open, const std::string& interfaceName) {
  SessionSettings& settings = connection->settings;
  open.create(settings.alias.get().c_str(), settings.cluster.get().c_str(), interfaceName);
  // The database's baud rate replaces the host's.
  uint64_t baudRate = 0;
  if (open.get(driver::kPropBaudRate, baudRate)) settings.baudRate.store(baudRate);
  open.stopInterface();
  open.start();
}

void CLIN::openBuiltIn(OpenSequence& open, const std::string& interfaceName, uint64_t baudRate) {
  open.create(driver::kDatabaseMemory, "", interfaceName);
  open.stopInterface();
  open.set(driver::kPropBaudRate, baudRate);
  open.start();
}

void CLIN::setReceiveProperties(OpenSequence& open) {
  const SessionSettings& settings = connection->settings;
  open.set(driver::kPropEcho, settings.logTransmittedFrames.load());
  const uint8_t busErrorFrames[2] = {settings.logBusErrorFrames.load(), settings.listenOnly.load()};
  open.set(driver::kPropBusErrorFrames, busErrorFrames);
  open.set(driver::kPropLinNoResponseFrames, settings.noResponseFrames.load());
  open.set(driver::kPropLinChecksumFlag, settings.logChecksum.load());
}

const char* CLIN::logHeaderLine() const {
  if (connection->settings.logChecksum.load() != 0) {
    return "Timestamp\tID\tPayload\tPayload Length\tChecksum\tType\t";
  }
  return "Timestamp\tID\tPayload\tPayload Length\tType\t";
}

uint32_t CLIN::batchFrameCount(uint32_t bytes) const { return bytes / kLinFrameBytes; }

void CLIN::countFrame(const driver::RawFrameView& frame, bool inWindow) {
  nKV_DLL300::countFrame(statistics, frame.header.type, inWindow);
}

void CLIN::reportBusState(uint64_t elapsedMilliseconds) {
  beginReport();
  PrepareToSend(statistics, elapsedMilliseconds);
  uint64_t state = 0;
  uint32_t faultCode = 0;
  const int32_t status =
      kxReadState(driverSession, driver::kStateLin, driver::kStateLinSize, &state, &faultCode);
  if (status == 0) {
    DecodeState(statistics, state, faultCode);
  } else {
    recordStatus(status);  // the state fields keep their values
  }
  sendStatistics();
  if (closeWindowIfDue()) EndWindow(statistics);
}

static_assert(driver::kStateLinSize == sizeof(uint64_t));

}  // namespace nKV_DLL300
