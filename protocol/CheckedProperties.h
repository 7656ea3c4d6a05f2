// Properties that are stored, then answered with their acknowledgement or a range error.
#pragma once

#include "protocol/PropertyReply.h"

namespace nKV_DLL300 {

// Installs the handlers of ids 5, 7, 17, 18, 19, 32 and 33. A value out of range stays stored.
void AddCheckedPropertyHandlers(PropertyHandlerTable& table);

}  // namespace nKV_DLL300
