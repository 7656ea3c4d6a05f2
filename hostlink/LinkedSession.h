// A bus session as the host link and the log files see it: its connection, its bus and the two
// values every message header carries.
#pragma once

#include <atomic>
#include <cstdint>

#include "driver/BusKind.h"

namespace nKV_DLL300 {

class HostConnection;

// The base of every bus session (CBusSystem derives from it). It holds no virtual operation, so
// the slot order of the bus classes is theirs alone. Thread rules are CBusSystem's.
class LinkedSession {
 public:
  LinkedSession(HostConnection* owner, driver::BusKind kind) : busType(kind), connection(owner) {}
  LinkedSession(const LinkedSession&) = delete;
  LinkedSession& operator=(const LinkedSession&) = delete;

  // The bus this session was created for. It stays what it was even when the host names another
  // bus with SET_PROP_SESSION_PORTNAME while the session runs: bus-specific commands and texts
  // follow this kind, not the connection's busType.
  const driver::BusKind busType;

  // Used entries of the identifier table: written by the poll thread, read by SendReply anywhere.
  std::atomic<uint16_t> idCount{0};
  // Last non-zero driver status or program error code; nothing resets it. Both threads write.
  std::atomic<int32_t> lastStatus{0};
  // The connection whose settings the session reads and to which it sends. Not owned; it
  // outlives the session.
  HostConnection* const connection;

 protected:
  ~LinkedSession() = default;  // deleted as the bus session it is part of
};

}  // namespace nKV_DLL300
