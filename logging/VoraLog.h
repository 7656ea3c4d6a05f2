// Log type 2: a session's frames as raw records in one channel of a measurement-data file.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "driver/BusKind.h"
#include "logging/BinaryLogFormat.h"
#include "logging/SessionLog.h"

namespace nKV_DLL300 {

// The channel of a run is "/'" voraGroupName "'/'" voraChannelName "'", holding the frame records
// of the binary log one after the other, with three 32-bit properties that tell a reader how to
// read them:
//   QV_network_frame_byte_order  0 (little-endian)
//   QV_network_frame_version     512
//   QV_network_protocol          0 CAN, 1 FlexRay, 2 LIN
inline constexpr char kVoraPropertyByteOrder[] = "QV_network_frame_byte_order";
inline constexpr char kVoraPropertyVersion[] = "QV_network_frame_version";
inline constexpr char kVoraPropertyProtocol[] = "QV_network_protocol";
inline constexpr int32_t kVoraByteOrderLittleEndian = 0;
inline constexpr int32_t kVoraFrameVersion = 0x200;

std::string VoraChannelPath(std::string_view group, std::string_view channel);
// The protocol property of a session of this bus (driver::ProtocolOfBus).
int32_t VoraNetworkProtocol(driver::BusKind bus);

// The type-2 branch of OpenLogFile: loads the library (first use in the process), opens `path`
// (replacing a file of that name), creates the channel named by the settings and sets its
// properties. A file the library cannot open is silent: voraFile stays -1 and the run logs
// nothing. A library that cannot be loaded, or any other failure of the library calls, stores
// -24 and reports it once. Poll thread. Never throws.
void OpenVoraLog(SessionLog& log, const std::string& path);

// The type-2 branch of the per-bus writers: appends the record of each frame of the batch that
// the frame selection accepts (the binary log's record of `layout`) to the channel. Nothing when
// no file is open. A library failure stores -24, reports it and ends the batch. Poll thread.
// Never throws.
void WriteVoraRecords(SessionLog& log, BinaryRecordLayout layout, const uint8_t* batch,
                      uint32_t bytes, uint32_t frames);

// The type-2 branch of CloseLogFile: flushes and closes the file, if one is open; a library
// failure stores -24 and reports it. Stopping thread. Never throws.
void CloseVoraLog(SessionLog& log);

}  // namespace nKV_DLL300
