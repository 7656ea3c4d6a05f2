// The system queries of the path library, with directory creation added.
#pragma once

#include "qvsysq/SysqWrapper.h"

namespace kxpath {

class cSysqWrapper : public qvsysq::SysqWrapper {
 public:
  // See qvsysq::createDirectories: throws qverr::Exception when the directory cannot be made.
  virtual void createDirectories(const char* path, bool* existed);
};

}  // namespace kxpath
