// The exported entry points of vora.dll, each a thin call into the library object.
#include <type_traits>

#include "vora/VoraApi.h"
#include "vora/VoraLibrary.h"

#define VORA_EXPORT extern "C" __attribute__((visibility("default")))

using vora::VoraLibrary;

VORA_EXPORT int32_t VorSetOS(int32_t platformCode) {
  return VoraLibrary::Instance().SetPlatform(platformCode);
}

VORA_EXPORT int32_t VorSetAPIFlags(uint32_t flags) {
  return VoraLibrary::Instance().SetApiFlags(flags);
}

VORA_EXPORT int32_t VorFileOpenExA(const char* path, int32_t openMode, int32_t access,
                                   int32_t revision, int32_t* fileHandle) {
  return VoraLibrary::Instance().OpenFile(path, openMode, access, revision, fileHandle);
}

VORA_EXPORT int32_t VorObjCreateA(const char* objectPath, int32_t fileHandle,
                                  int32_t* objectHandle) {
  return VoraLibrary::Instance().CreateObject(objectPath, fileHandle, objectHandle);
}

VORA_EXPORT int32_t VorPropSetA(const char* name, int32_t dataType, const void* value,
                                int32_t fileHandle, int32_t objectHandle) {
  return VoraLibrary::Instance().SetProperty(name, dataType, value, fileHandle, objectHandle);
}

VORA_EXPORT int32_t VorObjRawSet(int32_t dataType, uint32_t byteCount, const void* bytes,
                                 int32_t fileHandle, int32_t objectHandle) {
  return VoraLibrary::Instance().AppendRaw(dataType, byteCount, bytes, fileHandle, objectHandle);
}

VORA_EXPORT int32_t VorFileBufFlush(int32_t scope, int32_t fileHandle) {
  return VoraLibrary::Instance().Flush(scope, fileHandle);
}

VORA_EXPORT int32_t VorFileClose(int32_t fileHandle) {
  return VoraLibrary::Instance().CloseFile(fileHandle);
}

// The exports keep the exact types the runtime calls them through.
static_assert(std::is_same_v<decltype(&VorSetOS), VorSetOSFn>);
static_assert(std::is_same_v<decltype(&VorSetAPIFlags), VorSetAPIFlagsFn>);
static_assert(std::is_same_v<decltype(&VorFileOpenExA), VorFileOpenExAFn>);
static_assert(std::is_same_v<decltype(&VorObjCreateA), VorObjCreateAFn>);
static_assert(std::is_same_v<decltype(&VorPropSetA), VorPropSetAFn>);
static_assert(std::is_same_v<decltype(&VorObjRawSet), VorObjRawSetFn>);
static_assert(std::is_same_v<decltype(&VorFileBufFlush), VorFileBufFlushFn>);
static_assert(std::is_same_v<decltype(&VorFileClose), VorFileCloseFn>);
