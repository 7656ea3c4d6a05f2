// Properties that a live session fixes: stored, but refused while the connection has a session.
#pragma once

#include "protocol/PropertyReply.h"

namespace nKV_DLL300 {

// Installs the handlers of ids 10 to 16. The value is always stored (the next session uses it);
// the reply is the range error, else the acknowledgement without a session, else the refusal
// naming the session's bus (no reply for a bus type outside 1 to 3).
void AddSessionLockedPropertyHandlers(PropertyHandlerTable& table);

}  // namespace nKV_DLL300
