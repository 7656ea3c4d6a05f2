// candump -l lines both ways, and the bit lengths frames take on the bus.
#include <gtest/gtest.h>

#include <random>

#include "driver/FrameTypes.h"
#include "tarvix/CandumpLog.h"
#include "tarvix/FrameTiming.h"

namespace tarvix {
namespace {

struct LineCase {
  const char* line;
  bool valid;
  uint32_t identifier;
  uint8_t type;
  uint8_t length;
};

TEST(CandumpLineTest, ParsesEveryFrameKindAndRejectsMalformedLines) {
  const LineCase cases[] = {
      {"(1.000001) can0 123#DEADBEEF", true, 0x123, driver::kFrameCanData, 4},
      {"(1.000001) can0 123#", true, 0x123, driver::kFrameCanData, 0},
      {"(1.000001) can0 12345678#00", true, 0x12345678 | driver::kExtendedIdFlag,
       driver::kFrameCanData, 1},
      {"(1.000001) can0 123#R", true, 0x123, driver::kFrameCanRemote, 0},
      {"(1.000001) can0 123#R3", true, 0x123, driver::kFrameCanRemote, 3},
      {"(1.000001) can0 123##1"
       "00112233445566778899AABB",
       true, 0x123, driver::kFrameCanFdBrsData, 12},
      {"(1.000001) can0 123##0AA", true, 0x123, driver::kFrameCanFdData, 1},
      {"(1.000001) can0 20000004#0000000000000000", true, 0, driver::kFrameCanBusError, 0},
      {"(1.000001) can0 123#11 T", true, 0x123, driver::kFrameCanData, 1},
      {"(1.000001) can0 800#00", false, 0, 0, 0},
      {"(1.000001) can0 1234#00", false, 0, 0, 0},
      {"(1.000001) can0 123#0", false, 0, 0, 0},
      {"(1.000001) can0 123#001122334455667788", false, 0, 0, 0},
      {"1.000001 can0 123#00", false, 0, 0, 0},
      {"(1.000001) can0", false, 0, 0, 0},
      {"(1.000001) can0 123##", false, 0, 0, 0},
      {"(1.000001) can0 123#R9", false, 0, 0, 0},
  };
  for (const LineCase& c : cases) {
    LoggedFrame f;
    ASSERT_EQ(ParseCandumpLine(c.line, f), c.valid) << c.line;
    if (!c.valid) continue;
    EXPECT_EQ(f.frame.identifier, c.identifier) << c.line;
    EXPECT_EQ(f.frame.type, c.type) << c.line;
    EXPECT_EQ(f.frame.length, c.length) << c.line;
    EXPECT_EQ(f.timeUs, 1000001) << c.line;
  }
}

// Other tools do not all write six decimals; the microseconds are what a replay keeps.
TEST(CandumpLineTest, TimeStampsTakeAnyNumberOfDecimals) {
  const struct {
    const char* time;
    bool valid;
    int64_t timeUs;
  } cases[] = {
      {"(1.0)", true, 1'000'000},
      {"(1)", true, 1'000'000},
      {"(1.01)", true, 1'010'000},
      {"(1.1234567)", true, 1'123'456},
      {"(0.000001)", true, 1},
      {"(4000000000.5)", true, 4'000'000'000'500'000},
      {"(4000000001.0)", false, 0},
      {"(.5)", false, 0},
      {"(1.0x)", false, 0},
      {"(1.2.3)", false, 0},
      {"()", false, 0},
      {"(-1.0)", false, 0},
  };
  for (const auto& c : cases) {
    LoggedFrame f;
    const std::string line = std::string(c.time) + " can0 123#11";
    ASSERT_EQ(ParseCandumpLine(line, f), c.valid) << line;
    if (c.valid) EXPECT_EQ(f.timeUs, c.timeUs) << line;
  }
}

TEST(CandumpLineTest, WrittenLinesReadBackAsTheSameFrame) {
  SimFrame frames[4];
  frames[0].identifier = 0x7FF;
  frames[0].length = 8;
  frames[0].payload[7] = 0x5A;
  frames[1].identifier = 0x1ABCDE00 | driver::kExtendedIdFlag;
  frames[1].type = driver::kFrameCanFdBrsData;
  frames[1].length = 64;
  frames[1].payload[63] = 0xFF;
  frames[2].identifier = 0x321;
  frames[2].type = driver::kFrameCanRemote;
  frames[3].type = driver::kFrameCanBusError;
  for (const SimFrame& f : frames) {
    const std::string line = FormatCandumpLine(f, "body");
    LoggedFrame back;
    ASSERT_TRUE(ParseCandumpLine(line, back)) << line;
    EXPECT_EQ(back.interfaceName, "body");
    EXPECT_EQ(back.frame.identifier, f.identifier) << line;
    EXPECT_EQ(back.frame.type, f.type) << line;
    EXPECT_EQ(back.frame.length, f.length) << line;
    EXPECT_EQ(back.frame.payload, f.payload) << line;
  }
}

// The bit count of a classic frame lies between the count without stuff bits and the count with
// the most stuff bits: 47 + 8n (67 + 8n extended) plus at most (bits - 12) / 5.
TEST(FrameTimingTest, ClassicFramesStayWithinTheStuffBitBounds) {
  std::mt19937 random(7);
  for (int round = 0; round < 2000; ++round) {
    SimFrame f;
    const bool extended = round % 2;
    f.identifier = extended ? (random() & driver::kExtendedIdMask) | driver::kExtendedIdFlag
                            : random() & 0x7FF;
    f.length = static_cast<uint8_t>(random() % 9);
    for (auto& b : f.payload) b = static_cast<uint8_t>(random() % 3 == 0 ? 0 : random());
    const uint32_t bits = (extended ? 67 : 47) + 8u * f.length;
    const BitLength b = CanBitLength(f);
    EXPECT_GE(b.nominalBits, bits);
    EXPECT_LE(b.nominalBits, bits + (bits - 12) / 5);
    EXPECT_EQ(b.dataBits, 0u);
  }
}

// The byte-wise count (stuff-bit and CRC tables) agrees with the bit-by-bit count on every kind of
// CAN frame; payloads lean towards long runs of equal bits, where stuff bits pile up.
TEST(FrameTimingTest, ByteWiseCountMatchesTheBitByBitCount) {
  constexpr uint8_t kTypes[] = {driver::kFrameCanData, driver::kFrameCanRemote,
                                driver::kFrameCanFdData, driver::kFrameCanFdBrsData};
  std::mt19937 random(11);
  for (int round = 0; round < 20000; ++round) {
    SimFrame f;
    f.type = kTypes[round % 4];
    const bool extended = (round / 4) % 2;
    f.identifier = extended ? (random() & driver::kExtendedIdMask) | driver::kExtendedIdFlag
                            : random() & 0x7FF;
    f.length = static_cast<uint8_t>(random() % (f.type >= driver::kFrameCanFdData ? 65 : 9));
    for (auto& b : f.payload) {
      const uint32_t pick = random() % 4;
      b = static_cast<uint8_t>(pick == 0 ? 0x00 : pick == 1 ? 0xFF : random());
    }
    const BitLength bytes = CanBitLength(f);
    const BitLength bits = CanBitLengthBitByBit(f);
    ASSERT_EQ(bytes.nominalBits, bits.nominalBits) << "round " << round;
    ASSERT_EQ(bytes.dataBits, bits.dataBits) << "round " << round;
  }
}

TEST(FrameTimingTest, FdFramesSwitchRateOnlyWithBitRateSwitching) {
  SimFrame f;
  f.identifier = 0x200;
  f.length = 64;
  f.type = driver::kFrameCanFdBrsData;
  const BitLength brs = CanBitLength(f);
  EXPECT_GE(brs.dataBits, 8u * 64 + 29);
  EXPECT_GE(brs.nominalBits, 22u + 12);
  f.type = driver::kFrameCanFdData;
  EXPECT_EQ(CanBitLength(f).dataBits, 0u);
  EXPECT_LT(CanFrameNs(f, 500000, 2000000) - CanFrameNs(f, 500000, 500000), 1)
      << "no switch: one rate";
  f.type = driver::kFrameCanFdBrsData;
  EXPECT_LT(CanFrameNs(f, 500000, 2000000), CanFrameNs(f, 500000, 500000));
  EXPECT_EQ(CanFdLength(9), 12u);
  EXPECT_EQ(CanFdLength(33), 48u);
}

}  // namespace
}  // namespace tarvix
