// The per-bus writers: frame selection over a batch, then text lines or binary records.
#include "logging/LogWriters.h"

#include <cstring>

#include "driver/RawFrame.h"
#include "hostlink/HostConnection.h"
#include "hostlink/LinkedSession.h"
#include "logging/BinaryLogFormat.h"
#include "logging/FrameSelection.h"
#include "logging/LogFileName.h"
#include "logging/TextLogFormat.h"
#include "logging/VoraLog.h"

namespace nKV_DLL300 {

namespace {

// Settings a batch is written with; a batch is read at one moment, so they are read once for it.
// The checksum column is the one the log was opened with.
struct BatchSettings {
  uint8_t logTransmittedFrames;
  uint8_t logChecksum;
};

BatchSettings ReadBatchSettings(const SessionLog& log) {
  const SessionSettings& settings = log.session().connection->settings;
  return {settings.logTransmittedFrames.load(), log.linChecksum()};
}

// Calls `write` for each of at most `frames` frames of the batch that the selection accepts.
// Rejected frames are stepped over all the same.
template <class Write>
void ForEachLoggedFrame(const uint8_t* batch, uint32_t bytes, uint32_t frames,
                        uint8_t logTransmitted, Write&& write) {
  driver::RawFrameWalker walker(batch, bytes);
  driver::RawFrameView frame;
  for (uint32_t i = 0; i < frames && walker.next(frame); ++i) {
    if (IsFrameLogged(frame.header, logTransmitted)) write(frame);
  }
}

size_t FormatLine(driver::BusKind bus, char* out, const driver::RawFrameView& frame,
                  uint8_t logChecksum) {
  switch (bus) {
    case driver::BusKind::kCan:
      return FormatCanTextLine(out, SessionLog::kBatchLineRoom, frame);
    case driver::BusKind::kLin:
      return FormatLinTextLine(out, SessionLog::kBatchLineRoom, frame, logChecksum);
    case driver::BusKind::kFlexRay:
      return FormatFlexRayTextLine(out, SessionLog::kBatchLineRoom, frame);
    case driver::BusKind::kNone:
      break;
  }
  return 0;
}

void WriteTextLines(SessionLog& log, driver::BusKind bus, const uint8_t* batch, uint32_t bytes,
                    uint32_t frames) {
  const BatchSettings settings = ReadBatchSettings(log);
  ForEachLoggedFrame(batch, bytes, frames, settings.logTransmittedFrames,
                     [&](const driver::RawFrameView& frame) {
                       char* line = log.batchSpace(SessionLog::kBatchLineRoom);
                       log.batchAppended(FormatLine(bus, line, frame, settings.logChecksum));
                     });
  log.endBatch();
}

BinaryRecordLayout RecordLayout(const SessionLog& log, driver::BusKind bus) {
  switch (bus) {
    case driver::BusKind::kCan:
      return log.canLayout();
    case driver::BusKind::kLin:
      return BinaryRecordLayout::kFixed24;
    case driver::BusKind::kFlexRay:
      return BinaryRecordLayout::kFlexRayVariable;
    case driver::BusKind::kNone:
      break;
  }
  return BinaryRecordLayout::kFixed24;
}

// A record is the frame's first bytes in the read buffer, never more than the frame occupies
// there, so it is copied straight from the batch.
void WriteRecords(SessionLog& log, driver::BusKind bus, const uint8_t* batch, uint32_t bytes,
                  uint32_t frames) {
  const BatchSettings settings = ReadBatchSettings(log);
  const BinaryRecordLayout layout = RecordLayout(log, bus);
  ForEachLoggedFrame(batch, bytes, frames, settings.logTransmittedFrames,
                     [&](const driver::RawFrameView& frame) {
                       const uint8_t* record = frame.payload - driver::kRawFrameHeaderSize;
                       const size_t size = BinaryRecordSize(layout, frame.header);
                       std::memcpy(log.batchSpace(size), record, size);
                       log.batchAppended(size);
                     });
  log.endBatch();
}

void WriteBatch(SessionLog& log, driver::BusKind bus, const uint8_t* batch, uint32_t bytes,
                uint32_t frames) {
  if (bytes == 0 || frames == 0) return;
  switch (log.openedType()) {
    case kLogTypeText:
      if (log.isOpen()) WriteTextLines(log, bus, batch, bytes, frames);
      break;
    case kLogTypeBinary:
      if (log.isOpen()) WriteRecords(log, bus, batch, bytes, frames);
      break;
    case kLogTypeMeasurementData:
      WriteVoraRecords(log, RecordLayout(log, bus), batch, bytes, frames);
      break;
    default:
      break;
  }
}

}  // namespace

void WriteCanLog(SessionLog& log, const uint8_t* batch, uint32_t bytes, uint32_t frames) {
  WriteBatch(log, driver::BusKind::kCan, batch, bytes, frames);
}

void WriteLinLog(SessionLog& log, const uint8_t* batch, uint32_t bytes, uint32_t frames) {
  WriteBatch(log, driver::BusKind::kLin, batch, bytes, frames);
}

void WriteFlexRayLog(SessionLog& log, const uint8_t* batch, uint32_t bytes, uint32_t frames) {
  WriteBatch(log, driver::BusKind::kFlexRay, batch, bytes, frames);
}

}  // namespace nKV_DLL300
