// Temporary file names of the system queries.
#include <gtest/gtest.h>

#include "qvsysq/cSysqWrapper.h"

namespace {

TEST(SysqWrapperTest, TempFileNamesAreUniqueUnderTempDir) {
  qvsysq::SysqWrapper wrapper;
  const std::string first = wrapper.getTempFileName();
  const std::string second = wrapper.getTempFileName();
  EXPECT_EQ(first.rfind("c:\\temp\\", 0), 0u);
  EXPECT_NE(first, second);
}

}  // namespace
