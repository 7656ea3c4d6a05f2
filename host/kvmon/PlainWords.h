// The controller's error texts and status codes told in plain words for the person at the host.
#pragma once

#include <cstdint>
#include <string>

namespace kvmon {

// What `reply` (a type 5 text such as "<ERROR: WRONG PORT NAME>\n") means, for a session on
// `interfaceName`. Texts kvmon does not know are shown as the controller wrote them.
std::string ExplainError(const std::string& reply, const std::string& interfaceName);

// A driver or controller status code in words, with the code: "no such interface (driver status
// 0xBFF63040)". Codes without a description are shown as numbers.
std::string DescribeStatus(int32_t status);

// The kvmon option that sets `property` ("SET_PROP_SESSION_BAUDRATE" gives "--baud"), or the
// property name itself when no option sets it.
std::string OptionOfProperty(const std::string& property);

}  // namespace kvmon
