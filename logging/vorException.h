// The error object of the measurement-data library loader: a code and nothing else.
#pragma once

#include <cstdint>

namespace nKV_DLL300 {

// The library cannot be loaded, an entry point is missing, or an entry point is called while the
// library is not loaded.
inline constexpr int32_t kVorLibraryNotLoaded = -2519;
// The library cannot be unloaded.
inline constexpr int32_t kVorLibraryNotUnloaded = -2531;

// Thrown by value by MeasurementLibrary; derives from nothing, so only the log opening, the
// measurement-data writer and the module's unload, which catch it by name, ever see it.
struct vorException {
  int32_t code;
};

}  // namespace nKV_DLL300
