// rtnetlink requests of the SocketCAN backend.
#include "tarvix/socketcan/LinkQuery.h"

#include <linux/can/netlink.h>
#include <linux/if_link.h>
#include <linux/netlink.h>
#include <linux/rtnetlink.h>
#include <net/if.h>
#include <sys/socket.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <vector>

#include "tarvix/socketcan/CanSockets.h"

namespace tarvix {
namespace {

constexpr size_t kReplyBytes = 16384;

// A netlink request under construction: header, interface message, attributes.
class Request {
 public:
  Request(uint16_t type, uint16_t flags, int index) : bytes_(NLMSG_SPACE(sizeof(ifinfomsg))) {
    nlmsghdr* h = header();
    h->nlmsg_type = type;
    h->nlmsg_flags = static_cast<uint16_t>(NLM_F_REQUEST | flags);
    h->nlmsg_seq = 1;
    info()->ifi_family = AF_UNSPEC;
    info()->ifi_index = index;
    sync();
  }
  nlmsghdr* header() { return reinterpret_cast<nlmsghdr*>(bytes_.data()); }
  ifinfomsg* info() { return static_cast<ifinfomsg*>(NLMSG_DATA(header())); }
  // Appends an attribute; returns its offset (for nests).
  size_t add(uint16_t type, const void* data, size_t size) {
    const size_t offset = bytes_.size();
    bytes_.resize(offset + RTA_SPACE(size));
    auto* a = reinterpret_cast<rtattr*>(bytes_.data() + offset);
    a->rta_type = type;
    a->rta_len = static_cast<uint16_t>(RTA_LENGTH(size));
    if (size > 0) std::memcpy(RTA_DATA(a), data, size);
    sync();
    return offset;
  }
  void close(size_t nest) {
    reinterpret_cast<rtattr*>(bytes_.data() + nest)->rta_len =
        static_cast<uint16_t>(bytes_.size() - nest);
  }
  const std::vector<char>& bytes() const { return bytes_; }

 private:
  void sync() { header()->nlmsg_len = static_cast<uint32_t>(bytes_.size()); }
  std::vector<char> bytes_;
};

// Sends `request` and reads the reply into `reply`: 0 or errno (from the kernel's error reply).
int Exchange(const Request& request, std::vector<char>& reply) {
  FileHandle handle(socket(AF_NETLINK, SOCK_RAW | SOCK_CLOEXEC, NETLINK_ROUTE));
  if (!handle.valid()) return errno;
  sockaddr_nl kernel{};
  kernel.nl_family = AF_NETLINK;
  const auto& bytes = request.bytes();
  if (sendto(handle.get(), bytes.data(), bytes.size(), 0, reinterpret_cast<sockaddr*>(&kernel),
             sizeof kernel) < 0)
    return errno;
  reply.resize(kReplyBytes);
  const ssize_t got = recv(handle.get(), reply.data(), reply.size(), 0);
  if (got < 0) return errno;
  reply.resize(static_cast<size_t>(got));
  auto* h = reinterpret_cast<nlmsghdr*>(reply.data());
  if (!NLMSG_OK(h, static_cast<uint32_t>(got))) return EIO;
  if (h->nlmsg_type == NLMSG_ERROR) return -static_cast<nlmsgerr*>(NLMSG_DATA(h))->error;
  return 0;
}

template <typename T>
T Value(const rtattr* a) {
  T v{};
  std::memcpy(&v, RTA_DATA(a), std::min<size_t>(sizeof v, RTA_PAYLOAD(a)));
  return v;
}

void ReadCanData(const rtattr* nest, LinkReport& out) {
  int left = static_cast<int>(RTA_PAYLOAD(nest));
  for (auto* a = static_cast<const rtattr*>(RTA_DATA(nest)); RTA_OK(a, left);
       a = RTA_NEXT(a, left)) {
    switch (a->rta_type) {
      case IFLA_CAN_BITTIMING:
        out.bitRate = Value<can_bittiming>(a).bitrate;
        break;
      case IFLA_CAN_DATA_BITTIMING:
        out.dataBitRate = Value<can_bittiming>(a).bitrate;
        break;
      case IFLA_CAN_CTRLMODE:
        out.controlModes = Value<can_ctrlmode>(a).flags;
        break;
      case IFLA_CAN_STATE:
        out.hasState = true;
        out.canState = Value<uint32_t>(a);
        break;
      case IFLA_CAN_BERR_COUNTER:
        out.hasCounters = true;
        out.txErrors = Value<can_berr_counter>(a).txerr;
        out.rxErrors = Value<can_berr_counter>(a).rxerr;
        break;
      default:
        break;
    }
  }
}

void ReadLinkInfo(const rtattr* nest, LinkReport& out) {
  int left = static_cast<int>(RTA_PAYLOAD(nest));
  for (auto* a = static_cast<const rtattr*>(RTA_DATA(nest)); RTA_OK(a, left);
       a = RTA_NEXT(a, left)) {
    // CAN controllers (can-dev) are of kind "can"; virtual devices are "vcan", "vxcan".
    if (a->rta_type == IFLA_INFO_KIND)
      out.canController = std::strncmp(static_cast<const char*>(RTA_DATA(a)), "can", 4) == 0;
    if (a->rta_type == IFLA_INFO_DATA) ReadCanData(a, out);
  }
}

void ReadLink(nlmsghdr* h, LinkReport& out) {
  auto* info = static_cast<ifinfomsg*>(NLMSG_DATA(h));
  out.index = info->ifi_index;
  out.up = (info->ifi_flags & IFF_UP) != 0;
  out.running = (info->ifi_flags & IFF_RUNNING) != 0;
  int left = static_cast<int>(IFLA_PAYLOAD(h));
  for (rtattr* a = IFLA_RTA(info); RTA_OK(a, left); a = RTA_NEXT(a, left)) {
    if (a->rta_type == IFLA_MTU) out.mtu = static_cast<int>(Value<uint32_t>(a));
    if (a->rta_type == IFLA_LINKINFO) ReadLinkInfo(a, out);
  }
}

int SetUp(int index, bool up) {
  Request r(RTM_NEWLINK, NLM_F_ACK, index);
  r.info()->ifi_change = IFF_UP;
  r.info()->ifi_flags = up ? IFF_UP : 0;
  std::vector<char> reply;
  return Exchange(r, reply);
}

int SetTiming(int index, const CanTiming& t) {
  Request r(RTM_NEWLINK, NLM_F_ACK, index);
  const size_t linkInfo = r.add(IFLA_LINKINFO, nullptr, 0);
  r.add(IFLA_INFO_KIND, "can", 4);
  const size_t data = r.add(IFLA_INFO_DATA, nullptr, 0);
  can_bittiming nominal{};
  nominal.bitrate = t.bitRate;
  r.add(IFLA_CAN_BITTIMING, &nominal, sizeof nominal);
  if (t.fd && t.dataBitRate != 0) {
    can_bittiming dataPhase{};
    dataPhase.bitrate = t.dataBitRate;
    r.add(IFLA_CAN_DATA_BITTIMING, &dataPhase, sizeof dataPhase);
  }
  can_ctrlmode modes{CAN_CTRLMODE_FD | CAN_CTRLMODE_LISTENONLY,
                     (t.fd ? CAN_CTRLMODE_FD : 0u) | (t.listenOnly ? CAN_CTRLMODE_LISTENONLY : 0u)};
  r.add(IFLA_CAN_CTRLMODE, &modes, sizeof modes);
  r.close(data);
  r.close(linkInfo);
  std::vector<char> reply;
  return Exchange(r, reply);
}

}  // namespace

int QueryLink(const std::string& name, LinkReport& out) {
  Request r(RTM_GETLINK, 0, 0);
  r.add(IFLA_IFNAME, name.c_str(), name.size() + 1);
  std::vector<char> reply;
  const int status = Exchange(r, reply);
  if (status != 0) return status;
  auto* h = reinterpret_cast<nlmsghdr*>(reply.data());
  if (h->nlmsg_type != RTM_NEWLINK) return EIO;
  out = LinkReport{};
  ReadLink(h, out);
  return 0;
}

int ConfigureCanLink(int index, const CanTiming& timing) {
  int status = SetUp(index, false);
  if (status == 0) status = SetTiming(index, timing);
  const int up = SetUp(index, true);
  return status != 0 ? status : up;
}

}  // namespace tarvix
