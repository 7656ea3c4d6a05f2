// Codes, source units and lines of the places that raise errors of either family.
#pragma once

#include <cstdint>

#include "qvapal/ErrorCodes.h"

namespace qverr {

// Converting text between the local code page and UTF-8 failed.
inline constexpr int32_t kConversionFailed = -52027;
inline constexpr const char* kConversionConstant = "err";
inline constexpr const char* kConversionFile = "qvsstutf8/mbsToUtf8";
inline constexpr int32_t kLineToUtf8 = 77;
inline constexpr int32_t kLineFromUtf8 = 99;

// A growable working buffer could not be allocated.
inline constexpr const char* kAllocatorFile = "qvhtl/err/Allocator";
inline constexpr int32_t kLineAllocator = 32;

}  // namespace qverr

namespace nENSPAN000 {

// Codes of the driver family carried by cExceptionBase of kind 1.
inline constexpr int32_t kDriverOutOfMemory = static_cast<int32_t>(0xBFF63010u);
inline constexpr int32_t kDriverBufferTooSmall = static_cast<int32_t>(0xBFF63258u);
inline constexpr int32_t kDriverBufferMissing = static_cast<int32_t>(0xBFF63259u);

// Module and file numbers of the location word.
inline constexpr uint32_t kPathModule = 22;
inline constexpr uint32_t kPathFile = 1;
inline constexpr uint32_t kLogModule = 30;
inline constexpr uint32_t kLogFile = 2;

// Lines of the path library's raise sites.
inline constexpr uint32_t kLineTranslatedStatus = 59;
inline constexpr uint32_t kLineTranslatedOutOfMemory = 63;
inline constexpr uint32_t kLineCopyBufferMissing = 71;
inline constexpr uint32_t kLineCopyBufferTooSmall = 76;
inline constexpr uint32_t kLineBadStandardPathId = 161;
inline constexpr uint32_t kLineInvalidUtf8 = 426;
// Line of the log-file extension lookup (log file type other than 0, 1, 2).
inline constexpr uint32_t kLineBadLogType = 75;

}  // namespace nENSPAN000
