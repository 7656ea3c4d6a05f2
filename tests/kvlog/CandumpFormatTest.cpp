// candump log lines of every kind of CAN frame, and the frames that have no such line.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "host/kvlog/CandumpFormat.h"
#include "tests/logging/FrameBuilder.h"

namespace kvlog {
namespace {

using kvtest::FrameSpec;

struct CandumpCase {
  const char* name;
  FrameSpec frame;
  const char* expected;  // "" when the frame has no line
};

void PrintTo(const CandumpCase& c, std::ostream* os) { *os << c.name; }

// 2024-05-17 09:05:03.042000 UTC
const CandumpCase kCases[] = {
    {"ClassicStandard",
     {.identifier = 0x123, .payload = {0x11, 0x22, 0xab}},
     "(1715936703.042000) can0 123#1122AB\n"},
    {"ClassicExtended",
     {.identifier = 0x38FEF100, .payload = {0, 0x11}},
     "(1715936703.042000) can0 18FEF100#0011\n"},
    {"StandardMaskedTo11Bits",
     {.identifier = 0xF801, .payload = {}},
     "(1715936703.042000) can0 001#\n"},
    {"Remote", {.identifier = 0x321, .type = 0x01}, "(1715936703.042000) can0 321#R\n"},
    {"RemoteWithLength",
     {.identifier = 0x321, .type = 0x01, .lengthByte = 3},
     "(1715936703.042000) can0 321#R3\n"},
    {"FdWithoutSwitch",
     {.identifier = 0x201, .type = 0x10, .payload = {0xa0, 0xa1}},
     "(1715936703.042000) can0 201##4A0A1\n"},
    {"FdWithSwitchExtended",
     {.identifier = 0x3ABCDE00, .type = 0x18, .payload = {0xf0}},
     "(1715936703.042000) can0 1ABCDE00##5F0\n"},
    {"BusError",
     {.identifier = 0, .type = 0x02},
     "(1715936703.042000) can0 20000080#0000000000000000\n"},
    {"EchoEndsInT",
     {.identifier = 0x100, .flags = 0x80, .payload = {1}},
     "(1715936703.042000) can0 100#01 T\n"},
    {"ShortJ1939IsClassicExtended",
     {.identifier = 0x38FECA00, .type = 0xC0, .payload = {1, 2}},
     "(1715936703.042000) can0 18FECA00#0102\n"},
    {"LongJ1939HasNoLine",
     {.identifier = 0x38FECA00, .type = 0xC0, .payload = std::vector<uint8_t>(20)},
     ""},
    {"ClassicOverEightHasNoLine", {.identifier = 0x100, .payload = std::vector<uint8_t>(12)}, ""},
    {"LinTypeHasNoLine", {.identifier = 0x10, .type = 0x40, .payload = {1}}, ""},
    {"BeforeUnixEpochIsZero", {.timestamp = 5, .identifier = 0x1}, "(0.000000) can0 001#\n"},
    {"MicrosecondsTruncated",
     {.timestamp = kvtest::kAt090503042 + 12'349, .identifier = 0x1},
     "(1715936703.043234) can0 001#\n"},
};

class CandumpLines : public testing::TestWithParam<CandumpCase> {};

TEST_P(CandumpLines, FormatsTheFrame) {
  const auto batch = kvtest::Batch({GetParam().frame});
  char line[kCandumpLineCapacity];
  const size_t n = FormatCandumpLine(line, sizeof line, kvtest::FirstView(batch), "can0");
  EXPECT_EQ(std::string(line, n), GetParam().expected);
}

INSTANTIATE_TEST_SUITE_P(Kinds, CandumpLines, testing::ValuesIn(kCases));

TEST(CandumpFormat, LongestLineFitsAndBadNamesAreRefused) {
  const auto batch = kvtest::Batch({{.timestamp = 0x7FFF'FFFF'FFFF'FFFFull,
                                     .identifier = 0x3FFFFFFF,
                                     .type = 0x18,
                                     .flags = 0x80,
                                     .payload = std::vector<uint8_t>(64, 0xff)}});
  char line[kCandumpLineCapacity];
  const std::string longest(kMaxInterfaceName, 'x');
  EXPECT_GT(FormatCandumpLine(line, sizeof line, kvtest::FirstView(batch), longest), 0u);
  EXPECT_EQ(FormatCandumpLine(line, sizeof line, kvtest::FirstView(batch), longest + "x"), 0u);
  EXPECT_EQ(FormatCandumpLine(line, sizeof line, kvtest::FirstView(batch), "can 0"), 0u);
  EXPECT_EQ(FormatCandumpLine(line, sizeof line - 1, kvtest::FirstView(batch), "can0"), 0u);
}

}  // namespace
}  // namespace kvlog
