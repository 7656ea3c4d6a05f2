// Properties stored and acknowledged without a check, and the two that store only valid values.
#pragma once

#include "protocol/PropertyReply.h"

namespace nKV_DLL300 {

// Installs the handlers of the baud rates, report period, table capacity, key slot, ISO FD mode,
// node address and name (ids 2, 3, 4, 20, 21, 31, 34, 35), CAN I/O mode and application protocol
// (ids 22, 23).
void AddPlainPropertyHandlers(PropertyHandlerTable& table);

}  // namespace nKV_DLL300
