// Text log lines of every bus, byte for byte, with the options that change columns.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "logging/TextLogFormat.h"
#include "tests/logging/FrameBuilder.h"

namespace nKV_DLL300 {
namespace {

using kvtest::Counting;
using kvtest::FrameSpec;

enum class Bus { kCan, kLin, kLinChecksum, kFlexRay };

struct LineCase {
  const char* name;
  Bus bus;
  FrameSpec frame;
  const char* expected;
};
void PrintTo(const LineCase& c, std::ostream* os) { *os << c.name; }

std::string Format(Bus bus, const driver::RawFrameView& view, size_t cap = kTextLineCapacity) {
  std::vector<char> out(cap);
  size_t n = 0;
  switch (bus) {
    case Bus::kCan:
      n = FormatCanTextLine(out.data(), cap, view);
      break;
    case Bus::kLin:
      n = FormatLinTextLine(out.data(), cap, view, 0);
      break;
    case Bus::kLinChecksum:
      n = FormatLinTextLine(out.data(), cap, view, 1);
      break;
    case Bus::kFlexRay:
      n = FormatFlexRayTextLine(out.data(), cap, view);
      break;
  }
  return std::string(out.data(), n);
}

const LineCase kLines[] = {
    {"CanExtendedData",
     Bus::kCan,
     {.identifier = 0x2000'0100, .payload = {0xaa, 0xbb, 0xcc}},
     "09:05:03,042\t100\taa  bb  cc  \t3\tE\n"},
    {"CanStandardMaskedTo11Bits",
     Bus::kCan,
     {.identifier = 0x0000'F9A3, .payload = {1}},
     "09:05:03,042\t1a3\t01  \t1\tS\n"},
    {"CanExtendedMaskedTo29Bits",
     Bus::kCan,
     {.identifier = 0xFFFF'FFFF, .payload = {}},
     "09:05:03,042\t1fffffff\t\t0\tE\n"},
    {"CanStandardRemote",
     Bus::kCan,
     {.identifier = 0x321, .type = 0x01, .payload = {}},
     "09:05:03,042\t321\t\t0\tS/R\n"},
    {"CanExtendedRemote",
     Bus::kCan,
     {.identifier = 0x2000'0321, .type = 0x01},
     "09:05:03,042\t321\t\t0\tE/R\n"},
    {"CanFdStandard",
     Bus::kCan,
     {.identifier = 0x201, .type = 0x10, .payload = Counting(12)},
     "09:05:03,042\t201\t00  01  02  03  04  05  06  07  08  09  0a  0b  \t12\tFD\n"},
    {"CanFdExtended",
     Bus::kCan,
     {.identifier = 0x2000'0201, .type = 0x10, .payload = {0xff}},
     "09:05:03,042\t201\tff  \t1\tE/FD\n"},
    {"CanBrsStandard",
     Bus::kCan,
     {.identifier = 0x200, .type = 0x18, .payload = {0x10}},
     "09:05:03,042\t200\t10  \t1\tBRS\n"},
    {"CanBrsExtended",
     Bus::kCan,
     {.identifier = 0x3ABC'DE00, .type = 0x18, .payload = {0x10}},
     "09:05:03,042\t1abcde00\t10  \t1\tE/BRS\n"},
    {"CanBusErrorIsPlainType",
     Bus::kCan,
     {.identifier = 0, .type = 0x02},
     "09:05:03,042\t0\t\t0\tS\n"},
    {"CanEchoPrintsLikeAnyFrame",
     Bus::kCan,
     {.identifier = 0x100, .flags = 0x80, .payload = {7}},
     "09:05:03,042\t100\t07  \t1\tS\n"},
    {"LinPaddedToEightGroups",
     Bus::kLin,
     {.identifier = 0x1a, .type = 0x40, .payload = {1, 2}},
     "09:05:03,042\t1a\t01  02  00  00  00  00  00  00  \t2\tS\n"},
    {"LinEmptyPayload",
     Bus::kLin,
     {.identifier = 0x12, .type = 0x40},
     "09:05:03,042\t12\t00  00  00  00  00  00  00  00  \t0\tS\n"},
    {"LinNoResponse",
     Bus::kLin,
     {.identifier = 0x12, .type = 0x42, .info = 0x5a},
     "09:05:03,042\t12\t00  00  00  00  00  00  00  00  \t0\tNR\n"},
    {"LinNoResponseWithChecksum",
     Bus::kLinChecksum,
     {.identifier = 0x12, .type = 0x42, .info = 0x5a},
     "09:05:03,042\t12\t00  00  00  00  00  00  00  00  \t0\t5a\tNR\n"},
    {"LinFullWithChecksum",
     Bus::kLinChecksum,
     {.identifier = 0x11,
      .type = 0x40,
      .info = 0x07,
      .payload = {0xde, 0xad, 0xbe, 0xef, 1, 2, 3, 4}},
     "09:05:03,042\t11\tde  ad  be  ef  01  02  03  04  \t8\t07\tS\n"},
    {"LinBusErrorEndsInS",
     Bus::kLin,
     {.identifier = 0x3c, .type = 0x41, .payload = {9}},
     "09:05:03,042\t3c\t09  00  00  00  00  00  00  00  \t1\tS\n"},
    {"FlexRaySyncOnChannelA",
     Bus::kFlexRay,
     {.identifier = 5, .type = 0x20, .flags = 0x12, .info = 3, .payload = {0x0a, 0x0b}},
     "09:05:03,042\t5\t0a  0b  \t2\t3\tA\t-\tX\t-\n"},
    {"FlexRayBothChannelsPrintA",
     Bus::kFlexRay,
     {.identifier = 1, .type = 0x20, .flags = 0x33, .info = 63},
     "09:05:03,042\t1\t\t0\t63\tA\tX\tX\t-\n"},
    {"FlexRayChannelBPreamble",
     Bus::kFlexRay,
     {.identifier = 0x12345, .type = 0x21, .flags = 0x24},
     "09:05:03,042\t2345\t\t0\t0\tB\t-\t-\tX\n"},
    {"FlexRayNoChannel",
     Bus::kFlexRay,
     {.identifier = 40, .type = 0x20, .flags = 0x00, .payload = {1}},
     "09:05:03,042\t28\t01  \t1\t0\t-\t-\t-\t-\n"},
    {"MidnightAndLastMillisecond",
     Bus::kCan,
     {.timestamp = 133'604'640'000'000'000ull - 1, .identifier = 0x7ff, .payload = {}},
     "23:59:59,999\t7ff\t\t0\tS\n"},
    {"UnconvertibleTimeStamp",
     Bus::kCan,
     {.timestamp = 0x8000'0000'0000'0000ull, .identifier = 1},
     "--:--:--,---\t1\t\t0\tS\n"},
};

class TextLines : public testing::TestWithParam<LineCase> {};

TEST_P(TextLines, FormatsExactLine) {
  const auto batch = kvtest::Batch({GetParam().frame});
  EXPECT_EQ(Format(GetParam().bus, kvtest::FirstView(batch)), GetParam().expected);
}

INSTANTIATE_TEST_SUITE_P(AllBuses, TextLines, testing::ValuesIn(kLines),
                         [](const auto& info) { return std::string(info.param.name); });

TEST(TextLogFormat, J1939PayloadOfEightHundredBytesIsWrittenWhole) {
  // Length byte 0x20 plus info bits 3 * 256 = 800 bytes.
  const auto batch = kvtest::Batch({{.identifier = 0x2000'0000 | 0x18FEF100,
                                     .type = 0xC0,
                                     .info = 3,
                                     .payload = Counting(800),
                                     .lengthByte = 0x20}});
  const std::string line = Format(Bus::kCan, kvtest::FirstView(batch));
  EXPECT_EQ(line.substr(0, 22), "09:05:03,042\t18fef100\t");
  EXPECT_EQ(line.substr(line.size() - 11), "1f  \t800\tE\n");
  EXPECT_EQ(line.size(), 22 + 4 * 800 + 7u);
}

// The longest lines stay within their bounds; a buffer one below the bound gets nothing.
TEST(TextLogFormat, LinesStayWithinTheirBoundsAndNeedThemWhole) {
  const auto can = kvtest::Batch({{.identifier = 0x100, .payload = Counting(64)}});
  const auto fr = kvtest::Batch({{.identifier = 1, .type = 0x20, .payload = Counting(254)}});
  const auto longCan = kvtest::Batch({{.timestamp = 0x7FFF'FFFF'FFFF'FFFFull,
                                       .identifier = 0x3FFF'FFFF,
                                       .type = 0xC0,
                                       .info = 7,
                                       .payload = std::vector<uint8_t>(2047, 0xab),
                                       .lengthByte = 0xFF}});
  const auto longLin = kvtest::Batch({{.identifier = 0xFFFF'FFFF,
                                       .type = 0x42,
                                       .info = 0xff,
                                       .payload = std::vector<uint8_t>(8, 1),
                                       .lengthByte = 255}});
  EXPECT_LE(Format(Bus::kCan, kvtest::FirstView(longCan)).size(), CanTextLineMaxLength(2047));
  EXPECT_LE(Format(Bus::kLinChecksum, kvtest::FirstView(longLin)).size(), kLinTextLineMaxLength);
  EXPECT_EQ(Format(Bus::kCan, kvtest::FirstView(can), CanTextLineMaxLength(64) - 1), "");
  EXPECT_EQ(Format(Bus::kLin, kvtest::FirstView(longLin), kLinTextLineMaxLength - 1), "");
  EXPECT_EQ(Format(Bus::kFlexRay, kvtest::FirstView(fr), FlexRayTextLineMaxLength(254) - 1), "");
  EXPECT_FALSE(Format(Bus::kCan, kvtest::FirstView(can), CanTextLineMaxLength(64)).empty());
  EXPECT_FALSE(Format(Bus::kFlexRay, kvtest::FirstView(fr), FlexRayTextLineMaxLength(254)).empty());
}

TEST(TextLogFormat, LinLengthAboveEightPrintsOnlyTheFrameBytes) {
  // A LIN record holds 8 payload bytes; a bad length byte must not pull in the next frame.
  driver::RawFrameView view{};
  view.header = driver::RawFrameHeader{kvtest::kAt090503042, 0x10, 0x40, 0, 0, 200};
  const uint8_t bytes[8] = {1, 2, 3, 4, 5, 6, 7, 8};
  view.payload = bytes;
  view.payloadLength = 8;
  EXPECT_EQ(Format(Bus::kLin, view),
            "09:05:03,042\t10\t01  02  03  04  05  06  07  08  \t200\tS\n");
}

}  // namespace
}  // namespace nKV_DLL300
