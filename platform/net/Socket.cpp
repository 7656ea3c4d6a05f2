// POSIX sockets behind the service's socket operations; poll stands in for select.
#include "platform/net/Socket.h"

#include <netinet/in.h>
#include <netinet/tcp.h>
#include <poll.h>
#include <sys/socket.h>
#include <sys/uio.h>
#include <time.h>
#include <unistd.h>

#include <cerrno>
#include <vector>

#include "platform/net/SocketError.h"

namespace platform::net {

namespace {

template <typename T>
T Fail(T result) {
  SetLastSocketError(MapSystemError(errno));
  return result;
}

int ToPollTimeout(uint32_t timeoutMs) {
  return timeoutMs > 0x7FFFFFFFu ? 0x7FFFFFFF : static_cast<int>(timeoutMs);
}

// poll, restarted after signals with the time that is left counted from the first call.
int PollRestarting(pollfd* fds, nfds_t count, uint32_t timeoutMs) {
  timespec start{};
  clock_gettime(CLOCK_MONOTONIC, &start);
  int remaining = ToPollTimeout(timeoutMs);
  for (;;) {
    int ready = poll(fds, count, remaining);
    if (ready >= 0 || errno != EINTR) return ready;
    timespec now{};
    clock_gettime(CLOCK_MONOTONIC, &now);
    int64_t spentMs = (now.tv_sec - start.tv_sec) * 1000 + (now.tv_nsec - start.tv_nsec) / 1000000;
    remaining = spentMs >= ToPollTimeout(timeoutMs) ? 0 : ToPollTimeout(timeoutMs) - int(spentMs);
  }
}

// The waits of the service: readability of every socket, writability of those that want it
// (wantWritable and writable may be null when none does).
int32_t PollSockets(const SocketHandle* sockets, size_t count, const bool* wantWritable,
                    bool* readable, bool* writable, uint32_t timeoutMs) {
  std::vector<pollfd> fds(count);
  for (size_t i = 0; i < count; ++i) {
    const bool write = wantWritable != nullptr && wantWritable[i];
    fds[i] = pollfd{sockets[i], static_cast<short>(POLLIN | (write ? POLLOUT : 0)), 0};
  }
  int ready = PollRestarting(fds.data(), fds.size(), timeoutMs);
  if (ready < 0) return Fail(-1);
  int32_t readyCount = 0;
  for (size_t i = 0; i < count; ++i) {
    // select fails on a handle that is not open; poll reports it per descriptor instead.
    if (fds[i].revents & POLLNVAL) {
      SetLastSocketError(kErrorNotSocket);
      return -1;
    }
    readable[i] = (fds[i].revents & (POLLIN | POLLHUP | POLLERR)) != 0;
    bool canWrite = false;
    if (writable != nullptr) {
      canWrite = (fds[i].events & POLLOUT) != 0 && (fds[i].revents & (POLLOUT | POLLERR)) != 0;
      writable[i] = canWrite;
    }
    readyCount += (readable[i] || canWrite) ? 1 : 0;
  }
  return readyCount;
}

}  // namespace

SocketHandle CreateTcpSocket() {
  int fd = socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, IPPROTO_TCP);
  return fd < 0 ? Fail(kInvalidSocket) : fd;
}

bool BindAnyAddress(SocketHandle socket, uint16_t port) {
  int reuse = 1;
  setsockopt(socket, SOL_SOCKET, SO_REUSEADDR, &reuse, sizeof reuse);
  sockaddr_in address{};
  address.sin_family = AF_INET;
  address.sin_addr.s_addr = htonl(INADDR_ANY);
  address.sin_port = htons(port);
  if (bind(socket, reinterpret_cast<sockaddr*>(&address), sizeof address) != 0) return Fail(false);
  return true;
}

int32_t SetNoDelay(SocketHandle socket) {
  int on = 1;
  if (setsockopt(socket, IPPROTO_TCP, TCP_NODELAY, &on, sizeof on) != 0) {
    return Fail(MapSystemError(errno));
  }
  return 0;
}

bool Listen(SocketHandle socket, int32_t backlog) {
  return listen(socket, backlog) == 0 ? true : Fail(false);
}

int32_t LocalPort(SocketHandle socket) {
  sockaddr_in address{};
  socklen_t length = sizeof address;
  if (getsockname(socket, reinterpret_cast<sockaddr*>(&address), &length) != 0) return Fail(-1);
  return ntohs(address.sin_port);
}

SocketHandle Accept(SocketHandle listener) {
  int fd = accept4(listener, nullptr, nullptr, SOCK_CLOEXEC);
  return fd < 0 ? Fail(kInvalidSocket) : fd;
}

bool SetSendBufferSize(SocketHandle socket, int32_t bytes) {
  return setsockopt(socket, SOL_SOCKET, SO_SNDBUF, &bytes, sizeof bytes) == 0 ? true : Fail(false);
}

int32_t WaitReadable(const SocketHandle* sockets, size_t count, bool* readable,
                     uint32_t timeoutMs) {
  return PollSockets(sockets, count, nullptr, readable, nullptr, timeoutMs);
}

int32_t WaitReadableOrWritable(const SocketHandle* sockets, size_t count, const bool* wantWritable,
                               bool* readable, bool* writable, uint32_t timeoutMs) {
  return PollSockets(sockets, count, wantWritable, readable, writable, timeoutMs);
}

int32_t WaitWritable(SocketHandle socket, uint32_t timeoutMs) {
  pollfd fd{socket, POLLOUT, 0};
  int ready = PollRestarting(&fd, 1, timeoutMs);
  if (ready < 0) return Fail(-1);
  if (ready == 0) return 0;
  if (fd.revents & POLLNVAL) {
    SetLastSocketError(kErrorNotSocket);
    return -1;
  }
  return 1;  // writable, or an error pending that the send will report
}

int64_t Receive(SocketHandle socket, void* buffer, size_t capacity) {
  ssize_t received = recv(socket, buffer, capacity, MSG_DONTWAIT);
  if (received >= 0) return received;
  if (errno == EAGAIN || errno == EWOULDBLOCK) {
    SetLastSocketError(kErrorTimedOut);  // nothing arrived after all
    return -1;
  }
  return Fail(int64_t{-1});
}

int64_t SendBuffers(SocketHandle socket, const ConstBuffer* buffers, size_t count) {
  std::vector<iovec> parts(count);
  for (size_t i = 0; i < count; ++i) {
    parts[i] = iovec{const_cast<void*>(buffers[i].data), buffers[i].size};
  }
  msghdr message{};
  message.msg_iov = parts.data();
  message.msg_iovlen = parts.size();
  ssize_t sent = sendmsg(socket, &message, MSG_DONTWAIT | MSG_NOSIGNAL);
  return sent >= 0 ? sent : Fail(int64_t{-1});
}

void ShutdownBoth(SocketHandle socket) { shutdown(socket, SHUT_RDWR); }

bool Close(SocketHandle socket) { return close(socket) == 0 ? true : Fail(false); }

}  // namespace platform::net
