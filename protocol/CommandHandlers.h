// One handler per command identifier.
#pragma once

#include <cstdint>

namespace nKV_DLL300 {

class HostConnection;

// Runs in the service thread; returns 0, or for CMD_SESSION_START and CMD_SESSION_TERMINATE
// the outcome of the session operation (the loop does not act on it).
using CommandHandler = int32_t (*)(HostConnection& connection);

// The handler of command `id` (1 to 9); a handler that does nothing for any other id.
CommandHandler CommandHandlerFor(int32_t id);

}  // namespace nKV_DLL300
