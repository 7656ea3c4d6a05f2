// The qvapalerr_ codes of the platform support layers (thread support, errors, directories).
#pragma once

#include <cstdint>

inline constexpr int32_t qvapalerr_memoryFull = -52000;
inline constexpr int32_t qvapalerr_resourceNotFound = -52006;
inline constexpr int32_t qvapalerr_osFault = -52008;
// A priority change was asked for a thread whose handle the controller does not own.
inline constexpr int32_t qvapalerr_handleNotOwned = -52010;
inline constexpr int32_t qvapalerr_objectNameCollision = -52013;
// start was called while the controller's thread is still running.
inline constexpr int32_t qvapalerr_threadRunning = -52016;
