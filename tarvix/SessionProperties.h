// The session properties: which ids exist for which kind of session, their sizes and value rules.
#pragma once

#include <cstdint>

namespace tarvix {

class Session;

// Called by Session with the bus's mutex held.
class SessionProperties {
 public:
  static int32_t Set(Session& session, uint32_t id, uint32_t size, const void* value,
                     int64_t nowNs);
  static int32_t Get(Session& session, uint32_t id, uint32_t size, void* value, int64_t nowNs);
};

}  // namespace tarvix
