// Opening a CAN session: the three modes, interface and receive properties, J1939 address claim.
#include <string>

#include "bus/CCAN.h"
#include "driver/Properties.h"
#include "driver/Sessions.h"
#include "driver/tarvix.h"
#include "hostlink/HostConnection.h"
#include "timing/Time.h"

namespace nKV_DLL300 {

namespace {

constexpr uint32_t kClaimPollMs = 5;
constexpr uint32_t kClaimMaxRetries = 300;  // 301 reads, about 1.5 s
constexpr uint32_t kTransceiverKeptType = 1;

bool J1939(const SessionSettings& settings) { return settings.applicationProtocol.load() == 1; }

const char* SubordinateDatabase(const SessionSettings& settings) {
  return J1939(settings) ? driver::kDatabaseSubordinateJ1939 : driver::kDatabaseSubordinate;
}

// The built-in database of the CAN I/O mode.
const char* BuiltInDatabase(const SessionSettings& settings) {
  switch (settings.canIoMode.load()) {
    case driver::kCanIoModeClassic:
      return J1939(settings) ? driver::kDatabaseCanJ1939 : driver::kDatabaseCan;
    case driver::kCanIoModeFd:
      return driver::kDatabaseCanFd;
    case driver::kCanIoModeFdBrs:
      return driver::kDatabaseCanFdBrs;
    default:
      return driver::kDatabaseCan;
  }
}

template <class T>
int32_t SetProperty(uint32_t reference, uint32_t id, T value) {
  return kxSetProperty(reference, id, sizeof value, &value);
}

}  // namespace

int32_t CCAN::fail(int32_t status) {
  recordStatus(status);
  return status;
}

int32_t CCAN::openCanSession(const std::string& interfaceName, uint64_t baudRate,
                             uint32_t termination) {
  const SessionSettings& settings = connection->settings;
  int32_t status;
  if (settings.runMode.Contains("SUBORDINATE")) {
    status = openSubordinate(interfaceName);
  } else if (!settings.alias.Empty() && !settings.cluster.Empty()) {
    status = openDatabase(interfaceName);
    if (status >= 0) status = setInterfaceProperties(termination);
  } else {
    status = openBuiltIn(interfaceName, baudRate);
    if (status >= 0) status = setInterfaceProperties(termination);
  }
  if (status < 0) return status;
  return setReceiveProperties();
}

int32_t CCAN::openSubordinate(const std::string& interfaceName) {
  readInterfaceIoMode(interfaceName);
  const int32_t status =
      kxCreateSession(SubordinateDatabase(connection->settings), "", "", interfaceName.c_str(),
                      driver::kModeReceiveStream, &driverSession);
  return status < 0 ? fail(status) : status;
}

int32_t CCAN::openDatabase(const std::string& interfaceName) {
  SessionSettings& settings = connection->settings;
  readInterfaceIoMode(interfaceName);
  const std::string alias = settings.alias.Get();
  const std::string cluster = settings.cluster.Get();
  int32_t status = kxCreateSession(alias.c_str(), cluster.c_str(), "", interfaceName.c_str(),
                                   driver::kModeReceiveStream, &driverSession);
  if (status < 0) return fail(status);
  // The database's values replace the host's.
  uint64_t baudRate = 0;
  status = kxGetProperty(driverSession, driver::kPropBaudRate, sizeof baudRate, &baudRate);
  if (status < 0) return fail(status);
  settings.baudRate.store(baudRate);
  uint32_t canIoMode = 0;
  status = kxGetProperty(driverSession, driver::kPropCanIoMode, sizeof canIoMode, &canIoMode);
  if (status < 0) return fail(status);
  settings.canIoMode.store(canIoMode);
  (void)SetProperty(driverSession, driver::kPropIsoFdMode, settings.isoFdMode.load());
  status = kxStop(driverSession, driver::kScopeInterfaceOnly);
  return status < 0 ? fail(status) : status;
}

int32_t CCAN::openBuiltIn(const std::string& interfaceName, uint64_t baudRate) {
  const SessionSettings& settings = connection->settings;
  int32_t status = kxCreateSession(BuiltInDatabase(settings), "", "", interfaceName.c_str(),
                                   driver::kModeReceiveStream, &driverSession);
  if (status < 0) return fail(status);
  status = kxStop(driverSession, driver::kScopeInterfaceOnly);
  if (status < 0) return fail(status);
  status = SetProperty(driverSession, driver::kPropBaudRate, baudRate);
  if (status < 0) return fail(status);
  if (settings.canIoMode.load() != 0) {
    status = SetProperty(driverSession, driver::kPropCanFdBaudRate, settings.canFdBaudRate.load());
    if (status < 0) return fail(status);
    (void)SetProperty(driverSession, driver::kPropIsoFdMode, settings.isoFdMode.load());
  }
  return status;
}

int32_t CCAN::setInterfaceProperties(uint32_t termination) {
  const SessionSettings& settings = connection->settings;
  int32_t status = SetProperty(driverSession, driver::kPropTermination, termination);
  if (status < 0) return fail(status);
  status = SetProperty(driverSession, driver::kPropListenOnly, settings.listenOnly.load());
  if (status < 0) return fail(status);
  // An interface whose transceiver is of type 1 keeps it, whatever the host asked for.
  uint32_t transceiver = 0;
  (void)kxGetProperty(driverSession, driver::kPropTransceiverType, sizeof transceiver,
                      &transceiver);
  if (transceiver != kTransceiverKeptType) transceiver = settings.transceiverType.load();
  status = SetProperty(driverSession, driver::kPropTransceiverType, transceiver);
  if (status < 0) return fail(status);
  status = kxStart(driverSession, driver::kScopeNormal);
  return status < 0 ? fail(status) : status;
}

int32_t CCAN::setReceiveProperties() {
  const SessionSettings& settings = connection->settings;
  int32_t status = 0;
  if (!J1939(settings)) {
    status = SetProperty(driverSession, driver::kPropEcho, settings.logTransmittedFrames.load());
    if (status < 0) return fail(status);
  }
  const uint8_t busErrorFrames[2] = {settings.logBusErrorFrames.load(), settings.listenOnly.load()};
  status = kxSetProperty(driverSession, driver::kPropBusErrorFrames, sizeof busErrorFrames,
                         busErrorFrames);
  if (status < 0) return fail(status);
  if (J1939(settings) && settings.nodeAddress.load() < driver::kJ1939NullAddress) {
    return claimJ1939Address();
  }
  return status;
}

void CCAN::readInterfaceIoMode(const std::string& interfaceName) {
  SessionSettings& settings = connection->settings;
  uint32_t probe = 0;
  if (kxCreateSession(SubordinateDatabase(settings), "", "", interfaceName.c_str(),
                      driver::kModeReceiveStream, &probe) != 0) {
    return;
  }
  uint32_t canIoMode = 0;
  if (kxGetProperty(probe, driver::kPropCanIoMode, sizeof canIoMode, &canIoMode) == 0) {
    settings.canIoMode.store(canIoMode);
  }
  (void)kxClear(probe);
}

int32_t CCAN::claimJ1939Address() {
  const SessionSettings& settings = connection->settings;
  addressClaimStatus =
      SetProperty(driverSession, driver::kPropJ1939NodeName, settings.nodeName.load());
  if (addressClaimStatus == 0) {
    addressClaimStatus = SetProperty(driverSession, driver::kPropJ1939NodeAddress,
                                     uint32_t{settings.nodeAddress.load()});
  }
  uint32_t claimed = driver::kJ1939NullAddress;
  for (uint32_t retries = 0; addressClaimStatus == 0;) {
    SleepFor(kClaimPollMs);
    addressClaimStatus =
        kxGetProperty(driverSession, driver::kPropJ1939NodeAddress, sizeof claimed, &claimed);
    if (claimed < driver::kJ1939NullAddress) break;
    if (++retries > kClaimMaxRetries) break;
  }
  if (claimed >= driver::kJ1939NullAddress) addressClaimStatus = kAddressNotClaimed;
  recordStatus(addressClaimStatus);
  return addressClaimStatus;
}

}  // namespace nKV_DLL300
