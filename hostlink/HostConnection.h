// One connected host: its socket, tables, settings, sequence number, heartbeat and session.
#pragma once

#include <atomic>
#include <cstdint>
#include <memory>
#include <mutex>
#include <vector>

#include "driver/BusKind.h"
#include "hostlink/HardwareRecord.h"
#include "hostlink/MessageTable.h"
#include "hostlink/OwnedSession.h"
#include "hostlink/ServiceStatistics.h"
#include "hostlink/SessionSettings.h"
#include "platform/net/Socket.h"
#include "timing/Stopwatch.h"

namespace nKV_DLL300 {

// A host that sends no CMD_HEARTBEAT for longer than this is ended (the service's default).
constexpr uint32_t kDefaultHeartbeatLimitMs = 10000;

// What a new connection takes over from the service at accept.
struct ConnectionSetup {
  uint32_t driverVersion[kDriverVersionCount] = {};
  std::vector<HardwareRecord> hardwareTable;             // the connection's own copy
  ServiceStatistics* statistics = nullptr;               // not owned; may be null
  uint32_t heartbeatLimitMs = kDefaultHeartbeatLimitMs;  // silence that ends the connection
};

// Created by the service thread at accept and destroyed when its slot is freed, after its
// session has been stopped and deleted. The service thread runs every handler; the session's
// poll thread and log writers also send through it (with SnapshotSend, which never waits for
// the host; every message stays whole) and read its settings.
class HostConnection {
 public:
  HostConnection(platform::net::SocketHandle socket, ConnectionSetup setup);
  ~HostConnection();
  HostConnection(const HostConnection&) = delete;
  HostConnection& operator=(const HostConnection&) = delete;

  SessionSettings settings;  // see SessionSettings for its guards
  const MessageTable commandTable;
  const MessageTable propertyTable;
  std::atomic<driver::BusKind> busType{driver::BusKind::kNone};  // as the port name chose it
  uint32_t driverVersion[kDriverVersionCount] = {};  // set at construction, read-only after
  std::atomic<int32_t> lastTcpError{0};              // result of the last send on this connection
  Stopwatch heartbeatWatch;                          // service thread only
  OwnedSession session;  // service thread only; stopped and deleted as its own class
  std::atomic<bool> closeRequested{false};
  const std::vector<HardwareRecord> hardwareTable;  // own copy, read-only
  const uint16_t hardwareCount;
  ServiceStatistics* const statistics;  // not owned; may be null
  const uint32_t heartbeatLimitMs;      // CheckHeartbeat ends the connection after this silence

  // The socket while the connection holds one; kInvalidSocket after CloseConnection.
  // Service thread only (SendReply reads it under its lock).
  platform::net::SocketHandle socket() const { return socket_; }
  // True once a send failed so badly that the stream cannot go on; the loop then ends the
  // connection. Any thread.
  bool linkBroken() const { return linkBroken_.load(); }
  // True while part of a message waits to be handed to the system (the socket had no room for
  // all of it). Any thread.
  bool hasPendingOutput() const { return outputPending_.load(); }

 private:
  friend class LinkAccess;

  std::mutex sendMutex_;
  platform::net::SocketHandle socket_;  // changed under sendMutex_ by the service thread only
  // Taken once per message, sent or not: under sendMutex_ for a message that goes out (so the
  // stream's numbers rise), by anyone for a snapshot that is dropped (SnapshotSend::skip).
  std::atomic<uint32_t> sequenceNumber_{0};
  std::vector<uint8_t> pendingOutput_;  // guarded by sendMutex_: unsent rest of messages
  // Set by the holder of sendMutex_ while it waits for the host to make room; a snapshot then
  // gives up instead of waiting for the lock.
  std::atomic<bool> waitingForRoom_{false};
  std::atomic<bool> outputPending_{false};  // written under sendMutex_: !pendingOutput_.empty()
  std::atomic<bool> linkBroken_{false};
};

}  // namespace nKV_DLL300
