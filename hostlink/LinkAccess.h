// The host link's private access to a connection's send state (SendReply, HostLink only).
#pragma once

#include "hostlink/HostConnection.h"

namespace nKV_DLL300 {

class LinkAccess {
 public:
  static std::mutex& sendMutex(HostConnection& c) { return c.sendMutex_; }
  static platform::net::SocketHandle& socket(HostConnection& c) { return c.socket_; }
  static std::atomic<uint32_t>& sequenceNumber(HostConnection& c) { return c.sequenceNumber_; }
  static std::vector<uint8_t>& pendingOutput(HostConnection& c) { return c.pendingOutput_; }
  static std::atomic<bool>& linkBroken(HostConnection& c) { return c.linkBroken_; }
  // After any change of pendingOutput: publishes whether a rest is waiting. Send lock held.
  static void notePendingOutput(HostConnection& c) {
    c.outputPending_.store(!c.pendingOutput_.empty());
  }
  static std::atomic<bool>& waitingForRoom(HostConnection& c) { return c.waitingForRoom_; }
};

}  // namespace nKV_DLL300
