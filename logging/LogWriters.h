// The per-bus log writers that a poll loop hands each batch of frames to.
#pragma once

#include <cstdint>

#include "logging/SessionLog.h"

namespace nKV_DLL300 {

// Each writer is called by its bus's poll loop with a batch just read (`bytes` bytes holding
// `frames` frames in the driver's layout) while logFileEnabled is set. It writes, in the format of
// the log type the run opened with, every frame that the frame selection accepts (echo frames only
// with logTransmittedFrames set): one text line each, or one binary record each (for a
// measurement-data log, appended to its channel: WriteVoraRecords). It does nothing when the run
// opened no file. A line or record not written whole stores -21 and reports it, once for that line
// or record; the next one is tried as usual. Nothing is read outside the
// batch, whatever `frames` says. Poll thread. Never throws.
void WriteCanLog(SessionLog& log, const uint8_t* batch, uint32_t bytes, uint32_t frames);
// LIN lines carry the checksum column when logChecksum was set as the log was opened.
void WriteLinLog(SessionLog& log, const uint8_t* batch, uint32_t bytes, uint32_t frames);
void WriteFlexRayLog(SessionLog& log, const uint8_t* batch, uint32_t bytes, uint32_t frames);

}  // namespace nKV_DLL300
