// The send procedure: header and payload go out together under the connection's send lock.
#include "hostlink/SendReply.h"

#include <cstring>
#include <thread>

#include "hostlink/LinkAccess.h"
#include "hostlink/MessageHeader.h"
#include "platform/net/SocketError.h"
#include "timing/Time.h"

namespace nKV_DLL300 {

namespace net = platform::net;

namespace {

constexpr uint32_t kSendWaitMs = 1000;

// Milliseconds left until `deadline` (a NowIn(kMilliseconds) reading).
uint32_t RemainingMs(uint64_t deadline) {
  uint64_t now = NowIn(kMilliseconds);
  return now >= deadline ? 0 : static_cast<uint32_t>(deadline - now);
}

uint32_t PayloadLength(const void* payload, uint8_t type, uint32_t length) {
  if (IsBinaryMessageType(type) && length != 0) return payload == nullptr ? 0 : length;
  return payload == nullptr ? 0
                            : static_cast<uint32_t>(std::strlen(static_cast<const char*>(payload)));
}

MessageHeaderFields HeaderFor(HostConnection& connection, const LinkedSession* session,
                              uint8_t type, uint32_t payloadLength, int32_t recordCount) {
  MessageHeaderFields fields;
  // Once per message, sent or not; wraps to 0.
  fields.sequenceNumber = LinkAccess::sequenceNumber(connection).fetch_add(1);
  fields.type = type;
  fields.payloadLength = payloadLength;
  if (session != nullptr && connection.busType.load() != driver::BusKind::kNone) {
    fields.idCount =
        recordCount >= 0 ? static_cast<uint32_t>(recordCount) : session->idCount.load();
    fields.lastStatus = session->lastStatus.load();
  }
  for (size_t i = 0; i < 4; ++i) {
    fields.versionBytes[i] = static_cast<uint8_t>(connection.driverVersion[i]);
  }
  return fields;
}

// Waits up to `ms` for room towards the host. Only a wait for a socket that has no room now is
// announced, so that a snapshot does not wait for the send lock meanwhile (and one that finds a
// quick sender holding the lock still goes out). Send lock held.
int32_t WaitForRoom(HostConnection& connection, net::SocketHandle socket, uint32_t ms) {
  const int32_t now = net::WaitWritable(socket, 0);
  if (now != 0 || ms == 0) return now;
  std::atomic<bool>& waiting = LinkAccess::waitingForRoom(connection);
  waiting.store(true);
  const int32_t ready = net::WaitWritable(socket, ms);
  waiting.store(false);
  return ready;
}

// The stream cannot go on (the system refused a send): shut it down so the service thread sees
// the connection end in its next pass. The descriptor stays open until then, so its number
// cannot be handed to another host while a slot or thread still uses it.
int32_t BreakLink(HostConnection& connection) {
  net::ShutdownBoth(LinkAccess::socket(connection));
  LinkAccess::pendingOutput(connection).clear();
  LinkAccess::notePendingOutput(connection);
  LinkAccess::linkBroken(connection).store(true);
  return kSendFailed;
}

// Sends what is left of an earlier message until `deadline`; true when nothing is left.
// Send lock held.
bool FlushPendingLocked(HostConnection& connection, uint64_t deadline) {
  std::vector<uint8_t>& pending = LinkAccess::pendingOutput(connection);
  net::SocketHandle socket = LinkAccess::socket(connection);
  while (!pending.empty()) {
    if (WaitForRoom(connection, socket, RemainingMs(deadline)) <= 0) return false;
    net::ConstBuffer rest{pending.data(), pending.size()};
    int64_t sent = net::SendBuffers(socket, &rest, 1);
    if (sent < 0) {
      int32_t error = net::LastSocketError();
      bool noRoom = error == net::kErrorWouldBlock || error == net::kErrorTimedOut;
      if (noRoom && RemainingMs(deadline) > 0) continue;
      if (noRoom) return false;
      BreakLink(connection);
      return false;
    }
    pending.erase(pending.begin(), pending.begin() + sent);
    LinkAccess::notePendingOutput(connection);
  }
  return true;
}

// Keeps what the system did not take of a message (`sent` bytes of `parts` went out), so the
// stream stays whole; it goes out before the next message. Send lock held.
void KeepUnsent(HostConnection& connection, const net::ConstBuffer (&parts)[2], size_t sent) {
  std::vector<uint8_t>& pending = LinkAccess::pendingOutput(connection);
  size_t offset = sent;
  for (const net::ConstBuffer& part : parts) {
    const auto* bytes = static_cast<const uint8_t*>(part.data);
    if (offset < part.size) pending.insert(pending.end(), bytes + offset, bytes + part.size);
    offset = offset > part.size ? offset - part.size : 0;
  }
  LinkAccess::notePendingOutput(connection);
}

// One message, whole or not at all. Send lock held.
int32_t SendMessageLocked(HostConnection& connection, const net::ConstBuffer (&parts)[2]) {
  net::SocketHandle socket = LinkAccess::socket(connection);
  if (socket == net::kInvalidSocket || LinkAccess::linkBroken(connection).load()) {
    return kSendFailed;
  }
  uint64_t deadline = NowIn(kMilliseconds) + kSendWaitMs;
  if (!FlushPendingLocked(connection, deadline)) return kSendFailed;
  if (WaitForRoom(connection, socket, RemainingMs(deadline)) <= 0) return kSendFailed;
  int64_t sent = net::SendBuffers(socket, parts, 2);
  if (sent < 0) {
    int32_t error = net::LastSocketError();
    if (error == net::kErrorTimedOut) return net::kErrorTimedOut;
    if (error == net::kErrorWouldBlock) return kSendFailed;  // no room after all: nothing sent
    return BreakLink(connection);
  }
  KeepUnsent(connection, parts, static_cast<size_t>(sent));
  return 0;
}

// Takes the send lock unless its holder waits for the host to make room; the lock is then not
// owned. Never waits on the socket: a holder that does not wait only does non-blocking work.
std::unique_lock<std::mutex> LockUnlessWaitingForRoom(HostConnection& connection) {
  std::unique_lock<std::mutex> lock(LinkAccess::sendMutex(connection), std::defer_lock);
  while (!lock.try_lock()) {
    if (LinkAccess::waitingForRoom(connection).load()) break;
    std::this_thread::yield();
  }
  return lock;
}

// True when a snapshot can go out now: the link is up, nothing earlier is left unsent (after a
// try without waiting) and the socket takes more data. Send lock held.
bool HasRoomLocked(HostConnection& connection) {
  net::SocketHandle socket = LinkAccess::socket(connection);
  if (socket == net::kInvalidSocket || LinkAccess::linkBroken(connection).load()) return false;
  if (!FlushPendingLocked(connection, NowIn(kMilliseconds))) return false;
  return net::WaitWritable(socket, 0) > 0;
}

// One message of a snapshot that had room, without waiting: behind the unsent rest of its own
// earlier messages, or straight to the system. Send lock held.
int32_t SendSnapshotMessageLocked(HostConnection& connection, const net::ConstBuffer (&parts)[2]) {
  net::SocketHandle socket = LinkAccess::socket(connection);
  if (socket == net::kInvalidSocket || LinkAccess::linkBroken(connection).load()) {
    return kSendFailed;
  }
  int64_t sent = 0;
  if (LinkAccess::pendingOutput(connection).empty()) {
    sent = net::SendBuffers(socket, parts, 2);
    if (sent < 0) {
      int32_t error = net::LastSocketError();
      if (error != net::kErrorWouldBlock && error != net::kErrorTimedOut) {
        return BreakLink(connection);
      }
      sent = 0;
    }
  }
  KeepUnsent(connection, parts, static_cast<size_t>(sent));
  return 0;
}

}  // namespace

void SendReply(HostConnection& connection, const void* payload, const LinkedSession* session,
               uint8_t type, uint32_t length) {
  uint32_t payloadLength = PayloadLength(payload, type, length);
  int32_t result;
  {
    std::lock_guard<std::mutex> lock(LinkAccess::sendMutex(connection));
    MessageHeader header =
        EncodeMessageHeader(HeaderFor(connection, session, type, payloadLength, -1));
    const net::ConstBuffer parts[2] = {{header.data(), header.size()}, {payload, payloadLength}};
    result = SendMessageLocked(connection, parts);
    connection.lastTcpError.store(result);
  }
  if (result != 0 && connection.statistics != nullptr) connection.statistics->failedSends++;
}

SnapshotSend::SnapshotSend(HostConnection& connection)
    : connection_(connection), lock_(LockUnlessWaitingForRoom(connection)) {
  room_ = lock_.owns_lock() && HasRoomLocked(connection);
}

void SnapshotSend::send(const void* payload, const LinkedSession* session, uint8_t type,
                        uint32_t length, int32_t recordCount) {
  if (!room_) return;
  const uint32_t payloadLength = PayloadLength(payload, type, length);
  const MessageHeader header =
      EncodeMessageHeader(HeaderFor(connection_, session, type, payloadLength, recordCount));
  const net::ConstBuffer parts[2] = {{header.data(), header.size()}, {payload, payloadLength}};
  const int32_t result = SendSnapshotMessageLocked(connection_, parts);
  connection_.lastTcpError.store(result);
  if (result != 0 && connection_.statistics != nullptr) connection_.statistics->failedSends++;
}

void SnapshotSend::skip() {
  LinkAccess::sequenceNumber(connection_).fetch_add(1);
  connection_.lastTcpError.store(kSendFailed);
  if (connection_.statistics != nullptr) connection_.statistics->snapshotsSkipped++;
}

void SendTextWithoutWaiting(HostConnection& connection, const char* text,
                            const LinkedSession* session, uint8_t type) {
  SnapshotSend snapshot(connection);
  if (!snapshot.hasRoom()) return snapshot.skip();
  snapshot.send(text, session, type, 0);
}

void FlushPendingOutput(HostConnection& connection) {
  std::unique_lock<std::mutex> lock(LinkAccess::sendMutex(connection), std::try_to_lock);
  if (!lock.owns_lock() || LinkAccess::socket(connection) == net::kInvalidSocket) return;
  if (LinkAccess::linkBroken(connection).load()) return;
  FlushPendingLocked(connection, NowIn(kMilliseconds));
}

void FinishPendingOutput(HostConnection& connection) {
  std::lock_guard<std::mutex> lock(LinkAccess::sendMutex(connection));
  if (LinkAccess::socket(connection) == net::kInvalidSocket) return;
  if (LinkAccess::linkBroken(connection).load()) return;
  FlushPendingLocked(connection, NowIn(kMilliseconds) + kSendWaitMs);
}

}  // namespace nKV_DLL300
