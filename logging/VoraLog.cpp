// Opening, writing and closing a session's measurement-data file through vora.dll.
#include "logging/VoraLog.h"

#include <exception>
#include <iterator>

#include "driver/RawFrame.h"
#include "hostlink/HostConnection.h"
#include "hostlink/LinkedSession.h"
#include "logging/FrameSelection.h"
#include "logging/MeasurementLibrary.h"
#include "vora/VoraApi.h"

namespace nKV_DLL300 {

namespace {

// What the logging passes to the library: a new run replaces a file of the same name, as the text
// and binary logs do; 32-bit integer properties; raw bytes; a flush of data and structure.
constexpr int32_t kOpenMode = kVorCreateOrReplace;
constexpr int32_t kOpenAccess = kVorAccessReadWrite;
constexpr int32_t kPropertyType = kVorTypeInt32;
constexpr int32_t kRawType = kVorTypeUInt8;
constexpr int32_t kFlushScope = kVorFlushAll;
static_assert(kOpenMode == 2 && kOpenAccess == 2 && kVorApiRevision == 4713);
static_assert(kPropertyType == 3 && kRawType == 5 && kFlushScope == 3);

void CreateChannel(SessionLog& log, const MeasurementLibrary& library) {
  const SessionSettings& settings = log.session().connection->settings;
  const std::string channelPath =
      VoraChannelPath(settings.voraGroupName.get(), settings.voraChannelName.get());
  log.voraChannel = kVorNoHandle;
  (void)library.ObjCreateA(channelPath.c_str(), log.voraFile, &log.voraChannel);
  // The protocol follows the bus the session reads, which is what the records are.
  const int32_t values[] = {kVoraByteOrderLittleEndian, kVoraFrameVersion,
                            VoraNetworkProtocol(log.session().busType)};
  const char* const names[] = {kVoraPropertyByteOrder, kVoraPropertyVersion, kVoraPropertyProtocol};
  static_assert(std::size(values) == std::size(names));
  for (size_t i = 0; i < std::size(names); ++i) {
    (void)library.PropSetA(names[i], kPropertyType, &values[i], log.voraFile, log.voraChannel);
  }
}

void OpenFileAndChannel(SessionLog& log, const std::string& path) {
  MeasurementLibrary& library = TheMeasurementLibrary();
  library.load();
  log.voraFile = kVorNoHandle;
  (void)library.FileOpenExA(path.c_str(), kOpenMode, kOpenAccess, kVorApiRevision, &log.voraFile);
  if (log.voraFile == kVorNoHandle) return;
  CreateChannel(log, library);
}

void AppendRecords(SessionLog& log, BinaryRecordLayout layout, const uint8_t* batch, uint32_t bytes,
                   uint32_t frames) {
  const MeasurementLibrary& library = TheMeasurementLibrary();
  const uint8_t logTransmitted = log.session().connection->settings.logTransmittedFrames.load();
  driver::RawFrameWalker walker(batch, bytes);
  driver::RawFrameView frame;
  for (uint32_t i = 0; i < frames && walker.next(frame); ++i) {
    if (!IsFrameLogged(frame.header, logTransmitted)) continue;
    // The record is the frame's first bytes in the read buffer, never more than the frame takes.
    const uint8_t* record = frame.payload - driver::kRawFrameHeaderSize;
    (void)library.ObjRawSet(kRawType, BinaryRecordSize(layout, frame.header), record, log.voraFile,
                            log.voraChannel);
  }
}

// Runs `step`; any failure of it is logging error -24. Library failures are vorExceptions; a
// string that cannot be allocated is treated alike, as the writers never throw.
template <typename Step>
void Guarded(SessionLog& log, Step&& step) {
  try {
    step();
  } catch (const vorException&) {
    log.fail(kLogLibraryFailed);
  } catch (const std::exception&) {
    log.fail(kLogLibraryFailed);
  }
}

}  // namespace

std::string VoraChannelPath(std::string_view group, std::string_view channel) {
  std::string path = "/'";
  path.append(group).append("'/'").append(channel).append("'");
  return path;
}

int32_t VoraNetworkProtocol(driver::BusKind bus) {
  return static_cast<int32_t>(driver::ProtocolOfBus(bus));
}

void OpenVoraLog(SessionLog& log, const std::string& path) {
  Guarded(log, [&] { OpenFileAndChannel(log, path); });
}

void WriteVoraRecords(SessionLog& log, BinaryRecordLayout layout, const uint8_t* batch,
                      uint32_t bytes, uint32_t frames) {
  if (log.voraFile == kVorNoHandle || bytes == 0) return;
  Guarded(log, [&] { AppendRecords(log, layout, batch, bytes, frames); });
}

void CloseVoraLog(SessionLog& log) {
  if (log.voraFile == kVorNoHandle) return;
  // The handle is given up even when the close fails: a later run must never write through a
  // handle the library may since have given to another session's file.
  const int32_t file = log.voraFile;
  log.voraFile = kVorNoHandle;
  Guarded(log, [&] {
    const MeasurementLibrary& library = TheMeasurementLibrary();
    (void)library.FileBufFlush(kFlushScope, file);
    (void)library.FileClose(file);
  });
}

}  // namespace nKV_DLL300
