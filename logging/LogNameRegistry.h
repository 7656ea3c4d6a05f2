// The log files that sessions of this process have open, so that no file is opened by two.
#pragma once

#include <mutex>
#include <set>
#include <string>

namespace nKV_DLL300 {

// A file is held under its resolved native path (platform::ResolvedNativePath), claimed before it
// is opened. The path is compared, not the file's device and inode after the open: opening
// truncates a text or binary log ("w") and the measurement-data library replaces its file, so an
// identity learned after the open comes too late to leave the first session's log untouched. The
// resolved path already makes every name that reaches one file through the drive mapping equal
// (drive letter case, separators, "." and "..", symbolic links); a host's name is a plain file
// name in the one service directory, so it can name no other alias of the file.
//
// Threads: any; every call takes the registry's lock. Sessions' poll threads claim, the threads
// that stop sessions release.
class LogNameRegistry {
 public:
  // True when no one held `file` and the caller now does; false when it is held already.
  [[nodiscard]] bool claim(const std::string& file);
  // Gives up `file`; nothing when it is not held.
  void release(const std::string& file);

 private:
  std::mutex lock_;
  std::set<std::string> held_;  // lock_
};

// The process's one registry, shared by all sessions.
LogNameRegistry& TheLogNameRegistry();

}  // namespace nKV_DLL300
