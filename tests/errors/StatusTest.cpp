// Status precedence, reports of setError, buffer growth, moving and checking statuses.
#include <gtest/gtest.h>

#include <cstring>
#include <string>

#include "errors/Exception.h"
#include "errors/ReportCursor.h"
#include "errors/Status.h"

namespace {

using namespace qverr;

constexpr int32_t kError = -52013;
constexpr int32_t kWarning = 7;
constexpr uint32_t kFirstBuffer = 512;
const SourceLocation kSite{"qvsysq\\stdpath_util", 124, "kelvanert",
                           "qvapalerr_objectNameCollision"};
const char* const kSiteReport =
    R"({"error_constant":"qvapalerr_objectNameCollision","file":"qvsysq\\stdpath_util","line":124,"component":"kelvanert"})";

// A policy that refuses to grow, standing for an allocation failure.
bool refuseGrowth(Status& status, uint32_t newCapacity) {
  if (newCapacity == 0 || status.capacity == 0) return defaultReallocate(status, newCapacity);
  return newCapacity <= status.capacity;
}

void expectInvariant(const Status& status) {
  ASSERT_NE(status.report, nullptr);
  EXPECT_EQ(status.report[status.capacity - 1], kReportSentinel);
  for (uint32_t i = std::strlen(status.report); i < status.capacity - 1; ++i) {
    ASSERT_EQ(status.report[i], '\0') << "at " << i;
  }
}

TEST(StatusTest, WarningThenErrorEndsWithErrorAndFreshReport) {
  Status status;
  ASSERT_TRUE(setCode(status, kWarning));
  setReportText(status, R"({"old":1})");
  EXPECT_TRUE(setCode(status, kError));
  EXPECT_EQ(status.code, kError);
  EXPECT_STREQ(status.report, "{}");
}

TEST(StatusTest, FirstErrorAndItsReportStay) {
  Status status;
  ASSERT_TRUE(setError(status, kError, kSite));
  EXPECT_FALSE(setError(status, -1, {"other", 1, nullptr, "x"}));
  EXPECT_FALSE(setCode(status, kWarning));
  EXPECT_EQ(status.code, kError);
  EXPECT_STREQ(status.report, kSiteReport);
}

TEST(StatusTest, SetErrorWithoutComponentLeavesItOut) {
  Status status;
  setError(status, -52000, {"qvhtl/err/Allocator", 32, nullptr, "qvapalerr_memoryFull"});
  EXPECT_STREQ(
      status.report,
      R"({"error_constant":"qvapalerr_memoryFull","file":"qvhtl/err/Allocator","line":32})");
}

TEST(StatusTest, MemberFillingExactlyTheFreeRoomDoesNotGrow) {
  Status status;
  ReportCursor cursor(status);
  const uint32_t room = status.freeRoom();
  ASSERT_EQ(room, kFirstBuffer - 4);
  const std::string value(room - 6, 'v');  // "k":"...": 6 bytes besides the value
  cursor.addString("k", value.c_str());
  EXPECT_EQ(status.capacity, kFirstBuffer);
  EXPECT_EQ(status.freeRoom(), 0u);
  EXPECT_EQ(std::string(status.report), "{\"k\":\"" + value + "\"}");
  expectInvariant(status);
}

TEST(StatusTest, OneByteMoreGrowsToNextPowerOfTwo) {
  Status status;
  ReportCursor cursor(status);
  const std::string value(status.freeRoom() - 5, 'v');
  cursor.addString("k", value.c_str());
  EXPECT_EQ(status.capacity, 2 * kFirstBuffer);
  EXPECT_EQ(std::string(status.report), "{\"k\":\"" + value + "\"}");
  expectInvariant(status);
}

TEST(StatusTest, FailedGrowthKillsCursorButKeepsCodeAndText) {
  Status status(refuseGrowth);
  setError(status, kError, kSite);
  ReportCursor cursor(status);
  const std::string big(kFirstBuffer, 'v');
  cursor.addString("big", big.c_str());
  EXPECT_FALSE(cursor.isValid());
  cursor.addInteger("later", 1);
  EXPECT_EQ(status.code, kError);
  EXPECT_STREQ(status.report, kSiteReport);
}

TEST(StatusTest, DefaultPolicyRejectsHugeRequestAndKeepsBuffer) {
  Status status;
  setReportText(status, "{}");
  EXPECT_FALSE(defaultReallocate(status, 0x80000000u));
  EXPECT_EQ(status.capacity, kFirstBuffer);
  EXPECT_TRUE(defaultReallocate(status, 100));
  EXPECT_EQ(status.capacity, kFirstBuffer);
}

TEST(StatusTest, MoveStatusHandsOverBufferAndSourceKeepsCode) {
  Status source;
  setError(source, kError, kSite);
  const char* buffer = source.report;
  Status destination;
  ASSERT_TRUE(moveStatus(destination, source));
  EXPECT_EQ(destination.report, buffer);
  EXPECT_EQ(destination.code, kError);
  EXPECT_EQ(source.code, kError);
  EXPECT_EQ(source.report, nullptr);
  EXPECT_EQ(source.capacity, 0u);
}

TEST(StatusTest, MoveBetweenPoliciesCopiesText) {
  Status source;
  setError(source, kError, kSite);
  Status destination(refuseGrowth);
  ASSERT_TRUE(moveStatus(destination, source));
  EXPECT_STREQ(destination.report, kSiteReport);
  EXPECT_STREQ(source.report, kSiteReport);
}

TEST(StatusTest, CopyStatusNotTakenLeavesDestination) {
  Status source;
  setError(source, -1, kSite);
  Status destination;
  setError(destination, kError, {"mine", 1, nullptr, "c"});
  const std::string before = destination.report;
  EXPECT_FALSE(copyStatus(destination, source));
  EXPECT_EQ(destination.report, before);
}

TEST(StatusTest, CheckStatusThrowsErrorWithReport) {
  Status status;
  setError(status, kError, kSite);
  try {
    checkStatus(status);
    FAIL() << "no exception";
  } catch (const Exception& e) {
    EXPECT_EQ(e.code(), kError);
    EXPECT_STREQ(e.what(), kSiteReport);
  }
  EXPECT_EQ(status.report, nullptr);
}

TEST(StatusTest, CheckStatusIgnoresWarningsAndSuccess) {
  Status warning;
  setCode(warning, kWarning);
  EXPECT_NO_THROW(checkStatus(warning));
  Status success;
  EXPECT_NO_THROW(checkStatus(success));
}

struct CheckOnUnwind {
  ~CheckOnUnwind() { checkStatus(status); }
  Status status;
};

TEST(StatusTest, CheckStatusDoesNotThrowWhileUnwinding) {
  try {
    CheckOnUnwind guard;
    setCode(guard.status, kError);
    throw std::runtime_error("first");
  } catch (const std::runtime_error& e) {
    EXPECT_STREQ(e.what(), "first");
  }
}

}  // namespace
