// Path joining and trimming, validation, local conversions and bounded copies.
#include <gtest/gtest.h>

#include <ostream>
#include <vector>

#include "errors/RaiseSites.h"
#include "errors/cExceptionBase.h"
#include "paths/cPath.h"

namespace {

using kxpath::cPath;
using nENSPAN000::cExceptionBase;
using nENSPAN000::ErrorKind;
using nENSPAN000::packLocation;

struct Join {
  std::string current;
  std::string component;
  std::string result;
};

void PrintTo(const Join& j, std::ostream* out) { *out << j.current << " + " << j.component; }

class JoinTest : public ::testing::TestWithParam<Join> {};

TEST_P(JoinTest, TrimsAndJoinsWithBackslash) {
  cPath path(GetParam().current);
  path.append(GetParam().component);
  EXPECT_EQ(path.getUtf8(), GetParam().result);
}

INSTANTIATE_TEST_SUITE_P(
    Rules, JoinTest,
    ::testing::Values(Join{"C:\\QV-RT\\", "  tarvix\\\\", "C:\\QV-RT\\tarvix"},
                      Join{"", "log", "log"}, Join{"C:\\QV-RT", "\\", "C:\\QV-RT\\"},
                      Join{"a", "\\b", "a\\\\b"}, Join{" a \t", "b \r\n", "a\\b"},
                      Join{"a", std::string("b\0", 2), "a\\b"}, Join{"a", "x/../y", "a\\x/../y"},
                      Join{"a", "\xc3\xa0 ", "a\\\xc3\xa0"}, Join{"a", " \xc2\xa0", "a\\\xc2\xa0"},
                      Join{"a\v\f", "b", "a\\b"}));

uint32_t locationOf(ErrorKind kind, uint32_t line) { return packLocation(kind, 22, 1, line); }

TEST(cPathTest, InvalidComponentThrowsLine426AndLeavesPath) {
  for (const std::string& bad : {std::string("\xc0\x80"), std::string("\xed\xa0\x80")}) {
    cPath path("C:\\QV-RT");
    try {
      path.append(bad);
      FAIL();
    } catch (const cExceptionBase& e) {
      EXPECT_EQ(e.errorCode(), 1);
      EXPECT_EQ(e.locationWord(), locationOf(ErrorKind::UsageError, 426));
    }
    EXPECT_EQ(path.getUtf8(), "C:\\QV-RT");
  }
}

TEST(cPathTest, AppendLocalStoresUtf8AndGetLocalGivesBytesBack) {
  cPath path("C:\\logs");
  path.appendLocal(
      "M\xfc"
      "ller.txt");
  EXPECT_EQ(path.getUtf8(), "C:\\logs\\M\xc3\xbcller.txt");
  EXPECT_EQ(path.getLocal(),
            "C:\\logs\\M\xfc"
            "ller.txt");
  path.appendLocal("  name  .txt");  // leading blanks go, inner and trailing ones stay
  EXPECT_EQ(path.getUtf8(), "C:\\logs\\M\xc3\xbcller.txt\\name  .txt");
}

TEST(cPathTest, AppendLocalWithInvalidByteThrowsTranslatedConversionError) {
  cPath path("C:\\logs");
  try {
    path.appendLocal("x\x81");
    FAIL();
  } catch (const cExceptionBase& e) {
    EXPECT_EQ(e.errorCode(), -52027);
    EXPECT_EQ(e.locationWord(), locationOf(ErrorKind::StatusCode, 59));
  }
  EXPECT_EQ(path.getUtf8(), "C:\\logs");
}

// A missing buffer is refused (size 0 is too small even without one); the size holds the
// terminator too.
TEST(cPathTest, CopyIntoAMissingOrTooSmallBufferThrowsAndExactSizeSucceeds) {
  const cPath path("C:\\QV-RT");
  std::vector<char> exact(path.getUtf8().size() + 1, 'x');
  const struct {
    char* buffer;
    uint32_t size;
    int32_t code;
    uint32_t line;
  } rows[] = {
      {exact.data(), static_cast<uint32_t>(exact.size() - 1), nENSPAN000::kDriverBufferTooSmall,
       76},
      {nullptr, 10, nENSPAN000::kDriverBufferMissing, 71},
      {nullptr, 0, nENSPAN000::kDriverBufferTooSmall, 76},
  };
  for (const auto& row : rows) {
    try {
      path.copyLocal(row.buffer, row.size);
      ADD_FAILURE() << "no exception for size " << row.size;
    } catch (const cExceptionBase& e) {
      EXPECT_EQ(e.errorCode(), row.code) << row.size;
      EXPECT_EQ(e.locationWord(), locationOf(ErrorKind::DriverStatus, row.line)) << row.size;
    }
  }
  path.copyUtf8(exact.data(), static_cast<uint32_t>(exact.size()));
  EXPECT_STREQ(exact.data(), "C:\\QV-RT");
}

TEST(cPathTest, CopyLocalWritesCodePageBytes) {
  const cPath path("\xc3\xa9t\xc3\xa9");
  char buffer[4];
  path.copyLocal(buffer, sizeof buffer);
  EXPECT_STREQ(buffer, "\xe9t\xe9");
}

}  // namespace
