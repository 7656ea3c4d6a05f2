// TCP sockets as the service uses them: listener, accept, waits, one receive, one send.
#pragma once

#include <cstddef>
#include <cstdint>

namespace platform::net {

// A socket handle; kInvalidSocket (all bits set) stands for "no socket".
using SocketHandle = int32_t;
constexpr SocketHandle kInvalidSocket = -1;

// Every operation may be called from any thread. A failing operation records its runtime error
// number for LastSocketError (SocketError.h) of the calling thread.

// A TCP stream socket of the Internet family; kInvalidSocket on failure.
SocketHandle CreateTcpSocket();
// Binds to the wildcard address and `port` (0: the system chooses). Address reuse is enabled so
// a restarted service can listen again while old connections linger.
bool BindAnyAddress(SocketHandle socket, uint16_t port);
// Sets TCP no-delay; 0 or the error number.
int32_t SetNoDelay(SocketHandle socket);
bool Listen(SocketHandle socket, int32_t backlog);
// The local port the socket is bound to, or -1.
int32_t LocalPort(SocketHandle socket);
// Accepts one pending connection (peer address not kept); kInvalidSocket on failure.
SocketHandle Accept(SocketHandle listener);
// Limits the system's send buffer of a socket (used to provoke full buffers).
bool SetSendBufferSize(SocketHandle socket, int32_t bytes);

// Waits until at least one socket is readable (data, end of stream or error pending) or
// `timeoutMs` passed. Returns the number of readable sockets with readable[i] set for each, 0 on
// time-out, -1 on failure (also when a handle is not an open socket).
int32_t WaitReadable(const SocketHandle* sockets, size_t count, bool* readable, uint32_t timeoutMs);
// WaitReadable that also ends when a socket with wantWritable[i] set can take more data
// (writable[i] set for it). Returns the number of sockets that are readable or writable.
int32_t WaitReadableOrWritable(const SocketHandle* sockets, size_t count, const bool* wantWritable,
                               bool* readable, bool* writable, uint32_t timeoutMs);
// Waits until the socket can take more data: 1 writable, 0 time-out, -1 failure.
int32_t WaitWritable(SocketHandle socket, uint32_t timeoutMs);

// One receive of at most `capacity` bytes without blocking: the byte count, 0 when the peer
// closed the connection, -1 on failure (no data yet is the time-out number).
int64_t Receive(SocketHandle socket, void* buffer, size_t capacity);

struct ConstBuffer {
  const void* data;
  size_t size;
};
// One send call of the buffers in order, without blocking and without raising a signal: the
// number of bytes the system took (possibly fewer than offered), or -1 on failure.
int64_t SendBuffers(SocketHandle socket, const ConstBuffer* buffers, size_t count);

// Ends both directions; a thread waiting on the socket sees it readable. The handle stays open.
void ShutdownBoth(SocketHandle socket);
// Releases the handle; false (with the error recorded) when the system refused.
bool Close(SocketHandle socket);

}  // namespace platform::net
