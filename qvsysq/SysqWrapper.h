// System queries: the fixed base directories of the controller.
#pragma once

#include <cstdint>
#include <string>

namespace qvsysq {

// A cheap value object without state; make one on the stack per lookup. Every query runs under
// its own status and cannot fail.
class SysqWrapper {
 public:
  virtual ~SysqWrapper();
  virtual std::string getRootDir();              // "C:\QV-RT"
  virtual std::string getSharedDir();            // "C:\QV-RT"
  virtual std::string getSystemDir();            // "C:\QV-RT\SYSTEM"
  virtual std::string getErrorFilesDir();        // "C:\QV-RT\SYSTEM"
  virtual std::string getTempDir();              // "c:\temp"
  virtual std::string getDataDir(int32_t kind);  // "C:\QV-RT"; kind is ignored
  virtual std::string getTempFileName();         // "c:\temp\" and a name unique in this process
};

}  // namespace qvsysq
