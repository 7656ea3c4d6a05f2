// A host's TCP link to the controller's service: connect, send one message, receive one message.
#pragma once

#include <chrono>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "host/HostMessage.h"

namespace kvhost {

// One connection to the service. Not thread-safe: one thread uses a client at a time.
class HostClient {
 public:
  HostClient() = default;
  ~HostClient();
  HostClient(HostClient&& other) noexcept;
  HostClient& operator=(HostClient&& other) noexcept;
  HostClient(const HostClient&) = delete;
  HostClient& operator=(const HostClient&) = delete;

  // Connects to `host`:`port`: a host name, an IPv4 or an IPv6 address, each address the name
  // resolves to tried in turn. False with error() set; unresolved() tells a name that does not
  // resolve from a controller that does not answer.
  bool Connect(const std::string& host, uint16_t port);
  // Like Connect, with the receive buffer limited before connecting (a slow reader's window).
  bool ConnectWithReceiveBuffer(const std::string& host, uint16_t port, int32_t bytes);
  bool connected() const { return socket_ >= 0; }
  bool unresolved() const { return unresolved_; }
  // The socket, for waiting on several clients at once; -1 when not connected.
  int fd() const { return socket_; }

  // Sends `text` in one send call, exactly as given (no terminator added).
  bool Send(std::string_view text);

  // Receives the next headed message; nullopt when none arrived whole before `timeout`, or
  // the connection ended (see closed()).
  std::optional<HostMessage> Receive(std::chrono::milliseconds timeout);

  // True once the service ended the connection (end of stream seen).
  bool closed() const { return closed_; }
  // Received bytes that do not make a whole message yet; after the end of the stream, the part
  // of a message the service did not finish.
  size_t partialBytes() const { return buffer_.size(); }

  // Waits up to `timeout` for the service to end the connection, discarding messages.
  bool WaitForClose(std::chrono::milliseconds timeout);

  // Ends the sending direction only: the service sees the host leave while it still reads.
  void StopSending();
  void Close();
  const std::string& error() const { return error_; }

 private:
  bool ConnectSocket(const std::string& host, uint16_t port, int32_t receiveBuffer);
  // One address of the name: a connected socket, or -1 with error_ set.
  int connectAddress(const void* addrinfoEntry, int32_t receiveBuffer);
  // Reads what is there within the time left; false on time-out or end of stream.
  bool FillBuffer(std::chrono::steady_clock::time_point deadline);

  int socket_ = -1;
  bool closed_ = false;
  bool unresolved_ = false;
  std::vector<uint8_t> buffer_;  // received bytes not yet returned as messages
  std::string error_;
};

// A loopback port that was free a moment ago (the system's choice for a socket bound to port 0),
// for a program that starts a controller of its own.
uint16_t FreeLoopbackPort();

}  // namespace kvhost
