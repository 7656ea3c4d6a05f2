// Code page <-> UTF-8 conversions, their codes and the thrown conversion error.
#include <gtest/gtest.h>

#include "errors/Exception.h"
#include "errors/RaiseSites.h"
#include "paths/LocalText.h"

namespace {

using kxpath::mbsToUtf8;
using kxpath::utf8ToMbs;

TEST(LocalTextTest, NullAndEmptySucceedWithEmptyOutput) {
  std::string out = "stale";
  EXPECT_EQ(mbsToUtf8(nullptr, out), 0);
  EXPECT_TRUE(out.empty());
  out = "stale";
  EXPECT_EQ(utf8ToMbs("", out), 0);
  EXPECT_TRUE(out.empty());
}

TEST(LocalTextTest, HighCharactersRoundTrip) {
  std::string utf8;
  ASSERT_EQ(mbsToUtf8("M\xfc"
                      "ller \x80",
                      utf8),
            0);
  EXPECT_EQ(utf8, "M\xc3\xbcller \xe2\x82\xac");
  std::string local;
  ASSERT_EQ(utf8ToMbs(utf8.c_str(), local), 0);
  EXPECT_EQ(local,
            "M\xfc"
            "ller \x80");
}

TEST(LocalTextTest, InvalidCodePageByteFails) {
  std::string out;
  EXPECT_EQ(mbsToUtf8("bad\x8d", out), qverr::kConversionFailed);
}

TEST(LocalTextTest, IllFormedUtf8Fails) {
  std::string out;
  EXPECT_EQ(utf8ToMbs("\xed\xa0\x80", out), qverr::kConversionFailed);
  EXPECT_EQ(utf8ToMbs("ok\xc3", out), qverr::kConversionFailed);
}

TEST(LocalTextTest, UnrepresentableCharacterBecomesDefaultCharacter) {
  std::string out;
  EXPECT_EQ(utf8ToMbs("\xd0\x96x", out), 0);  // Cyrillic Zhe
  EXPECT_EQ(out, "?x");
}

TEST(LocalTextTest, ConversionErrorIsThrownWithItsSite) {
  try {
    kxpath::throwConversionError(qverr::kConversionFailed, qverr::kLineFromUtf8);
    FAIL();
  } catch (const qverr::Exception& e) {
    EXPECT_EQ(e.code(), -52027);
    EXPECT_STREQ(
        e.what(),
        R"({"error_constant":"err","file":"qvsstutf8/mbsToUtf8","line":99,"component":"kelvanert"})");
  }
}

}  // namespace
