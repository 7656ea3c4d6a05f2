// The driver calls that open the driver session of a bus session, run until one fails.
#pragma once

#include <cstdint>
#include <string>

namespace nKV_DLL300 {

class CBusSystem;

// One open of a CAN, LIN or FlexRay session's driver session. Each step runs only while every
// earlier step succeeded (status >= 0); the first failing status is stored as the session's
// lastStatus and stays the result. Otherwise the result is the status of the last step that ran
// (0 or a warning). Service thread, while no poll thread runs.
class OpenSequence {
 public:
  explicit OpenSequence(CBusSystem& session) : session_(session) {}
  OpenSequence(const OpenSequence&) = delete;
  OpenSequence& operator=(const OpenSequence&) = delete;

  int32_t status() const { return status_; }
  bool failed() const { return status_ < 0; }

  // kxCreateSession of a receive stream on `interfaceName`, into the session's driverSession.
  void create(const char* database, const char* cluster, const std::string& interfaceName);
  // kxStop of the interface only.
  void stopInterface();
  // kxStart of the session.
  void start();
  // Any other driver call of the session, returning its status.
  template <class Call>
  void step(Call call) {
    if (!failed()) record(call());
  }
  // kxSetProperty of `value`, sizeof(T) bytes.
  template <class T>
  void set(uint32_t propertyId, const T& value) {
    step([&] { return setProperty(propertyId, &value, sizeof value); });
  }
  // kxGetProperty into `value`; true when it ran and succeeded.
  template <class T>
  bool get(uint32_t propertyId, T& value) {
    step([&] { return getProperty(propertyId, &value, sizeof value); });
    return !failed();
  }
  // The same calls when their status does not count: it is neither stored nor the result.
  template <class T>
  void setIgnoringStatus(uint32_t propertyId, const T& value) {
    if (!failed()) (void)setProperty(propertyId, &value, sizeof value);
  }
  template <class T>
  void getIgnoringStatus(uint32_t propertyId, T& value) {
    if (!failed()) (void)getProperty(propertyId, &value, sizeof value);
  }

 private:
  void record(int32_t status);
  int32_t setProperty(uint32_t propertyId, const void* value, uint32_t size);
  int32_t getProperty(uint32_t propertyId, void* value, uint32_t size);

  CBusSystem& session_;
  int32_t status_ = 0;
};

}  // namespace nKV_DLL300
