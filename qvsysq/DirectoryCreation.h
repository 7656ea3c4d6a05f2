// Creating a directory and its missing parents on a runtime path, with JSON error reports.
#pragma once

#include "errors/Status.h"

namespace qvsysq {

inline constexpr const char* kDirectorySource = "qvsysq\\stdpath_util";
inline constexpr int32_t kLineCollision = 124;
inline constexpr int32_t kLineParentMissing = 132;
inline constexpr int32_t kLineMkdirFailed = 139;

// One level. Does nothing when `status` holds an error; otherwise creates `path` (existed =
// false), accepts an existing directory (existed = true), or records -52013 (something else is
// there, also when its attributes cannot be read), -52006 (parent missing) or -52008 with an
// "internal_error" and a "qvsysq_debug" object. Never throws. `existed` may be null.
void makeOneDirectory(const char* path, qverr::Status& status, bool* existed);

// Creates `path` and its missing parents (backslash-separated), climbing up while parents are
// missing and creating the chain downwards. Throws qverr::Exception on the first failure;
// directories made before it stay. *existed ends true only when the full path was already a
// directory. `existed` may be null.
void createDirectories(const char* path, bool* existed);

}  // namespace qvsysq
