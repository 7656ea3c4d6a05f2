// The bus-interface driver library's C interface, as the module calls it.
//
// Every operation returns a signed 32-bit status: 0 success, negative error, positive warning.
// References are unsigned 32-bit. The library (libtarvix.so) is thread-safe: the service thread and
// every poll thread call it concurrently on their own references.
#pragma once

#include <stdint.h>

#ifdef __cplusplus
extern "C" {
#endif

typedef int32_t kxStatus;
typedef uint32_t kxRef;

// Sessions.
kxStatus kxCreateSession(const char* databaseName, const char* clusterName, const char* frameList,
                         const char* interfaceName, uint32_t mode, kxRef* outSession);
kxStatus kxSetProperty(kxRef ref, uint32_t propertyId, uint32_t size, const void* value);
kxStatus kxGetProperty(kxRef ref, uint32_t propertyId, uint32_t size, void* value);
kxStatus kxStart(kxRef session, uint32_t scope);
kxStatus kxStop(kxRef session, uint32_t scope);
kxStatus kxReadFrame(kxRef session, void* buffer, uint32_t bufferSize, double timeoutSeconds,
                     uint32_t* outBytesRead);
kxStatus kxWriteFrame(kxRef session, const void* frame, uint32_t size, double timeoutSeconds);
kxStatus kxWait(kxRef session, uint32_t condition, uint32_t parameter, double timeoutSeconds,
                uint32_t* outParameter);
kxStatus kxReadState(kxRef session, uint32_t stateId, uint32_t size, void* outState,
                     uint32_t* outFaultCode);
kxStatus kxClear(kxRef ref);

// The system object: devices, interfaces and version values.
kxStatus kxSystemOpen(kxRef* outSystem);
kxStatus kxSystemClose(kxRef system);

// In-memory databases for the transmit frame.
kxStatus kxdbOpenDatabase(const char* name, kxRef* outDatabase);
kxStatus kxdbCreateObject(kxRef parent, uint32_t objectClass, const char* name, kxRef* outObject);
kxStatus kxdbSetProperty(kxRef object, uint32_t propertyId, uint32_t size, const void* value);
kxStatus kxdbCloseDatabase(kxRef database, uint32_t closeAll);

#ifdef __cplusplus
}
#endif
