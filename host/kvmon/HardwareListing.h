// kvmon --hardware: the controller's bus interfaces as a table for people or as JSON lines.
#pragma once

#include <cstdio>
#include <string>
#include <vector>

#include "host/HostMessage.h"

namespace kvmon {

// "CAN", "FlexRay", "LIN" for the protocol word of a hardware record, else its number.
std::string ProtocolName(uint32_t protocol);

// The table with a title line naming `controller` and the driver version of `header`.
void PrintHardwareTable(const std::vector<kvhost::HardwareEntry>& entries,
                        const kvhost::MessageHeaderView& header, const std::string& controller,
                        std::FILE* out);

// One JSON object per interface:
// {"interface":"CAN1","port":1,"protocol":0,"bus":"CAN","can_fd":false}.
void PrintHardwareJson(const std::vector<kvhost::HardwareEntry>& entries, std::FILE* out);

}  // namespace kvmon
