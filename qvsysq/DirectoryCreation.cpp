// Directory creation: one level with its report, and the climb up and down a missing chain.
#include "qvsysq/DirectoryCreation.h"

#include <cerrno>
#include <cstring>
#include <new>
#include <string>
#include <vector>

#include "errors/RaiseSites.h"
#include "errors/ReportCursor.h"
#include "platform/FileSystem.h"

namespace qvsysq {

namespace {

struct FailureRow {
  int32_t code;
  const char* constant;
  int32_t line;
  const char* description;
};

FailureRow rowFor(int errorNumber) {
  if (errorNumber == EEXIST) {
    return {qvapalerr_objectNameCollision, "qvapalerr_objectNameCollision", kLineCollision,
            "path exist but not a dir"};
  }
  if (errorNumber == ENOENT) {
    return {qvapalerr_resourceNotFound, "qvapalerr_resourceNotFound", kLineParentMissing,
            "parent not found"};
  }
  return {qvapalerr_osFault, "qvapalerr_osFault", kLineMkdirFailed, "mkdir failed"};
}

void reportFailure(const char* path, qverr::Status& status, int errorNumber) {
  const FailureRow row = rowFor(errorNumber);
  if (!qverr::setError(status, row.code,
                       {kDirectorySource, row.line, qverr::kComponentName, row.constant})) {
    return;
  }
  const std::string text = platform::ErrorText(errorNumber);
  qverr::ReportCursor cursor(status);
  cursor.openObject("internal_error");
  cursor.addString("api", "errno");
  cursor.addInteger("code", errorNumber);
  cursor.addString("string", text.c_str());
  cursor.closeObject();
  cursor.openObject("qvsysq_debug");
  cursor.addString("desc", row.description);
  if (errorNumber == EEXIST) cursor.addString("path", path);
  cursor.closeObject();
}

void setOutOfMemory(qverr::Status& status) {
  qverr::setError(status, qvapalerr_memoryFull,
                  {qverr::kAllocatorFile, qverr::kLineAllocator, qverr::kComponentName,
                   "qvapalerr_memoryFull"});
}

// Climbs while parents are missing, then creates the remembered levels downwards.
void climbAndCreate(std::vector<char>& path, qverr::Status& result, bool* existed) {
  qverr::Status level;
  bool found = true;
  makeOneDirectory(path.data(), level, &found);
  std::vector<size_t> cuts;  // positions of the backslashes replaced by NUL, leaf first
  while (level.code < 0) {
    size_t slash = std::strlen(path.data());
    while (slash > 0 && path[slash - 1] != '\\') --slash;
    if (level.code != qvapalerr_resourceNotFound || slash == 0) {
      qverr::copyStatus(result, level);
      return;
    }
    const size_t cut = slash - 1;
    cuts.push_back(cut);
    path[cut] = '\0';
    level.code = 0;
    qverr::setReportText(level, nullptr);
    makeOneDirectory(path.data(), level, &found);
  }
  if (existed != nullptr) *existed = *existed && found;
  for (auto cut = cuts.rbegin(); cut != cuts.rend() && result.code >= 0; ++cut) {
    path[*cut] = '\\';
    makeOneDirectory(path.data(), result, &found);
  }
}

}  // namespace

void makeOneDirectory(const char* path, qverr::Status& status, bool* existed) {
  if (status.code < 0) return;
  const std::string runtimePath = path != nullptr ? path : "";
  const int errorNumber = platform::MakeDirectory(runtimePath);
  if (errorNumber == 0) {
    if (existed != nullptr) *existed = false;
    return;
  }
  // Settled: attributes that cannot be read after EEXIST count as a collision, not a directory.
  if (errorNumber == EEXIST) {
    const uint32_t attributes = platform::GetFileAttributes(runtimePath);
    if (attributes != platform::kInvalidFileAttributes &&
        (attributes & platform::kFileAttributeDirectory) != 0) {
      if (existed != nullptr) *existed = true;
      return;
    }
  }
  reportFailure(runtimePath.c_str(), status, errorNumber);
}

void createDirectories(const char* path, bool* existed) {
  qverr::Status result;
  try {
    const char* text = path != nullptr ? path : "";
    std::vector<char> buffer(text, text + std::strlen(text) + 1);
    if (existed != nullptr) *existed = true;
    climbAndCreate(buffer, result, existed);
  } catch (const std::bad_alloc&) {
    setOutOfMemory(result);
  }
  qverr::checkStatus(result);
}

}  // namespace qvsysq
