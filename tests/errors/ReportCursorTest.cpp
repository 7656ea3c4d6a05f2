// Report members: escaping of every byte class, commas, nesting and unscannable reports.
#include <gtest/gtest.h>

#include <ostream>

#include "errors/ReportCursor.h"

namespace {

using namespace qverr;

struct Escape {
  std::string raw;
  std::string escaped;
};

void PrintTo(const Escape& e, std::ostream* out) { *out << e.escaped; }

class EscapeJsonTest : public ::testing::TestWithParam<Escape> {};

TEST_P(EscapeJsonTest, EscapesByteClass) {
  EXPECT_EQ(escapeJson(GetParam().raw), GetParam().escaped);
}

INSTANTIATE_TEST_SUITE_P(
    Bytes, EscapeJsonTest,
    ::testing::Values(Escape{"\b", "\\b"}, Escape{"\t", "\\t"}, Escape{"\n", "\\n"},
                      Escape{"\f", "\\f"}, Escape{"\r", "\\r"}, Escape{"\"", "\\\""},
                      Escape{"\\", "\\\\"}, Escape{"\x01", "\\u0001"}, Escape{"\x1b", "\\u001b"},
                      Escape{"\x0b", "\\u000b"}, Escape{"\x1f", "\\u001f"},
                      Escape{"\x7f", "\\u007f"}, Escape{"\xc3\xa9\xff", "\xc3\xa9\xff"},
                      Escape{"a/b", "a/b"}, Escape{"C:\\QV-RT", "C:\\\\QV-RT"}));

TEST(ReportCursorTest, FirstMemberHasNoCommaSecondHasOne) {
  Status status;
  ReportCursor cursor(status);
  cursor.addInteger("a", -5);
  cursor.addString("b", "x");
  EXPECT_STREQ(status.report, R"({"a":-5,"b":"x"})");
}

TEST(ReportCursorTest, NestedObjectsCloseBackIntoParent) {
  Status status;
  ReportCursor cursor(status);
  cursor.addInteger("line", 1);
  cursor.openObject("inner");
  cursor.addString("api", "errno");
  cursor.openObject("deeper");
  cursor.closeObject();
  cursor.addInteger("code", 2);
  cursor.closeObject();
  cursor.openObject("next");
  cursor.closeObject();
  cursor.addString("last", nullptr);
  EXPECT_STREQ(status.report,
               R"({"line":1,"inner":{"api":"errno","deeper":{},"code":2},"next":{},"last":""})");
}

TEST(ReportCursorTest, EmptyObjectWithBlanksGetsNoComma) {
  Status status;
  setReportText(status, "{ \n\t}");
  ReportCursor cursor(status);
  cursor.addInteger("a", 1);
  EXPECT_STREQ(status.report, "{ \n\t\"a\":1}");
}

TEST(ReportCursorTest, AppendsToExistingReportAfterNestedValues) {
  Status status;
  setReportText(status, R"( {"a":[1,{"b":"}"}],"c":-1.5e+3} )");
  ReportCursor cursor(status);
  cursor.addInteger("d", 4);
  EXPECT_STREQ(status.report, R"( {"a":[1,{"b":"}"}],"c":-1.5e+3,"d":4} )");
}

TEST(ReportCursorTest, UnscannableReportGetsNothing) {
  Status status;
  setReportText(status, R"({"a":})");
  ReportCursor cursor(status);
  EXPECT_FALSE(cursor.isValid());
  cursor.addInteger("b", 1);
  EXPECT_STREQ(status.report, R"({"a":})");
}

}  // namespace
