// qverr::Exception: the report moves into a copy, the code stays with both.
#include <gtest/gtest.h>

#include "errors/Exception.h"

namespace {

using namespace qverr;

TEST(ExceptionTest, CopyTakesReportAndSourceKeepsCode) {
  Exception original;
  setError(original.status(), -52006, {"f", 132, "kelvanert", "qvapalerr_resourceNotFound"});
  const std::string report = original.what();
  const Exception copy(original);
  EXPECT_EQ(copy.what(), report);
  EXPECT_EQ(copy.code(), -52006);
  EXPECT_STREQ(original.what(), "");
  EXPECT_EQ(original.code(), -52006);
}

}  // namespace
