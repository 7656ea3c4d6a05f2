// The log file's life cycle: naming, opening per log type with its header, closing.
#include "logging/LogFile.h"

#include <exception>
#include <string>

#include "hostlink/HostConnection.h"
#include "hostlink/LinkedSession.h"
#include "logging/LogFileName.h"
#include "logging/VoraLog.h"
#include "vora/VoraApi.h"

namespace nKV_DLL300 {

namespace {

// The path of the file, or "" after a reported naming or directory failure.
std::string NameLogFile(SessionLog& log, uint8_t logType) {
  try {
    return LogFilePath(log.session().connection->settings.logFileName.get(), logType);
  } catch (const std::exception&) {
    log.fail(kLogOpenFailed);
    return {};
  }
}

// Opens the stream; an empty path (the naming failed) is not tried and fails as an open would.
bool OpenStream(SessionLog& log, const std::string& path, const char* mode) {
  if (!path.empty() && log.openStream(path, mode)) return true;
  log.fail(kLogOpenFailed);
  return false;
}

void OpenTextLog(SessionLog& log, const std::string& path, std::string_view headerLine) {
  if (!OpenStream(log, path, "w")) return;
  const bool whole = log.write(headerLine.data(), headerLine.size()) && log.write("\n", 1);
  if (!whole) log.fail(kLogWriteIncomplete);
}

void OpenBinaryLog(SessionLog& log, const std::string& path) {
  if (!OpenStream(log, path, "w+b")) return;
  if (!log.write(kBinaryLogFileHeaderBytes.data(), kBinaryLogFileHeaderBytes.size())) {
    log.fail(kLogWriteIncomplete);
  }
}

}  // namespace

void OpenLogFile(SessionLog& log, std::string_view headerLine) {
  const SessionSettings& settings = log.session().connection->settings;
  const uint8_t logType = settings.logFileType.load();
  log.setOpenedType(logType);
  log.setCanLayout(
      CanBinaryRecordLayout(settings.canIoMode.load(), settings.applicationProtocol.load()));
  log.setLinChecksum(settings.logChecksum.load());
  const std::string path = NameLogFile(log, logType);
  if (!path.empty() && !log.claimFile(path)) {
    // Another session logs to this file: it is not opened a second time, and that log stays whole.
    log.fail(kLogOpenFailed);
    return;
  }
  switch (logType) {
    case kLogTypeText:
      OpenTextLog(log, path, headerLine);
      break;
    case kLogTypeBinary:
      OpenBinaryLog(log, path);
      break;
    case kLogTypeMeasurementData:
      OpenVoraLog(log, path);
      break;
    default:
      break;  // named nothing (reported above) and opens nothing
  }
  if (!log.isOpen() && log.voraFile == kVorNoHandle) log.releaseFile();
}

void CloseLogFile(SessionLog& log) {
  switch (log.openedType()) {
    case kLogTypeText:
    case kLogTypeBinary:
      // Lines the stream still buffers are written now; losing them silently would leave a log
      // that looks complete, so a failure here is reported once.
      if (!log.closeStream()) log.fail(kLogWriteIncomplete);
      break;
    case kLogTypeMeasurementData:
      CloseVoraLog(log);
      break;
    default:
      break;
  }
  log.releaseFile();
  log.setOpenedType(-1);
}

}  // namespace nKV_DLL300
