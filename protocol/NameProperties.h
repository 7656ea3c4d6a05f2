// Properties that name things: the port, the log file and the measurement-data group and channel.
#pragma once

#include "protocol/PropertyReply.h"

namespace nKV_DLL300 {

// Installs the handlers of ids 1, 6, 8 and 9.
void AddNamePropertyHandlers(PropertyHandlerTable& table);

// "@qv_corle_tarvix" follows the port name in the interface name given to the driver.
constexpr std::string_view kInterfaceSuffix = "@qv_corle_tarvix";
constexpr std::string_view kDefaultLogFileName = "KelvaneLog";

}  // namespace nKV_DLL300
