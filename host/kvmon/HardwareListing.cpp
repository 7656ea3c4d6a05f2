// The hardware table printed for people and for programs.
#include "host/kvmon/HardwareListing.h"

#include "driver/Properties.h"
#include "host/kvmon/JsonLines.h"

namespace kvmon {
namespace {

const char* CanFdText(const kvhost::HardwareEntry& entry) {
  if (entry.protocol != driver::kProtocolCan) return "-";
  return entry.canProperty != 0 ? "yes" : "no";
}

}  // namespace

std::string ProtocolName(uint32_t protocol) {
  switch (protocol) {
    case driver::kProtocolCan:
      return "CAN";
    case driver::kProtocolFlexRay:
      return "FlexRay";
    case driver::kProtocolLin:
      return "LIN";
    default:
      return std::to_string(protocol);
  }
}

void PrintHardwareTable(const std::vector<kvhost::HardwareEntry>& entries,
                        const kvhost::MessageHeaderView& header, const std::string& controller,
                        std::FILE* out) {
  std::fprintf(out, "Controller %s, driver version %u.%u.%u.%u, %zu interfaces\n\n",
               controller.c_str(), header.version[0], header.version[1], header.version[2],
               header.version[3], entries.size());
  std::fprintf(out, "%-16s %5s  %-8s %s\n", "Interface", "Port", "Bus", "CAN FD");
  for (const auto& entry : entries) {
    std::fprintf(out, "%-16s %5u  %-8s %s\n", entry.name.c_str(), entry.port,
                 ProtocolName(entry.protocol).c_str(), CanFdText(entry));
  }
}

void PrintHardwareJson(const std::vector<kvhost::HardwareEntry>& entries, std::FILE* out) {
  for (const auto& entry : entries) {
    std::fprintf(
        out, "{\"interface\":%s,\"port\":%u,\"protocol\":%u,\"bus\":%s,\"can_fd\":%s}\n",
        JsonString(entry.name).c_str(), entry.port, entry.protocol,
        JsonString(ProtocolName(entry.protocol)).c_str(),
        entry.protocol == driver::kProtocolCan && entry.canProperty != 0 ? "true" : "false");
  }
}

}  // namespace kvmon
