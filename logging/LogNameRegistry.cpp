// The registry of open log files.
#include "logging/LogNameRegistry.h"

namespace nKV_DLL300 {

bool LogNameRegistry::claim(const std::string& file) {
  const std::lock_guard<std::mutex> guard(lock_);
  return held_.insert(file).second;
}

void LogNameRegistry::release(const std::string& file) {
  const std::lock_guard<std::mutex> guard(lock_);
  held_.erase(file);
}

LogNameRegistry& TheLogNameRegistry() {
  // Never destroyed: sessions may still close their logs while static objects are destroyed.
  static LogNameRegistry* const registry = new LogNameRegistry();
  return *registry;
}

}  // namespace nKV_DLL300
