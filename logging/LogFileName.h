// Log file naming: the extension of each log type and the file's place in the service directory.
#pragma once

#include <cstdint>
#include <string>

namespace nKV_DLL300 {

// Values of the logFileType setting.
inline constexpr uint8_t kLogTypeText = 0;             // ".txt"
inline constexpr uint8_t kLogTypeBinary = 1;           // ".zfl"
inline constexpr uint8_t kLogTypeMeasurementData = 2;  // ".vora"

// The extension of a log type. Any other type throws nENSPAN000::cExceptionBase (a usage error of
// the log module), which the log opening turns into -20.
std::string LogFileExtension(uint32_t logType);

// True when `name` can only name a file inside one directory: no '/', '\\' or NUL, and not "." or
// "..". The host's name property answers other names like an empty one; the opening checks again
// so that no setting can ever reach outside the service directory.
bool IsPlainFileName(const std::string& name);

// The runtime path of the log file `logFileName` + LogFileExtension(logType) in the service
// directory (created with its missing parents). An empty name gives a file called only by its
// extension. Throws (std::exception) when the name is not plain or the directory cannot be
// prepared. Any thread; the directory lookup touches the file system.
std::string LogFilePath(const std::string& logFileName, uint32_t logType);

}  // namespace nKV_DLL300
