// The LIN session: its three ways of opening, frame counting and the LIN bus report.
#include "bus/CLIN.h"

#include <memory>
#include <string>

#include "bus/CPollLINDataThread.h"
#include "bus/LinStatistics.h"
#include "driver/Properties.h"
#include "driver/Sessions.h"
#include "driver/States.h"
#include "driver/tarvix.h"
#include "hostlink/HostConnection.h"

namespace nKV_DLL300 {

namespace {

constexpr uint32_t kLinFrameBytes = 24;

template <class T>
int32_t SetProperty(uint32_t reference, uint32_t id, T value) {
  return kxSetProperty(reference, id, sizeof value, &value);
}

}  // namespace

CLIN::CLIN(HostConnection* owner)
    : CTableSession(owner, driver::BusKind::kLin, ReadPacing::kAlwaysSleep) {}

CLIN::~CLIN() { endForDestruction(); }

void CLIN::startPollThread() { startPollThreadWith(std::make_unique<CPollLINDataThread>(this)); }

int32_t CLIN::fail(int32_t status) {
  recordStatus(status);
  return status;
}

int32_t CLIN::openLinSession(const std::string& interfaceName, uint64_t baudRate) {
  const SessionSettings& settings = connection->settings;
  int32_t status;
  if (settings.runMode.Contains("SUBORDINATE")) {
    status = openSubordinate(interfaceName);
  } else if (!settings.alias.Empty() && !settings.cluster.Empty()) {
    status = openDatabase(interfaceName);
  } else {
    status = openBuiltIn(interfaceName, baudRate);
  }
  if (status < 0) return status;
  return setReceiveProperties();
}

int32_t CLIN::openSubordinate(const std::string& interfaceName) {
  const int32_t status =
      kxCreateSession(driver::kDatabaseSubordinate, "", "", interfaceName.c_str(),
                      driver::kModeReceiveStream, &driverSession);
  return status < 0 ? fail(status) : status;
}

int32_t CLIN::openDatabase(const std::string& interfaceName) {
  SessionSettings& settings = connection->settings;
  const std::string alias = settings.alias.Get();
  const std::string cluster = settings.cluster.Get();
  int32_t status = kxCreateSession(alias.c_str(), cluster.c_str(), "", interfaceName.c_str(),
                                   driver::kModeReceiveStream, &driverSession);
  if (status < 0) return fail(status);
  // The database's baud rate replaces the host's.
  uint64_t baudRate = 0;
  status = kxGetProperty(driverSession, driver::kPropBaudRate, sizeof baudRate, &baudRate);
  if (status < 0) return fail(status);
  settings.baudRate.store(baudRate);
  status = kxStop(driverSession, driver::kScopeInterfaceOnly);
  if (status < 0) return fail(status);
  status = kxStart(driverSession, driver::kScopeNormal);
  return status < 0 ? fail(status) : status;
}

int32_t CLIN::openBuiltIn(const std::string& interfaceName, uint64_t baudRate) {
  int32_t status = kxCreateSession(driver::kDatabaseMemory, "", "", interfaceName.c_str(),
                                   driver::kModeReceiveStream, &driverSession);
  if (status < 0) return fail(status);
  status = kxStop(driverSession, driver::kScopeInterfaceOnly);
  if (status < 0) return fail(status);
  status = SetProperty(driverSession, driver::kPropBaudRate, baudRate);
  if (status < 0) return fail(status);
  status = kxStart(driverSession, driver::kScopeNormal);
  return status < 0 ? fail(status) : status;
}

int32_t CLIN::setReceiveProperties() {
  const SessionSettings& settings = connection->settings;
  int32_t status =
      SetProperty(driverSession, driver::kPropEcho, settings.logTransmittedFrames.load());
  if (status < 0) return fail(status);
  const uint8_t busErrorFrames[2] = {settings.logBusErrorFrames.load(), settings.listenOnly.load()};
  status = kxSetProperty(driverSession, driver::kPropBusErrorFrames, sizeof busErrorFrames,
                         busErrorFrames);
  if (status < 0) return fail(status);
  status = SetProperty(driverSession, driver::kPropLinNoResponseFrames,
                       settings.noResponseFrames.load());
  if (status < 0) return fail(status);
  status = SetProperty(driverSession, driver::kPropLinChecksumFlag, settings.logChecksum.load());
  return status < 0 ? fail(status) : status;
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
  prepareToSend(statistics, elapsedMilliseconds);
  uint64_t state = 0;
  uint32_t faultCode = 0;
  const int32_t status =
      kxReadState(driverSession, driver::kStateLin, driver::kStateLinSize, &state, &faultCode);
  if (status == 0) {
    decodeState(statistics, state, faultCode);
  } else {
    recordStatus(status);  // the state fields keep their values
  }
  sendStatistics();
  if (closeWindowIfDue()) endWindow(statistics);
}

static_assert(driver::kStateLinSize == sizeof(uint64_t));

}  // namespace nKV_DLL300
