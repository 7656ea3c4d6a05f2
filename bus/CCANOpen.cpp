// Opening a CAN session: the three modes, interface and receive properties, J1939 address claim.
#include <string>

#include "bus/CCAN.h"
#include "bus/OpenSequence.h"
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

int32_t CCAN::openCanSession(const std::string& interfaceName, uint64_t baudRate,
                             uint32_t termination) {
  const SessionSettings& settings = connection->settings;
  OpenSequence open(*this);
  if (settings.runMode.contains("SUBORDINATE")) {
    openSubordinate(open, interfaceName);
  } else if (!settings.alias.empty() && !settings.cluster.empty()) {
    openDatabase(open, interfaceName);
    setInterfaceProperties(open, termination);
  } else {
    openBuiltIn(open, interfaceName, baudRate);
    setInterfaceProperties(open, termination);
  }
  return setReceiveProperties(open);
}

void CCAN::openSubordinate(OpenSequence& open, const std::string& interfaceName) {
  readInterfaceIoMode(interfaceName);
  open.create(SubordinateDatabase(connection->settings), "", interfaceName);
  readRunningRates(open);
}

// The interface runs at rates the host may not know: bus load needs them. A rate the host gave
// stays; a read that fails leaves the rate unknown (bus load 0 %) and does not fail the start.
void CCAN::readRunningRates(OpenSequence& open) {
  SessionSettings& settings = connection->settings;
  uint64_t rate = 0;
  if (settings.baudRate.load() == 0) {
    open.getIgnoringStatus(driver::kPropBaudRate, rate);
    settings.baudRate.store(rate);
  }
  rate = 0;
  if (settings.canIoMode.load() != 0 && settings.canFdBaudRate.load() == 0) {
    open.getIgnoringStatus(driver::kPropCanFdBaudRate, rate);
    settings.canFdBaudRate.store(rate);
  }
}

void CCAN::openDatabase(OpenSequence& open, const std::string& interfaceName) {
  SessionSettings& settings = connection->settings;
  readInterfaceIoMode(interfaceName);
  open.create(settings.alias.get().c_str(), settings.cluster.get().c_str(), interfaceName);
  // The database's values replace the host's.
  uint64_t baudRate = 0;
  if (open.get(driver::kPropBaudRate, baudRate)) settings.baudRate.store(baudRate);
  uint32_t canIoMode = 0;
  if (open.get(driver::kPropCanIoMode, canIoMode)) settings.canIoMode.store(canIoMode);
  // An FD cluster's data rate, without which its bus load cannot be reckoned.
  uint64_t dataRate = 0;
  if (canIoMode != 0) open.getIgnoringStatus(driver::kPropCanFdBaudRate, dataRate);
  if (dataRate != 0) settings.canFdBaudRate.store(dataRate);
  open.setIgnoringStatus(driver::kPropIsoFdMode, settings.isoFdMode.load());
  open.stopInterface();
}

void CCAN::openBuiltIn(OpenSequence& open, const std::string& interfaceName, uint64_t baudRate) {
  const SessionSettings& settings = connection->settings;
  open.create(BuiltInDatabase(settings), "", interfaceName);
  open.stopInterface();
  open.set(driver::kPropBaudRate, baudRate);
  if (settings.canIoMode.load() != 0) {
    open.set(driver::kPropCanFdBaudRate, settings.canFdBaudRate.load());
    open.setIgnoringStatus(driver::kPropIsoFdMode, settings.isoFdMode.load());
  }
}

void CCAN::setInterfaceProperties(OpenSequence& open, uint32_t termination) {
  const SessionSettings& settings = connection->settings;
  open.set(driver::kPropTermination, termination);
  open.set(driver::kPropListenOnly, settings.listenOnly.load());
  // An interface whose transceiver is of type 1 keeps it, whatever the host asked for.
  uint32_t transceiver = 0;
  open.getIgnoringStatus(driver::kPropTransceiverType, transceiver);
  if (transceiver != kTransceiverKeptType) transceiver = settings.transceiverType.load();
  open.set(driver::kPropTransceiverType, transceiver);
  open.start();
}

int32_t CCAN::setReceiveProperties(OpenSequence& open) {
  const SessionSettings& settings = connection->settings;
  if (!J1939(settings)) open.set(driver::kPropEcho, settings.logTransmittedFrames.load());
  const uint8_t busErrorFrames[2] = {settings.logBusErrorFrames.load(), settings.listenOnly.load()};
  open.set(driver::kPropBusErrorFrames, busErrorFrames);
  if (!open.failed() && J1939(settings) &&
      settings.nodeAddress.load() < driver::kJ1939NullAddress) {
    return claimJ1939Address();
  }
  return open.status();
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
  // A write or read the driver refused reports its own status; only a claim that found no
  // address is "not claimed".
  if (addressClaimStatus >= 0 && claimed >= driver::kJ1939NullAddress)
    addressClaimStatus = kAddressNotClaimed;
  recordStatus(addressClaimStatus);
  return addressClaimStatus;
}

}  // namespace nKV_DLL300
