// Log file names: extensions, the plain-name rule and the path in the service directory.
#include "logging/LogFileName.h"

#include <stdexcept>

#include "errors/RaiseSites.h"
#include "errors/cExceptionBase.h"
#include "paths/StandardPaths.h"
#include "qvsysq/cSysqWrapper.h"

namespace nKV_DLL300 {

std::string LogFileExtension(uint32_t logType) {
  switch (logType) {
    case kLogTypeText:
      return ".txt";
    case kLogTypeBinary:
      return ".zfl";
    case kLogTypeMeasurementData:
      return ".vora";
    default:
      throw nENSPAN000::cExceptionBase(nENSPAN000::ErrorKind::UsageError, nENSPAN000::kLogModule,
                                       nENSPAN000::kLogFile, nENSPAN000::kLineBadLogType);
  }
}

bool IsPlainFileName(const std::string& name) {
  if (name == "." || name == "..") return false;
  return name.find_first_of(std::string("/\\\0", 3)) == std::string::npos;
}

std::string LogFilePath(const std::string& logFileName, uint32_t logType) {
  const std::string fileName = logFileName + LogFileExtension(logType);
  // The extension keeps "." and ".." from standing alone; the name is checked by itself so that
  // the rule does not depend on what the extension happens to be.
  if (!IsPlainFileName(logFileName) || !IsPlainFileName(fileName)) {
    throw std::invalid_argument("log file name is not a plain file name");
  }
  kxpath::cSysqWrapper system;
  kxpath::cPath directory = kxpath::getStandardPath(kxpath::kServiceLogPathId, system);
  return directory.appendLocal(fileName).getLocal();
}

}  // namespace nKV_DLL300
