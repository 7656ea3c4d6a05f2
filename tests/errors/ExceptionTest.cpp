// qverr::Exception: default state, what(), and the report moving into copies.
#include <gtest/gtest.h>

#include "errors/Exception.h"

namespace {

using namespace qverr;

TEST(ExceptionTest, DefaultHasCodeZeroAndEmptyTexts) {
  const Exception exception;
  EXPECT_EQ(exception.code(), 0);
  EXPECT_STREQ(exception.what(), "");
  EXPECT_STREQ(exception.reportText(), "");
}

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

TEST(ExceptionTest, CaughtAsStdExceptionAndAsExceptionBase) {
  auto raise = [] {
    Exception exception;
    setCode(exception.status(), -1);
    throw exception;
  };
  EXPECT_THROW(raise(), std::exception);
  EXPECT_THROW(raise(), ExceptionBase);
}

}  // namespace
