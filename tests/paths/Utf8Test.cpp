// UTF-8 well-formedness: accepted forms and every kind of reject.
#include <gtest/gtest.h>

#include <ostream>

#include "paths/Utf8.h"

namespace {

struct Sample {
  std::string bytes;
  bool valid;
  const char* name;
};

void PrintTo(const Sample& s, std::ostream* out) { *out << s.name; }

class Utf8ValidityTest : public ::testing::TestWithParam<Sample> {};

TEST_P(Utf8ValidityTest, JudgesSequence) {
  EXPECT_EQ(kxpath::isValidUtf8(GetParam().bytes), GetParam().valid);
}

INSTANTIATE_TEST_SUITE_P(
    Sequences, Utf8ValidityTest,
    ::testing::Values(
        Sample{"", true, "empty"}, Sample{"plain", true, "ascii"}, Sample{"\xc3\xa9", true, "two"},
        Sample{"\xe2\x82\xac", true, "three"}, Sample{"\xf0\x9f\x98\x80", true, "four"},
        Sample{"\xf4\x8f\xbf\xbf", true, "max"}, Sample{"\xc0\x80", false, "overlong_nul"},
        Sample{"\xe0\x9f\xbf", false, "overlong_three"},
        Sample{"\xf0\x8f\xbf\xbf", false, "overlong_four"},
        Sample{"\xed\xa0\x80", false, "surrogate"}, Sample{"\xed\xbf\xbf", false, "low_surrogate"},
        Sample{"\xf4\x90\x80\x80", false, "above_max"}, Sample{"\xe2\x82", false, "truncated"},
        Sample{"a\xc3", false, "truncated_end"}, Sample{"\x80", false, "lone_continuation"},
        Sample{"\xf8\x88\x80\x80\x80", false, "five_byte_lead"},
        Sample{"\xc3(", false, "bad_continuation"}));

TEST(Utf8TranscodingTest, RoundTripsThroughUtf16WithSurrogatePairs) {
  const std::string text = "a\xc3\xa9\xe2\x82\xac\xf0\x9f\x98\x80";
  const std::u16string wide = kxpath::utf8ToUtf16(text);
  EXPECT_EQ(wide, (std::u16string{u'a', 0xE9, 0x20AC, 0xD83D, 0xDE00}));
  EXPECT_EQ(kxpath::utf16ToUtf8(wide), text);
}

}  // namespace
