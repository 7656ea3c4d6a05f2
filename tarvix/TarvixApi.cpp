// The driver's C interface (driver/tarvix.h): each call is checked against injected faults,
// recorded when recording is on, and handed to the simulator.
#include <algorithm>
#include <cstring>
#include <utility>

#include "driver/Status.h"
#include "driver/tarvix.h"
#include "tarvix/CallLog.h"
#include "tarvix/Simulator.h"

namespace tarvix {
namespace {

constexpr size_t kMaxRecordedBytes = 256;

std::string Text(const char* s) { return s ? std::string(s) : std::string(); }

void Keep(CallRecord& call, const void* data, uint32_t size) {
  if (data == nullptr) return;
  const auto* bytes = static_cast<const uint8_t*>(data);
  call.value.assign(bytes, bytes + std::min<size_t>(size, kMaxRecordedBytes));
}

// Runs `body` unless a fault is injected for this call; records the call when recording is on.
// `after` fills the record's outputs once the call has run.
template <typename Body, typename After>
kxStatus Run(CallRecord call, uint32_t interfaceRef, Body&& body, After&& after) {
  CallLog& log = CallLog::Instance();
  if (!log.active()) return body();
  if (call.interfaceName.empty())
    call.interfaceName = Simulator::Instance().interfaceOf(interfaceRef);
  const std::optional<int32_t> injected = log.injected(call.operation, call.interfaceName);
  call.status = injected ? *injected : body();
  after(call);
  const kxStatus status = call.status;
  log.record(std::move(call));
  return status;
}

template <typename Body>
kxStatus Run(CallRecord call, uint32_t interfaceRef, Body&& body) {
  return Run(std::move(call), interfaceRef, std::forward<Body>(body), [](CallRecord&) {});
}

CallRecord Call(const char* operation, uint32_t ref, uint32_t id = 0, uint32_t size = 0) {
  CallRecord c;
  c.operation = operation;
  c.reference = ref;
  c.id = id;
  c.size = size;
  return c;
}

std::shared_ptr<DriverSession> SessionOf(kxRef ref, kxStatus& status) {
  auto s = Simulator::Instance().session(ref);
  if (s == nullptr) status = Simulator::Instance().notASession(ref);
  return s;
}

}  // namespace
}  // namespace tarvix

using tarvix::Call;
using tarvix::CallRecord;
using tarvix::Run;
using tarvix::Simulator;

extern "C" {

kxStatus kxCreateSession(const char* databaseName, const char* clusterName, const char* frameList,
                         const char* interfaceName, uint32_t mode, kxRef* outSession) {
  CallRecord c = Call("kxCreateSession", 0, mode);
  c.texts = {tarvix::Text(databaseName), tarvix::Text(clusterName), tarvix::Text(frameList),
             tarvix::Text(interfaceName)};
  const std::string& name = c.texts[3];
  c.interfaceName = name.substr(0, name.find('@'));
  return Run(
      std::move(c), 0,
      [&] {
        if (outSession == nullptr) return driver::kBufferMissing;
        return Simulator::Instance().createSession(databaseName, clusterName, frameList,
                                                   interfaceName, mode, *outSession);
      },
      [&](CallRecord& r) { r.result = r.status == 0 && outSession ? *outSession : 0; });
}

kxStatus kxSetProperty(kxRef ref, uint32_t propertyId, uint32_t size, const void* value) {
  return Run(
      Call("kxSetProperty", ref, propertyId, size), ref,
      [&] { return Simulator::Instance().setProperty(ref, propertyId, size, value); },
      [&](CallRecord& r) { tarvix::Keep(r, value, size); });
}

kxStatus kxGetProperty(kxRef ref, uint32_t propertyId, uint32_t size, void* value) {
  return Run(
      Call("kxGetProperty", ref, propertyId, size), ref,
      [&] { return Simulator::Instance().getProperty(ref, propertyId, size, value); },
      [&](CallRecord& r) {
        if (r.status == 0) tarvix::Keep(r, value, size);
      });
}

kxStatus kxStart(kxRef session, uint32_t scope) {
  return Run(Call("kxStart", session, scope), session, [&] {
    kxStatus st = 0;
    auto s = tarvix::SessionOf(session, st);
    return s ? s->start(scope) : st;
  });
}

kxStatus kxStop(kxRef session, uint32_t scope) {
  return Run(Call("kxStop", session, scope), session, [&] {
    kxStatus st = 0;
    auto s = tarvix::SessionOf(session, st);
    return s ? s->stop(scope) : st;
  });
}

kxStatus kxReadFrame(kxRef session, void* buffer, uint32_t bufferSize, double timeoutSeconds,
                     uint32_t* outBytesRead) {
  CallRecord c = Call("kxReadFrame", session, 0, bufferSize);
  c.timeout = timeoutSeconds;
  return Run(
      std::move(c), session,
      [&] {
        kxStatus st = 0;
        auto s = tarvix::SessionOf(session, st);
        if (s == nullptr && outBytesRead != nullptr) *outBytesRead = 0;
        return s ? s->read(buffer, bufferSize, timeoutSeconds, outBytesRead) : st;
      },
      [&](CallRecord& r) {
        r.result = outBytesRead ? *outBytesRead : 0;
        tarvix::Keep(r, buffer, r.result);
      });
}

kxStatus kxWriteFrame(kxRef session, const void* frame, uint32_t size, double timeoutSeconds) {
  CallRecord c = Call("kxWriteFrame", session, 0, size);
  c.timeout = timeoutSeconds;
  return Run(
      std::move(c), session,
      [&] {
        kxStatus st = 0;
        auto s = tarvix::SessionOf(session, st);
        return s ? s->write(frame, size, timeoutSeconds) : st;
      },
      [&](CallRecord& r) { tarvix::Keep(r, frame, size); });
}

kxStatus kxWait(kxRef session, uint32_t condition, uint32_t parameter, double timeoutSeconds,
                uint32_t* outParameter) {
  CallRecord c = Call("kxWait", session, condition, parameter);
  c.timeout = timeoutSeconds;
  return Run(std::move(c), session, [&] {
    kxStatus st = 0;
    auto s = tarvix::SessionOf(session, st);
    if (s == nullptr) return st;
    st = s->wait(condition, timeoutSeconds);
    if (outParameter != nullptr) *outParameter = 0;
    return st;
  });
}

kxStatus kxReadState(kxRef session, uint32_t stateId, uint32_t size, void* outState,
                     uint32_t* outFaultCode) {
  return Run(
      Call("kxReadState", session, stateId, size), session,
      [&] {
        kxStatus st = 0;
        auto s = tarvix::SessionOf(session, st);
        return s ? s->readState(stateId, size, outState, outFaultCode) : st;
      },
      [&](CallRecord& r) {
        if (r.status == 0) tarvix::Keep(r, outState, size);
      });
}

kxStatus kxClear(kxRef ref) {
  return Run(Call("kxClear", ref), ref, [&] { return Simulator::Instance().clear(ref); });
}

kxStatus kxSystemOpen(kxRef* outSystem) {
  return Run(
      Call("kxSystemOpen", 0), 0,
      [&] {
        return outSystem ? Simulator::Instance().systemOpen(*outSystem) : driver::kBufferMissing;
      },
      [&](CallRecord& r) { r.result = r.status == 0 && outSystem ? *outSystem : 0; });
}

kxStatus kxSystemClose(kxRef system) {
  return Run(Call("kxSystemClose", system), system,
             [&] { return Simulator::Instance().systemClose(system); });
}

kxStatus kxdbOpenDatabase(const char* name, kxRef* outDatabase) {
  CallRecord c = Call("kxdbOpenDatabase", 0);
  c.texts = {tarvix::Text(name)};
  return Run(
      std::move(c), 0,
      [&] {
        return outDatabase ? Simulator::Instance().dbOpen(name, *outDatabase)
                           : driver::kBufferMissing;
      },
      [&](CallRecord& r) { r.result = r.status == 0 && outDatabase ? *outDatabase : 0; });
}

kxStatus kxdbCreateObject(kxRef parent, uint32_t objectClass, const char* name, kxRef* outObject) {
  CallRecord c = Call("kxdbCreateObject", parent, objectClass);
  c.texts = {tarvix::Text(name)};
  return Run(
      std::move(c), 0,
      [&] {
        return outObject
                   ? Simulator::Instance().dbCreateObject(parent, objectClass, name, *outObject)
                   : driver::kBufferMissing;
      },
      [&](CallRecord& r) { r.result = r.status == 0 && outObject ? *outObject : 0; });
}

kxStatus kxdbSetProperty(kxRef object, uint32_t propertyId, uint32_t size, const void* value) {
  return Run(
      Call("kxdbSetProperty", object, propertyId, size), 0,
      [&] { return Simulator::Instance().dbSetProperty(object, propertyId, size, value); },
      [&](CallRecord& r) { tarvix::Keep(r, value, size); });
}

kxStatus kxdbCloseDatabase(kxRef database, uint32_t closeAll) {
  return Run(Call("kxdbCloseDatabase", database, closeAll), 0,
             [&] { return Simulator::Instance().dbClose(database, closeAll); });
}

}  // extern "C"
