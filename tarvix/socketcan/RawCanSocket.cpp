// The CAN_RAW socket of the SocketCAN backend: options, batched receive, send.
#include <linux/can.h>
#include <linux/can/raw.h>
#include <linux/net_tstamp.h>
#include <net/if.h>
#include <sys/socket.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <ctime>

#include "tarvix/socketcan/CanSockets.h"

namespace tarvix {
namespace {

constexpr int kBatchFrames = 64;
constexpr size_t kControlBytes = 128;
constexpr int kTimestampFlags = SOF_TIMESTAMPING_RX_SOFTWARE | SOF_TIMESTAMPING_SOFTWARE |
                                SOF_TIMESTAMPING_RX_HARDWARE | SOF_TIMESTAMPING_RAW_HARDWARE;

// The three stamps of SO_TIMESTAMPING (struct scm_timestamping): software, legacy, raw hardware.
struct Stamps {
  timespec ts[3];
};

int64_t Nanoseconds(const timespec& t) {
  return static_cast<int64_t>(t.tv_sec) * 1'000'000'000 + t.tv_nsec;
}

template <typename T>
int SetOption(int fd, int level, int name, const T& value) {
  return setsockopt(fd, level, name, &value, sizeof value) < 0 ? errno : 0;
}

// Kernel time stamps: the SO_TIMESTAMPING set where the kernel has it, else nanosecond stamps.
int EnableTimestamps(int fd) {
  if (SetOption(fd, SOL_SOCKET, SO_TIMESTAMPING, kTimestampFlags) == 0) return 0;
  return SetOption(fd, SOL_SOCKET, SO_TIMESTAMPNS, 1);
}

// A larger receive queue takes bursts while the reader is busy: the privileged call where the
// process may, else the system's limit.
void SetReceiveBuffer(int fd, int bytes) {
  if (bytes <= 0) return;
  if (SetOption(fd, SOL_SOCKET, SO_RCVBUFFORCE, bytes) != 0)
    (void)SetOption(fd, SOL_SOCKET, SO_RCVBUF, bytes);
}

int SetFilters(int fd, const RawSocketOptions& o) {
  std::vector<can_filter> filters;
  if (o.standardOnly) filters.push_back({0, CAN_EFF_FLAG});
  for (const auto& [id, mask] : o.filters) filters.push_back({id, mask});
  if (filters.empty()) return 0;
  return setsockopt(fd, SOL_CAN_RAW, CAN_RAW_FILTER, filters.data(),
                    static_cast<socklen_t>(filters.size() * sizeof(can_filter))) == 0
             ? 0
             : errno;
}

int Configure(int fd, const RawSocketOptions& o) {
  const can_err_mask_t errors = o.errorFrames ? CAN_ERR_MASK : 0;
  int status = SetOption(fd, SOL_CAN_RAW, CAN_RAW_ERR_FILTER, errors);
  if (status == 0 && o.fdFrames) status = SetOption(fd, SOL_CAN_RAW, CAN_RAW_FD_FRAMES, 1);
  if (status == 0 && o.receiveOwn) status = SetOption(fd, SOL_CAN_RAW, CAN_RAW_RECV_OWN_MSGS, 1);
  if (status == 0) status = SetFilters(fd, o);
  if (status == 0) status = EnableTimestamps(fd);
  if (status == 0) status = SetOption(fd, SOL_SOCKET, SO_RXQ_OVFL, 1);
  SetReceiveBuffer(fd, o.receiveBufferBytes);
  return status;
}

void ReadControl(msghdr& h, Reception& r) {
  for (cmsghdr* c = CMSG_FIRSTHDR(&h); c != nullptr; c = CMSG_NXTHDR(&h, c)) {
    if (c->cmsg_level != SOL_SOCKET) continue;
    if (c->cmsg_type == SO_TIMESTAMPING) {
      Stamps stamps;
      std::memcpy(&stamps, CMSG_DATA(c), sizeof stamps);
      r.softwareNs = Nanoseconds(stamps.ts[0]);
      r.hardwareNs = Nanoseconds(stamps.ts[2]);
    } else if (c->cmsg_type == SO_TIMESTAMPNS) {
      timespec stamp;
      std::memcpy(&stamp, CMSG_DATA(c), sizeof stamp);
      r.softwareNs = Nanoseconds(stamp);
    } else if (c->cmsg_type == SO_RXQ_OVFL) {
      std::memcpy(&r.drops, CMSG_DATA(c), sizeof r.drops);
      r.hasDrops = true;
    }
  }
}

void ReadFrame(const canfd_frame& k, unsigned int bytes, WireFrame& f) {
  f.canId = k.can_id;
  f.fd = bytes == CANFD_MTU;
  f.length = std::min<uint8_t>(k.len, f.fd ? CANFD_MAX_DLEN : CAN_MAX_DLEN);
  f.fdFlags = f.fd ? k.flags : 0;
  std::memcpy(f.data.data(), k.data, f.length);
  if ((k.can_id & CAN_ERR_FLAG) != 0) std::memcpy(f.data.data(), k.data, CAN_MAX_DLEN);
}

}  // namespace

struct RawCanSocket::Batch {
  mmsghdr messages[kBatchFrames];
  iovec vectors[kBatchFrames];
  canfd_frame frames[kBatchFrames];
  alignas(cmsghdr) char control[kBatchFrames][kControlBytes];
};

RawCanSocket::RawCanSocket() = default;
RawCanSocket::~RawCanSocket() = default;
RawCanSocket::RawCanSocket(RawCanSocket&&) noexcept = default;
RawCanSocket& RawCanSocket::operator=(RawCanSocket&&) noexcept = default;

int RawCanSocket::open(int index, const RawSocketOptions& options) {
  FileHandle handle(socket(PF_CAN, SOCK_RAW | SOCK_CLOEXEC | SOCK_NONBLOCK, CAN_RAW));
  if (!handle.valid()) return errno;
  if (const int status = Configure(handle.get(), options); status != 0) return status;
  sockaddr_can address{};
  address.can_family = AF_CAN;
  address.can_ifindex = index;
  if (bind(handle.get(), reinterpret_cast<sockaddr*>(&address), sizeof address) != 0) return errno;
  handle_ = std::move(handle);
  if (!batch_) batch_ = std::make_unique<Batch>();
  return 0;
}

int RawCanSocket::receive(Reception* out, int max) {
  max = std::min(max, kBatchFrames);
  Batch& b = *batch_;
  for (int i = 0; i < max; ++i) {
    b.vectors[i] = {&b.frames[i], sizeof(canfd_frame)};
    b.messages[i].msg_hdr = msghdr{nullptr, 0, &b.vectors[i], 1, b.control[i], kControlBytes, 0};
  }
  const int count =
      recvmmsg(handle_.get(), b.messages, static_cast<unsigned>(max), MSG_DONTWAIT, nullptr);
  if (count < 0) return errno == EAGAIN || errno == EWOULDBLOCK || errno == EINTR ? 0 : -errno;
  for (int i = 0; i < count; ++i) {
    Reception& r = out[i];
    r = Reception{};
    msghdr& h = b.messages[i].msg_hdr;
    ReadFrame(b.frames[i], b.messages[i].msg_len, r.frame);
    r.local = (h.msg_flags & MSG_DONTROUTE) != 0;
    r.confirm = (h.msg_flags & MSG_CONFIRM) != 0;
    ReadControl(h, r);
  }
  return count;
}

int RawCanSocket::send(const WireFrame& f) {
  canfd_frame k{};
  k.can_id = f.canId;
  k.len = f.length;
  k.flags = f.fd ? f.fdFlags : 0;
  std::memcpy(k.data, f.data.data(), f.length);
  const size_t bytes = f.fd ? CANFD_MTU : CAN_MTU;
  const ssize_t sent = ::send(handle_.get(), &k, bytes, MSG_DONTWAIT);
  if (sent == static_cast<ssize_t>(bytes)) return 0;
  return sent < 0 ? errno : EIO;
}

}  // namespace tarvix
