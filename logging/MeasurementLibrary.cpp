// Locating, loading and unloading vora.dll, and its entry points behind the loaded test.
#include "logging/MeasurementLibrary.h"

#include <algorithm>
#include <cctype>
#include <cstring>
#include <optional>
#include <string_view>

#include "platform/Environment.h"
#include "platform/Registry.h"

namespace nKV_DLL300 {

namespace {

constexpr char kLibraryFile[] = "vora.dll";
constexpr char kDefaultDirectory[] = "C:\\Program Files\\Quovera\\Shared\\vora\\";
constexpr char kInstallerKey[] = "SOFTWARE\\Quovera\\Common\\Installer";
constexpr char kSharedDirectoryValue[] = "QVSHAREDDIR";
constexpr char kLibrarySubdirectory[] = "\\vora\\";
constexpr uint32_t kKeyQueryValue = 0x0001;
// The registry value is read into a buffer of the runtime's path size; a longer value is a failed
// read and gives the default directory.
constexpr uint32_t kPathBufferSize = 260;
constexpr std::string_view kRealTimeKernel = "PHARLAP";  // upper case

bool StartsWithIgnoringCase(const std::string& text, std::string_view prefix) {
  if (text.size() < prefix.size()) return false;
  for (size_t i = 0; i < prefix.size(); ++i) {
    if (std::toupper(static_cast<unsigned char>(text[i])) != prefix[i]) return false;
  }
  return true;
}

int32_t DetectPlatform() {
  const std::optional<std::string> os = platform::GetEnvironmentVariable("OS");
  return os && StartsWithIgnoringCase(*os, kRealTimeKernel) ? kVorPlatformRealTime
                                                            : kVorPlatformDesktop;
}

// QVSHAREDDIR + "\vora\", or "" when the key or the value is missing or cannot be read. A value
// that is present but empty still gets "\vora\" (so the file is looked for in \vora\ of the drive).
std::string RegistryDirectory() {
  platform::HKEY key = nullptr;
  if (platform::RegOpenKeyExA(platform::HKEY_LOCAL_MACHINE, kInstallerKey, 0, kKeyQueryValue,
                              &key) != platform::ERROR_SUCCESS) {
    return {};
  }
  char value[kPathBufferSize] = {};
  uint32_t size = sizeof value;
  uint32_t type = 0;
  std::string directory;
  if (platform::RegQueryValueExA(key, kSharedDirectoryValue, nullptr, &type,
                                 reinterpret_cast<uint8_t*>(value),
                                 &size) == platform::ERROR_SUCCESS) {
    directory.assign(value, std::find(value, value + sizeof value, '\0'));
    directory += kLibrarySubdirectory;
  }
  platform::RegCloseKey(key);
  return directory;
}

}  // namespace

MeasurementLibrary::~MeasurementLibrary() {
  if (module_ != nullptr) (void)platform::FreeLibrary(module_);
}

void MeasurementLibrary::locate() {
  std::lock_guard<std::mutex> guard(lock_);
  if (platformCode_ < 0) platformCode_ = DetectPlatform();
  if (platformCode_ == kVorPlatformRealTime) {
    path_ = kLibraryFile;
    return;
  }
  path_ = RegistryDirectory();
  if (path_.empty()) path_ = kDefaultDirectory;
  path_ += kLibraryFile;
}

void MeasurementLibrary::load() {
  std::lock_guard<std::mutex> guard(lock_);
  if (module_ != nullptr) return;
  // Not located (a program that never ran the module's start-up): nothing to load.
  if (path_.empty()) throw vorException{kVorLibraryNotLoaded};
  module_ = platform::LoadLibraryA(path_.c_str());
  if (module_ == nullptr) throw vorException{kVorLibraryNotLoaded};
  try {
    resolveEntryPoints();
  } catch (const vorException&) {
    (void)platform::FreeLibrary(module_);
    module_ = nullptr;
    throw;
  }
  loaded_.store(true, std::memory_order_release);
}

void MeasurementLibrary::unload() {
  std::lock_guard<std::mutex> guard(lock_);
  if (module_ == nullptr) return;
  if (!platform::FreeLibrary(module_)) throw vorException{kVorLibraryNotUnloaded};
  module_ = nullptr;
  loaded_.store(false, std::memory_order_release);
}

std::string MeasurementLibrary::path() const {
  std::lock_guard<std::mutex> guard(lock_);
  return path_;
}

int32_t MeasurementLibrary::platformCode() const {
  std::lock_guard<std::mutex> guard(lock_);
  return platformCode_;
}

template <typename Fn>
Fn MeasurementLibrary::resolve(const char* name) const {
  const platform::FARPROC address = platform::GetProcAddress(module_, name);
  if (address == nullptr) throw vorException{kVorLibraryNotLoaded};
  return reinterpret_cast<Fn>(address);
}

// Only the entry points the logging calls are resolved; the library is told the platform as
// soon as it can be.
void MeasurementLibrary::resolveEntryPoints() {
  table_.setOS = resolve<VorSetOSFn>("VorSetOS");
  (void)table_.setOS(platformCode_);
  table_.fileOpenExA = resolve<VorFileOpenExAFn>("VorFileOpenExA");
  table_.objCreateA = resolve<VorObjCreateAFn>("VorObjCreateA");
  table_.propSetA = resolve<VorPropSetAFn>("VorPropSetA");
  table_.objRawSet = resolve<VorObjRawSetFn>("VorObjRawSet");
  table_.fileBufFlush = resolve<VorFileBufFlushFn>("VorFileBufFlush");
  table_.fileClose = resolve<VorFileCloseFn>("VorFileClose");
}

const MeasurementLibrary::EntryPoints& MeasurementLibrary::table() const {
  if (!loaded_.load(std::memory_order_acquire)) throw vorException{kVorLibraryNotLoaded};
  return table_;
}

int32_t MeasurementLibrary::FileOpenExA(const char* path, int32_t openMode, int32_t access,
                                        int32_t revision, int32_t* fileHandle) const {
  return table().fileOpenExA(path, openMode, access, revision, fileHandle);
}

int32_t MeasurementLibrary::ObjCreateA(const char* objectPath, int32_t fileHandle,
                                       int32_t* objectHandle) const {
  return table().objCreateA(objectPath, fileHandle, objectHandle);
}

int32_t MeasurementLibrary::PropSetA(const char* name, int32_t dataType, const void* value,
                                     int32_t fileHandle, int32_t objectHandle) const {
  return table().propSetA(name, dataType, value, fileHandle, objectHandle);
}

int32_t MeasurementLibrary::ObjRawSet(int32_t dataType, uint32_t byteCount, const void* bytes,
                                      int32_t fileHandle, int32_t objectHandle) const {
  return table().objRawSet(dataType, byteCount, bytes, fileHandle, objectHandle);
}

int32_t MeasurementLibrary::FileBufFlush(int32_t scope, int32_t fileHandle) const {
  return table().fileBufFlush(scope, fileHandle);
}

int32_t MeasurementLibrary::FileClose(int32_t fileHandle) const {
  return table().fileClose(fileHandle);
}

// Never destroyed: the module unloads the library explicitly after its service has stopped, and
// a destructor run by the static teardown would come before that.
MeasurementLibrary& TheMeasurementLibrary() {
  static MeasurementLibrary* const library = new MeasurementLibrary;
  return *library;
}

void LocateMeasurementLibrary() { TheMeasurementLibrary().locate(); }
void LoadMeasurementLibrary() { TheMeasurementLibrary().load(); }
void UnloadMeasurementLibrary() { TheMeasurementLibrary().unload(); }

}  // namespace nKV_DLL300
