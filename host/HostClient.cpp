// The host side of the link over POSIX sockets (host tools live outside the module).
#include "host/HostClient.h"

#include <arpa/inet.h>
#include <netdb.h>
#include <netinet/in.h>
#include <netinet/tcp.h>
#include <poll.h>
#include <sys/socket.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>

namespace kvhost {

namespace {

int MillisecondsLeft(std::chrono::steady_clock::time_point deadline) {
  auto left = std::chrono::duration_cast<std::chrono::milliseconds>(
      deadline - std::chrono::steady_clock::now());
  return left.count() <= 0 ? 0 : static_cast<int>(left.count());
}

}  // namespace

HostClient::~HostClient() { Close(); }

HostClient::HostClient(HostClient&& other) noexcept { *this = std::move(other); }

HostClient& HostClient::operator=(HostClient&& other) noexcept {
  if (this != &other) {
    Close();
    socket_ = other.socket_;
    closed_ = other.closed_;
    unresolved_ = other.unresolved_;
    buffer_ = std::move(other.buffer_);
    error_ = std::move(other.error_);
    other.socket_ = -1;
  }
  return *this;
}

bool HostClient::Connect(const std::string& host, uint16_t port) {
  return ConnectSocket(host, port, 0);
}

bool HostClient::ConnectWithReceiveBuffer(const std::string& host, uint16_t port, int32_t bytes) {
  return ConnectSocket(host, port, bytes);
}

int HostClient::connectAddress(const void* addrinfoEntry, int32_t receiveBuffer) {
  const auto* address = static_cast<const addrinfo*>(addrinfoEntry);
  const int fd = socket(address->ai_family, SOCK_STREAM | SOCK_CLOEXEC, 0);
  if (fd < 0) {
    error_ = std::strerror(errno);
    return -1;
  }
  int on = 1;
  setsockopt(fd, IPPROTO_TCP, TCP_NODELAY, &on, sizeof on);
  if (receiveBuffer > 0)
    setsockopt(fd, SOL_SOCKET, SO_RCVBUF, &receiveBuffer, sizeof receiveBuffer);
  if (connect(fd, address->ai_addr, address->ai_addrlen) != 0) {
    error_ = std::strerror(errno);
    close(fd);
    return -1;
  }
  return fd;
}

bool HostClient::ConnectSocket(const std::string& host, uint16_t port, int32_t receiveBuffer) {
  Close();
  closed_ = false;
  unresolved_ = false;
  buffer_.clear();
  addrinfo hints{};
  hints.ai_family = AF_UNSPEC;
  hints.ai_socktype = SOCK_STREAM;
  addrinfo* addresses = nullptr;
  const int resolved = getaddrinfo(host.c_str(), std::to_string(port).c_str(), &hints, &addresses);
  if (resolved != 0) {
    unresolved_ = true;
    error_ = "cannot resolve '" + host + "': " + gai_strerror(resolved);
    return false;
  }
  for (const addrinfo* address = addresses; address != nullptr && socket_ < 0;
       address = address->ai_next) {
    socket_ = connectAddress(address, receiveBuffer);
  }
  freeaddrinfo(addresses);
  return socket_ >= 0;
}

bool HostClient::Send(std::string_view text) {
  if (socket_ < 0) return false;
  ssize_t sent = send(socket_, text.data(), text.size(), MSG_NOSIGNAL);
  if (sent != static_cast<ssize_t>(text.size())) {
    error_ = sent < 0 ? std::strerror(errno) : "partial send";
    return false;
  }
  return true;
}

bool HostClient::FillBuffer(std::chrono::steady_clock::time_point deadline) {
  if (socket_ < 0 || closed_) return false;
  pollfd fd{socket_, POLLIN, 0};
  int ready = poll(&fd, 1, MillisecondsLeft(deadline));
  if (ready <= 0) return false;
  uint8_t chunk[65536];
  ssize_t received = recv(socket_, chunk, sizeof chunk, 0);
  if (received <= 0) {
    closed_ = true;
    return false;
  }
  buffer_.insert(buffer_.end(), chunk, chunk + received);
  return true;
}

std::optional<HostMessage> HostClient::Receive(std::chrono::milliseconds timeout) {
  auto deadline = std::chrono::steady_clock::now() + timeout;
  for (;;) {
    if (auto header = DecodeHeader(buffer_.data(), buffer_.size())) {
      size_t total = kHeaderSize + header->payloadLength;
      if (buffer_.size() >= total) {
        HostMessage message;
        message.header = *header;
        message.headerBytes.assign(buffer_.begin(), buffer_.begin() + kHeaderSize);
        message.payload.assign(buffer_.begin() + kHeaderSize, buffer_.begin() + total);
        buffer_.erase(buffer_.begin(), buffer_.begin() + total);
        return message;
      }
    }
    if (!FillBuffer(deadline)) return std::nullopt;
  }
}

bool HostClient::WaitForClose(std::chrono::milliseconds timeout) {
  auto deadline = std::chrono::steady_clock::now() + timeout;
  while (!closed_) {
    if (!FillBuffer(deadline) && !closed_) return false;
    buffer_.clear();
  }
  return true;
}

void HostClient::StopSending() {
  if (socket_ >= 0) shutdown(socket_, SHUT_WR);
}

void HostClient::Close() {
  if (socket_ >= 0) close(socket_);
  socket_ = -1;
}

uint16_t FreeLoopbackPort() {
  const int probe = socket(AF_INET, SOCK_STREAM, 0);
  sockaddr_in address{};
  address.sin_family = AF_INET;
  address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
  bind(probe, reinterpret_cast<sockaddr*>(&address), sizeof address);
  socklen_t length = sizeof address;
  getsockname(probe, reinterpret_cast<sockaddr*>(&address), &length);
  close(probe);
  return ntohs(address.sin_port);
}

}  // namespace kvhost
