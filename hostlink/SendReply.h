// Sending one headed message to a host, from the service thread or a session's threads.
#pragma once

#include <cstdint>

#include "hostlink/HostConnection.h"
#include "hostlink/LinkedSession.h"

namespace nKV_DLL300 {

// Result codes of a send.
constexpr int32_t kSendFailed = -3;

// Sends the header and `payload` as one message; the result goes to connection.lastTcpError.
// For binary types (0, 1, 2, 6, 7) the payload length is `length` when it is not 0; for every
// other type, and for length 0, it is the length of the NUL-terminated text `payload` (the NUL
// is not sent). A null payload sends the header alone. Header bytes 12 to 19 carry `session`'s
// values when it is given and the connection has a bus type.
//
// Any thread. Messages of one connection never interleave and the sequence number rises by one
// per message, sent or not. A message is either queued whole or dropped whole: when the host
// does not read, a send waits at most 1 s for room, then fails with -3 and the connection stays.
// A message the system took only in part is finished before the next one.
void SendReply(HostConnection& connection, const void* payload, const LinkedSession* session,
               uint8_t type, uint32_t length);

// SendReply of identifier records whose header (bytes 12 to 15) counts the `recordCount` records
// this message carries: a table too large for one message goes out in several.
void SendRecords(HostConnection& connection, const void* payload, const LinkedSession* session,
                 uint8_t type, uint32_t length, uint16_t recordCount);

// SendReply of a NUL-terminated text.
inline void SendText(HostConnection& connection, const char* text, const LinkedSession* session,
                     uint8_t type) {
  SendReply(connection, text, session, type, 0);
}

// Tries to pass the unsent rest of a partly taken message to the system without waiting. The
// service thread calls it as soon as the socket of a connection with pending output can take
// more; it never blocks on a send in another thread.
void FlushPendingOutput(HostConnection& connection);

// Passes the unsent rest to the system, waiting at most the send wait (1 s) for room. Called
// before the connection is closed, when no other thread sends any more. Service thread.
void FinishPendingOutput(HostConnection& connection);

}  // namespace nKV_DLL300
