// The Linux calls of the SocketCAN backend besides CAN_RAW: handles, device look-ups, CAN_BCM,
// CAN_J1939, the wake-up event and waiting.
#include "tarvix/socketcan/CanSockets.h"

#include <linux/can.h>
#include <linux/can/bcm.h>
#include <linux/can/j1939.h>
#include <linux/net_tstamp.h>
#include <net/if.h>
#include <poll.h>
#include <sys/eventfd.h>
#include <sys/ioctl.h>
#include <sys/socket.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <cstring>
#include <thread>

namespace tarvix {
namespace {

constexpr size_t kClaimBytes = 8;

// Some kernels answer a flag option with its new value instead of 0: only -1 is a failure.
template <typename T>
int SetOption(int fd, int level, int name, const T& value) {
  return setsockopt(fd, level, name, &value, sizeof value) < 0 ? errno : 0;
}

bool Ioctl(int request, ifreq& request_data) {
  FileHandle probe(socket(AF_INET, SOCK_DGRAM | SOCK_CLOEXEC, 0));
  return probe.valid() && ioctl(probe.get(), request, &request_data) == 0;
}

ifreq Request(const std::string& name) {
  ifreq r{};
  std::strncpy(r.ifr_name, name.c_str(), IFNAMSIZ - 1);
  return r;
}

bcm_timeval Interval(int64_t ns) {
  return bcm_timeval{static_cast<long>(ns / 1'000'000'000),
                     static_cast<long>(ns / 1000 % 1'000'000)};
}

// A TX_SETUP or TX_DELETE message: the head, then one frame (classic or CAN FD size).
struct BcmMessage {
  alignas(8) char bytes[sizeof(bcm_msg_head) + sizeof(canfd_frame)];
  bcm_msg_head* head() { return reinterpret_cast<bcm_msg_head*>(bytes); }
  canfd_frame* frame() { return reinterpret_cast<canfd_frame*>(bytes + sizeof(bcm_msg_head)); }
};

BcmMessage BcmFor(const WireFrame& f, uint32_t opcode) {
  BcmMessage m{};
  m.head()->opcode = opcode;
  m.head()->can_id = f.canId;
  m.head()->nframes = 1;
  m.head()->flags = f.fd ? CAN_FD_FRAME : 0;
  m.frame()->can_id = f.canId;
  m.frame()->len = f.length;
  m.frame()->flags = f.fd ? f.fdFlags : 0;
  std::memcpy(m.frame()->data, f.data.data(), f.length);
  return m;
}

int WriteBcm(int fd, const BcmMessage& m, size_t frames, bool fdFrame) {
  const size_t bytes =
      sizeof(bcm_msg_head) + frames * (fdFrame ? sizeof(canfd_frame) : sizeof(can_frame));
  return write(fd, m.bytes, bytes) == static_cast<ssize_t>(bytes) ? 0 : errno;
}

sockaddr_can J1939Address(int index, uint64_t name, uint32_t pgn, uint8_t address) {
  sockaddr_can a{};
  a.can_family = AF_CAN;
  a.can_ifindex = index;
  a.can_addr.j1939.name = name;
  a.can_addr.j1939.pgn = pgn;
  a.can_addr.j1939.addr = address;
  return a;
}

int BindJ1939(FileHandle& handle, const sockaddr_can& address) {
  return bind(handle.get(), reinterpret_cast<const sockaddr*>(&address), sizeof address) == 0
             ? 0
             : errno;
}

void ReadJ1939Control(msghdr& h, J1939Message& m) {
  for (cmsghdr* c = CMSG_FIRSTHDR(&h); c != nullptr; c = CMSG_NXTHDR(&h, c)) {
    if (c->cmsg_level == SOL_CAN_J1939 && c->cmsg_type == SCM_J1939_DEST_ADDR) {
      m.destination = *CMSG_DATA(c);
    } else if (c->cmsg_level == SOL_CAN_J1939 && c->cmsg_type == SCM_J1939_PRIO) {
      m.priority = *CMSG_DATA(c);
    } else if (c->cmsg_level == SOL_SOCKET && c->cmsg_type == SO_TIMESTAMPING) {
      timespec stamps[3];
      std::memcpy(stamps, CMSG_DATA(c), sizeof stamps);
      m.softwareNs = static_cast<int64_t>(stamps[0].tv_sec) * 1'000'000'000 + stamps[0].tv_nsec;
    }
  }
}

}  // namespace

FileHandle::~FileHandle() { reset(); }

FileHandle& FileHandle::operator=(FileHandle&& other) noexcept {
  if (this != &other) {
    reset(other.fd_);
    other.fd_ = -1;
  }
  return *this;
}

void FileHandle::reset(int fd) {
  if (fd_ >= 0) ::close(fd_);
  fd_ = fd;
}

bool LookUpDevice(const std::string& name, DeviceLookup& out) {
  ifreq r = Request(name);
  if (!Ioctl(SIOCGIFINDEX, r)) return false;
  out.index = r.ifr_ifindex;
  r = Request(name);
  if (!Ioctl(SIOCGIFFLAGS, r)) return false;
  out.up = (r.ifr_flags & IFF_UP) != 0;
  out.running = (r.ifr_flags & IFF_RUNNING) != 0;
  r = Request(name);
  out.mtu = Ioctl(SIOCGIFMTU, r) ? r.ifr_mtu : 0;
  return true;
}

int BcmSocket::open(int index) {
  FileHandle handle(socket(PF_CAN, SOCK_DGRAM | SOCK_CLOEXEC, CAN_BCM));
  if (!handle.valid()) return errno;
  sockaddr_can address{};
  address.can_family = AF_CAN;
  address.can_ifindex = index;
  if (connect(handle.get(), reinterpret_cast<sockaddr*>(&address), sizeof address) != 0)
    return errno;
  handle_ = std::move(handle);
  return 0;
}

int BcmSocket::repeat(const WireFrame& frame, int64_t periodNs, bool restart, bool now) {
  BcmMessage m = BcmFor(frame, TX_SETUP);
  if (restart) {
    m.head()->flags |= SETTIMER | STARTTIMER;
    m.head()->ival2 = Interval(periodNs);
  }
  if (now) m.head()->flags |= TX_ANNOUNCE;
  return WriteBcm(handle_.get(), m, 1, frame.fd);
}

int BcmSocket::stop(const WireFrame& frame) {
  BcmMessage m = BcmFor(frame, TX_DELETE);
  m.head()->nframes = 0;
  return WriteBcm(handle_.get(), m, 0, frame.fd);
}

int J1939Socket::openMonitor(int index, int receiveBufferBytes) {
  FileHandle handle(socket(PF_CAN, SOCK_DGRAM | SOCK_CLOEXEC | SOCK_NONBLOCK, CAN_J1939));
  if (!handle.valid()) return errno;
  int status = SetOption(handle.get(), SOL_CAN_J1939, SO_J1939_PROMISC, 1);
  if (status == 0)
    status = SetOption(handle.get(), SOL_SOCKET, SO_TIMESTAMPING,
                       SOF_TIMESTAMPING_RX_SOFTWARE | SOF_TIMESTAMPING_SOFTWARE);
  if (status == 0 && receiveBufferBytes > 0 &&
      SetOption(handle.get(), SOL_SOCKET, SO_RCVBUFFORCE, receiveBufferBytes) != 0)
    (void)SetOption(handle.get(), SOL_SOCKET, SO_RCVBUF, receiveBufferBytes);
  if (status == 0)
    status = BindJ1939(handle, J1939Address(index, J1939_NO_NAME, J1939_NO_PGN, J1939_NO_ADDR));
  if (status == 0) handle_ = std::move(handle);
  return status;
}

int J1939Socket::openNode(int index, uint64_t name, uint8_t address) {
  FileHandle handle(socket(PF_CAN, SOCK_DGRAM | SOCK_CLOEXEC | SOCK_NONBLOCK, CAN_J1939));
  if (!handle.valid()) return errno;
  int status = SetOption(handle.get(), SOL_SOCKET, SO_BROADCAST, 1);
  const j1939_filter claims{0, 0, J1939_PGN_ADDRESS_CLAIMED, J1939_PGN_PDU1_MAX, 0, 0};
  if (status == 0) status = SetOption(handle.get(), SOL_CAN_J1939, SO_J1939_FILTER, claims);
  if (status == 0) status = BindJ1939(handle, J1939Address(index, name, J1939_NO_PGN, address));
  if (status == 0) handle_ = std::move(handle);
  return status;
}

int J1939Socket::receive(J1939Message& out, uint32_t maxBytes) {
  out = J1939Message{};
  out.data.resize(maxBytes);
  sockaddr_can source{};
  iovec vector{out.data.data(), out.data.size()};
  alignas(cmsghdr) char control[256];
  msghdr h{&source, sizeof source, &vector, 1, control, sizeof control, 0};
  const ssize_t bytes = recvmsg(handle_.get(), &h, MSG_DONTWAIT);
  if (bytes < 0) return errno == EAGAIN || errno == EWOULDBLOCK || errno == EINTR ? 0 : -errno;
  out.data.resize(std::min<size_t>(static_cast<size_t>(bytes), maxBytes));
  out.pgn = source.can_addr.j1939.pgn;
  out.source = source.can_addr.j1939.addr;
  ReadJ1939Control(h, out);
  return 1;
}

int J1939Socket::sendAddressClaim(uint64_t name) {
  uint8_t data[kClaimBytes];
  for (size_t i = 0; i < kClaimBytes; ++i) data[i] = static_cast<uint8_t>(name >> (8 * i));
  const sockaddr_can to = J1939Address(0, J1939_NO_NAME, J1939_PGN_ADDRESS_CLAIMED, J1939_NO_ADDR);
  const ssize_t sent = sendto(handle_.get(), data, sizeof data, MSG_DONTWAIT,
                              reinterpret_cast<const sockaddr*>(&to), sizeof to);
  return sent == static_cast<ssize_t>(sizeof data) ? 0 : errno;
}

bool J1939Available() {
  FileHandle probe(socket(PF_CAN, SOCK_DGRAM | SOCK_CLOEXEC, CAN_J1939));
  return probe.valid();
}

WakeEvent::WakeEvent() : handle_(eventfd(0, EFD_CLOEXEC | EFD_NONBLOCK)) {}

void WakeEvent::signal() {
  const uint64_t one = 1;
  (void)!write(handle_.get(), &one, sizeof one);
}

void WakeEvent::clear() {
  uint64_t value = 0;
  (void)!read(handle_.get(), &value, sizeof value);
}

void WaitReadable(const std::vector<int>& fds, int64_t timeoutNs) {
  std::vector<pollfd> polled;
  for (int fd : fds) {
    if (fd >= 0) polled.push_back(pollfd{fd, POLLIN, 0});
  }
  const int64_t ms = timeoutNs < 0 ? -1 : (timeoutNs + 999'999) / 1'000'000;
  (void)poll(polled.data(), polled.size(), static_cast<int>(std::min<int64_t>(ms, 60'000)));
}

void PauseNs(int64_t ns) {
  if (ns > 0) std::this_thread::sleep_for(std::chrono::nanoseconds(ns));
}

}  // namespace tarvix
