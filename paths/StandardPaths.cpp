// The table of standard directories: base query, components, and whether it is created.
#include "paths/StandardPaths.h"

#include "errors/RaiseSites.h"
#include "errors/cExceptionBase.h"

namespace kxpath {

namespace {

enum class Base { Shared, Data, ErrorFiles, Temp };

struct StandardDirectory {
  Base base;
  const char* components[2];  // null marks an unused slot
  bool created;
};

constexpr uint32_t kStandardPathCount = 18;

StandardDirectory directoryFor(uint32_t id) {
  switch (id) {
    case 1:
      return {Base::Shared, {"tarvix", "dbCache"}, false};
    case 2:
    case 15:
      return {Base::Data, {"tarvix", nullptr}, true};
    case 3:
    case 11:
    case 12:
      return {Base::Data, {"tarvix", "log"}, true};
    case 4:
      return {Base::Shared, {"tarvix", "firmware"}, false};
    case 7:
      return {Base::ErrorFiles, {"errors", "English"}, false};
    case 8:
      return {Base::ErrorFiles, {"errors", "German"}, false};
    case 9:
      return {Base::ErrorFiles, {"errors", "French"}, false};
    case 10:
      return {Base::ErrorFiles, {"errors", "Japanese"}, false};
    case 13:
      return {Base::Temp, {"tarvix", nullptr}, false};
    case 16:
    case 17:
      return {Base::Data, {"tarvix", "kelvane"}, true};
    default:
      return {Base::Shared, {"tarvix", nullptr}, false};  // 0, 5, 6, 14
  }
}

std::string baseText(Base base, cSysqWrapper& wrapper) {
  switch (base) {
    case Base::Data:
      return wrapper.getDataDir(0);
    case Base::ErrorFiles:
      return wrapper.getErrorFilesDir();
    case Base::Temp:
      return wrapper.getTempDir();
    default:
      return wrapper.getSharedDir();
  }
}

}  // namespace

cPath getStandardPath(int32_t id, cSysqWrapper& wrapper) {
  try {
    if (static_cast<uint32_t>(id) >= kStandardPathCount) {
      throw nENSPAN000::cExceptionBase(nENSPAN000::ErrorKind::UsageError, nENSPAN000::kPathModule,
                                       nENSPAN000::kPathFile, nENSPAN000::kLineBadStandardPathId);
    }
    const StandardDirectory directory = directoryFor(static_cast<uint32_t>(id));
    cPath path;
    path.append(baseText(directory.base, wrapper));
    for (const char* component : directory.components) {
      if (component != nullptr) path.append(component);
    }
    if (directory.created) wrapper.createDirectories(path.getUtf8().c_str(), nullptr);
    return path;
  } catch (...) {
    nENSPAN000::translateException();
  }
}

}  // namespace kxpath
