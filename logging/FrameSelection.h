// Which frames the log writers write: the transmitted-frame rule shared by every log format.
#pragma once

#include <cstdint>

#include "driver/RawFrame.h"

namespace nKV_DLL300 {

// A frame this interface transmitted itself (flags 0x80, an echo) is logged only when the session's
// logTransmittedFrames setting is non-zero; every other frame is always logged.
constexpr bool IsFrameLogged(const driver::RawFrameHeader& h, uint8_t logTransmittedFrames) {
  return (h.flags & driver::kFlagEcho) == 0 || logTransmittedFrames != 0;
}

}  // namespace nKV_DLL300
