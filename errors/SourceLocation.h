// Where an error of the status family was raised: recorded in its report.
#pragma once

#include <cstdint>

namespace qverr {

struct SourceLocation {
  const char* file;  // the raising source unit, for example "qvsysq\stdpath_util"
  int32_t line;
  const char* component;      // "kelvanert", or null to leave the member out
  const char* errorConstant;  // symbolic name of the code, "qvapalerr_objectNameCollision"
};

inline constexpr const char* kComponentName = "kelvanert";

}  // namespace qverr
