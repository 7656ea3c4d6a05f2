// The kind of bus: the one enumeration of the module, the simulated driver and the host tools.
#pragma once

#include <cstdint>
#include <optional>

#include "driver/Properties.h"

namespace driver {

// CAN (with CAN FD and J1939), LIN or FlexRay. The numbers are a host connection's bus type, in
// which 0 means that no interface was named yet.
enum class BusKind : uint32_t { kNone = 0, kCan = 1, kLin = 2, kFlexRay = 3 };

// The interface protocol number of a bus (kPropInterfaceProtocol: 0 CAN, 1 FlexRay, 2 LIN), which
// measurement-data channels store too; kNone counts as CAN.
constexpr uint32_t ProtocolOfBus(BusKind bus) {
  switch (bus) {
    case BusKind::kLin:
      return kProtocolLin;
    case BusKind::kFlexRay:
      return kProtocolFlexRay;
    case BusKind::kNone:
    case BusKind::kCan:
      break;
  }
  return kProtocolCan;
}

// The bus of an interface protocol number; nullopt for any other number.
constexpr std::optional<BusKind> BusOfProtocol(int64_t protocol) {
  switch (protocol) {
    case kProtocolCan:
      return BusKind::kCan;
    case kProtocolFlexRay:
      return BusKind::kFlexRay;
    case kProtocolLin:
      return BusKind::kLin;
    default:
      return std::nullopt;
  }
}

}  // namespace driver
