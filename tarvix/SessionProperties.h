// The session properties: which ids exist for which kind of session, their sizes and value rules.
#pragma once

#include <cstdint>

#include "tarvix/SessionSetup.h"

namespace tarvix {

// What a property call acts on. The caller holds whatever guards `settings`.
struct PropertyTarget {
  const SessionSetup& setup;
  bool output;   // an output session (modes 10, 11)
  bool started;  // interface settings are refused while the session runs
  SessionSettings& settings;
};

class SessionProperties {
 public:
  // Checks the id, its size, where it applies and whether it may change now; stores the value.
  static int32_t Store(const PropertyTarget& target, uint32_t id, uint32_t size, const void* value);
  // Checks the id, its size and where it applies; copies the stored value. The J1939 address
  // reads as the one asked for: the session replaces it with the address it holds.
  static int32_t Load(const PropertyTarget& target, uint32_t id, uint32_t size, void* value);
};

}  // namespace tarvix
