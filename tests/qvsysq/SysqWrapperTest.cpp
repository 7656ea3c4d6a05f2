// The fixed answers of the system queries.
#include <gtest/gtest.h>

#include "qvsysq/cSysqWrapper.h"

namespace {

TEST(SysqWrapperTest, AnswersFixedDirectories) {
  kxpath::cSysqWrapper wrapper;
  EXPECT_EQ(wrapper.getRootDir(), "C:\\QV-RT");
  EXPECT_EQ(wrapper.getSharedDir(), "C:\\QV-RT");
  EXPECT_EQ(wrapper.getSystemDir(), "C:\\QV-RT\\SYSTEM");
  EXPECT_EQ(wrapper.getErrorFilesDir(), "C:\\QV-RT\\SYSTEM");
  EXPECT_EQ(wrapper.getTempDir(), "c:\\temp");
  EXPECT_EQ(wrapper.getDataDir(0), "C:\\QV-RT");
}

TEST(SysqWrapperTest, TempFileNamesAreUniqueUnderTempDir) {
  qvsysq::SysqWrapper wrapper;
  const std::string first = wrapper.getTempFileName();
  const std::string second = wrapper.getTempFileName();
  EXPECT_EQ(first.rfind("c:\\temp\\", 0), 0u);
  EXPECT_NE(first, second);
}

}  // namespace
