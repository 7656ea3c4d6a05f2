// One handler per property identifier: reads the value, stores it in the settings, replies.
#pragma once

#include <cstdint>
#include <string_view>

namespace nKV_DLL300 {

class HostConnection;

// Runs in the service thread with the value text of a property message (everything after the
// first "=", possibly empty).
using PropertyHandler = void (*)(HostConnection& connection, std::string_view value);

// The handler of property `id` (1 to 35); a handler that does nothing for any other id.
PropertyHandler PropertyHandlerFor(int32_t id);

}  // namespace nKV_DLL300
