// Opening and closing a bus session's log file.
#pragma once

#include <string_view>

#include "logging/SessionLog.h"

namespace nKV_DLL300 {

// Called by the poll loop once per run, before its first read, when logFileEnabled is set.
// Names the file (logFileName + LogFileExtension(logFileType)) in the service directory and opens
// it for the log type the settings hold now:
//   0 text     truncated ("w"), then `headerLine` and a line feed
//   1 binary   truncated ("w+b"), then the 12-byte file header
//   2 measurement data: the library file and channel of OpenVoraLog (logging/VoraLog.h)
// Failures are reported at once and the session goes on: a name or directory failure reports
// -20 and the open that follows fails and reports -20 again (two reports); an open failure -20;
// a header not written whole -21 (the file stays open). A file that another session's log has open
// (LogNameRegistry) is not opened: -20 once, for every log type, and the other log stays as it is.
// The file stays claimed while it is open; a failed open releases it at once. The header line is
// used by type 0 only.
// Poll thread. Never throws.
void OpenLogFile(SessionLog& log, std::string_view headerLine);

// Called by the session's stop, every time, after the poll thread has ended: closes what the run
// opened, if anything, releases its file for other sessions, and reports nothing unless buffered
// lines could not be written (-21).
// Stopping thread. Never throws.
void CloseLogFile(SessionLog& log);

}  // namespace nKV_DLL300
