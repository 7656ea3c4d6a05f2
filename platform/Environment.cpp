// getenv behind the runtime's environment query.
#include "platform/Environment.h"

#include <cstdlib>

namespace platform {

std::optional<std::string> GetEnvironmentVariable(const char* name) {
  if (name == nullptr) return std::nullopt;
  const char* value = std::getenv(name);
  if (value == nullptr) return std::nullopt;
  return std::string(value);
}

}  // namespace platform
