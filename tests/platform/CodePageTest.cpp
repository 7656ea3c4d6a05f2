// Windows-1252 both ways: the high controls table, invalid bytes and the default character.
#include <gtest/gtest.h>

#include "platform/CodePage.h"

namespace {

TEST(CodePageTest, HighBytesDecodeThroughTable) {
  std::u16string wide;
  ASSERT_TRUE(
      platform::CodePageToUtf16("\x80\x9F\xE9\xFF"
                                "a",
                                wide));
  EXPECT_EQ(wide, (std::u16string{0x20AC, 0x0178, 0x00E9, 0x00FF, u'a'}));
}

TEST(CodePageTest, EachUnassignedByteFailsStrictConversion) {
  for (const char invalid : {'\x81', '\x8D', '\x8F', '\x90', '\x9D'}) {
    std::u16string wide = u"stale";
    EXPECT_FALSE(platform::CodePageToUtf16(std::string("ok") + invalid, wide)) << int(invalid);
    EXPECT_TRUE(wide.empty());
  }
}

TEST(CodePageTest, LenientConversionKeepsUnassignedBytesAsControls) {
  std::u16string wide;
  ASSERT_TRUE(platform::CodePageToUtf16("\x81", wide, false));
  std::string back;
  platform::Utf16ToCodePage(wide, back);
  EXPECT_EQ(back, "\x81");
}

TEST(CodePageTest, EveryAssignedByteRoundTrips) {
  std::string all;
  for (int byte = 1; byte < 256; ++byte) {
    if (byte == 0x81 || byte == 0x8D || byte == 0x8F || byte == 0x90 || byte == 0x9D) continue;
    all += static_cast<char>(byte);
  }
  std::u16string wide;
  ASSERT_TRUE(platform::CodePageToUtf16(all, wide));
  std::string back;
  platform::Utf16ToCodePage(wide, back);
  EXPECT_EQ(back, all);
}

TEST(CodePageTest, UnrepresentableCharactersBecomeQuestionMarks) {
  std::string out;
  platform::Utf16ToCodePage(std::u16string{0x0410, u'x', 0xD83D, 0xDE00, 0xDC00}, out);
  EXPECT_EQ(out, "?x??");
}

}  // namespace
