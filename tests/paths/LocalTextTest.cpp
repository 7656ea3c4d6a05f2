// Code page <-> UTF-8 conversions, their codes and the thrown conversion error.
#include <gtest/gtest.h>

#include "errors/Exception.h"
#include "errors/RaiseSites.h"
#include "paths/LocalText.h"

namespace {

using kxpath::mbsToUtf8;
using kxpath::utf8ToMbs;

// The code page itself is tested in platform/; here the codes and outputs of the two directions.
TEST(LocalTextTest, ConversionsGiveTheirTextOrTheConversionCode) {
  const struct {
    bool toUtf8;
    const char* input;
    int32_t code;
    std::string output;  // "" after a failure
  } rows[] = {
      {true, nullptr, 0, ""},
      {true, "M\xfcller \x80", 0, "M\xc3\xbcller \xe2\x82\xac"},
      {true, "bad\x8d", qverr::kConversionFailed, ""},
      {false, "", 0, ""},
      {false, "M\xc3\xbcller \xe2\x82\xac", 0, "M\xfcller \x80"},
      {false, "\xed\xa0\x80", qverr::kConversionFailed, ""},
      {false, "ok\xc3", qverr::kConversionFailed, ""},
      {false, "\xd0\x96x", 0, "?x"},  // Cyrillic Zhe has no byte: the default character
  };
  for (const auto& row : rows) {
    std::string out = "stale";
    const int32_t code = row.toUtf8 ? mbsToUtf8(row.input, out) : utf8ToMbs(row.input, out);
    EXPECT_EQ(code, row.code) << (row.input ? row.input : "null");
    if (code == 0) EXPECT_EQ(out, row.output) << (row.input ? row.input : "null");
  }
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
