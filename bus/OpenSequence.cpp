// The driver calls of an open sequence and its failure rule.
#include "bus/OpenSequence.h"

#include "bus/CBusSystem.h"
#include "driver/Sessions.h"
#include "driver/tarvix.h"

namespace nKV_DLL300 {

void OpenSequence::create(const char* database, const char* cluster,
                          const std::string& interfaceName) {
  step([&] {
    return kxCreateSession(database, cluster, "", interfaceName.c_str(), driver::kModeReceiveStream,
                           &session_.driverSession);
  });
}

void OpenSequence::stopInterface() {
  step([&] { return kxStop(session_.driverSession, driver::kScopeInterfaceOnly); });
}

void OpenSequence::start() {
  step([&] { return kxStart(session_.driverSession, driver::kScopeNormal); });
}

void OpenSequence::record(int32_t status) {
  status_ = status;
  if (status < 0) session_.recordStatus(status);
}

int32_t OpenSequence::setProperty(uint32_t propertyId, const void* value, uint32_t size) {
  return kxSetProperty(session_.driverSession, propertyId, size, value);
}

int32_t OpenSequence::getProperty(uint32_t propertyId, void* value, uint32_t size) {
  return kxGetProperty(session_.driverSession, propertyId, size, value);
}

}  // namespace nKV_DLL300
