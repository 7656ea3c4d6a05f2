// Classifying one received host message and running its handler.
#pragma once

#include <cstdint>
#include <string_view>

namespace nKV_DLL300 {

class HostConnection;

struct DispatchOutcome {
  int32_t receiveResult = 0;  // not 0: nothing was handled (the loop acts on -7)
  int32_t handlerResult = 0;  // the handler's result when a message was handled
};

// Receives one message of the connection and handles it. Service thread only.
DispatchOutcome DispatchMessage(HostConnection& connection);

// Handles one message text (at most 256 bytes, already cut at its first NUL); returns the
// handler's result. Service thread only.
int32_t HandleMessageText(HostConnection& connection, std::string_view text);

}  // namespace nKV_DLL300
