// Sending one headed message to a host, from the service thread or a session's threads.
#pragma once

#include <cstdint>
#include <mutex>

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
// Any thread but a poll thread (those use SnapshotSend). Messages of one connection never
// interleave and the sequence number rises by one per message, sent or not. A message is either
// queued whole or dropped whole: when the host does not read, a send waits at most 1 s for room,
// then fails with -3 and the connection stays. A message the system took only in part is
// finished before the next one.
void SendReply(HostConnection& connection, const void* payload, const LinkedSession* session,
               uint8_t type, uint32_t length);

// SendReply of a NUL-terminated text.
inline void SendText(HostConnection& connection, const char* text, const LinkedSession* session,
                     uint8_t type) {
  SendReply(connection, text, session, type, 0);
}

// A snapshot of a session's poll thread (its identifier records, which may take several
// messages, or its statistics): it goes out now or not at all, so that reading the bus and
// writing the log never wait for a host. The next snapshot carries the current state anyway.
//
//   SnapshotSend snapshot(connection);
//   if (!snapshot.hasRoom()) { snapshot.skip(); return; }
//   snapshot.send(...); snapshot.send(...);   // every message of the snapshot
//
// Construction takes the connection's send lock unless its holder is waiting for the host to
// make room (a reply in its bounded wait), and never waits on the socket. Room means: nothing of
// an earlier message is still unsent, and the socket takes more data now. With room every
// message of the snapshot goes out whole, in order, behind nothing else: what the system does
// not take at once is kept and sent before any later message (at most one snapshot is kept).
// Without room skip() drops the snapshot whole; its sequence number is used all the same, so
// the host sees the gap. The lock is held until destruction. One thread uses an object.
class SnapshotSend {
 public:
  explicit SnapshotSend(HostConnection& connection);
  SnapshotSend(const SnapshotSend&) = delete;
  SnapshotSend& operator=(const SnapshotSend&) = delete;

  bool hasRoom() const { return room_; }
  // One message of the snapshot, as SendReply. recordCount is what bytes 12 to 15 show instead
  // of the session's idCount (-1): identifier records count the records of their own message,
  // as a table too large for one message goes out in several. Only while hasRoom(). The result
  // goes to lastTcpError.
  void send(const void* payload, const LinkedSession* session, uint8_t type, uint32_t length,
            int32_t recordCount = -1);
  // Drops the snapshot (only without room): one sequence number, lastTcpError -3, and one more
  // ServiceStatistics::snapshotsSkipped.
  void skip();

 private:
  HostConnection& connection_;
  std::unique_lock<std::mutex> lock_;
  bool room_ = false;
};

// A text of a session's poll thread or log writer (a log failure): SendReply without any wait,
// sent as a one-message snapshot, or dropped whole and counted like one when the host has no
// room. The code it reports stays in the session's lastStatus, which later headers carry.
void SendTextWithoutWaiting(HostConnection& connection, const char* text,
                            const LinkedSession* session, uint8_t type);

// Tries to pass the unsent rest of a partly taken message to the system without waiting. The
// service thread calls it as soon as the socket of a connection with pending output can take
// more; it never blocks on a send in another thread.
void FlushPendingOutput(HostConnection& connection);

// Passes the unsent rest to the system, waiting at most the send wait (1 s) for room. Called
// before the connection is closed, when no other thread sends any more. Service thread.
void FinishPendingOutput(HostConnection& connection);

}  // namespace nKV_DLL300
