// The state words of a session's interface (kxReadState), bit fields as in driver/States.h.
#pragma once

#include <cstdint>

namespace tarvix {

class Session;

// Called by Session with the bus's mutex held, after the bus has been advanced.
class SessionState {
 public:
  static int32_t Read(const Session& session, uint32_t stateId, uint32_t size, void* state,
                      uint32_t* faultCode, int64_t nowNs);
};

}  // namespace tarvix
