// Directory creation through the path library's wrapper.
#include "qvsysq/cSysqWrapper.h"

#include "qvsysq/DirectoryCreation.h"

namespace kxpath {

void cSysqWrapper::createDirectories(const char* path, bool* existed) {
  qvsysq::createDirectories(path, existed);
}

}  // namespace kxpath
