// The fixed answers of the system queries.
#include "qvsysq/SysqWrapper.h"

#include <atomic>

#include "errors/Status.h"

namespace qvsysq {

namespace {

constexpr const char* kRootDir = "C:\\QV-RT";
constexpr const char* kSystemDir = "C:\\QV-RT\\SYSTEM";
constexpr const char* kTempDir = "c:\\temp";

std::atomic<uint32_t> temporaryCounter{0};

std::string answer(const std::string& text) {
  std::string result;
  qverr::Status status;
  if (status.code >= 0) result = text;
  qverr::checkStatus(status);
  return result;
}

}  // namespace

SysqWrapper::~SysqWrapper() = default;

std::string SysqWrapper::getRootDir() { return answer(kRootDir); }
std::string SysqWrapper::getSharedDir() { return answer(kRootDir); }
std::string SysqWrapper::getSystemDir() { return answer(kSystemDir); }
std::string SysqWrapper::getErrorFilesDir() { return answer(kSystemDir); }
std::string SysqWrapper::getTempDir() { return answer(kTempDir); }
std::string SysqWrapper::getDataDir(int32_t) { return answer(kRootDir); }

// The runtime library's temporary-name function is unsafe on this platform; a process-wide
// counter gives names that are unique within the process and never null.
std::string SysqWrapper::getTempFileName() {
  return answer(std::string(kTempDir) + "\\kv" + std::to_string(temporaryCounter.fetch_add(1)) +
                ".tmp");
}

}  // namespace qvsysq
