// The runtime's standard directories by id; ids 16 and 17 are the service directory.
#pragma once

#include <cstdint>

#include "paths/cPath.h"
#include "qvsysq/cSysqWrapper.h"

namespace kxpath {

inline constexpr int32_t kServiceConfigPathId = 16;  // where kelvanert.ini lives
inline constexpr int32_t kServiceLogPathId = 17;     // where log files go

// Builds the path of standard directory `id` (0-17) from the wrapper's answers and, for the
// data directories (2, 3, 11, 12, 15, 16, 17), creates it with every missing parent.
// Throws nENSPAN000::cExceptionBase: kind 2 line 161 for an id above 17 (compared unsigned),
// kind 3 with the status code when the directory cannot be created.
cPath getStandardPath(int32_t id, cSysqWrapper& wrapper);

}  // namespace kxpath
