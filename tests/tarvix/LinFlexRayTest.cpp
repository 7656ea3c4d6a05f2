// LIN and FlexRay sessions: schedules, checksums, channels, cycles, null frames, state words.
#include <gtest/gtest.h>

#include "driver/FrameTypes.h"
#include "driver/Properties.h"
#include "driver/States.h"
#include "tests/tarvix/TarvixTestSupport.h"

namespace tarvix::test {
namespace {

using LinFlexRayTest = TarvixTest;

// LIN 2.x enhanced checksum over the protected identifier and the data, worked by hand:
// id 0x10 has parity bits P0 = 1, P1 = 0, so the protected id is 0x50.
// 0x50 + 0x12 + 0x34 = 0x96, inverted 0x69.
constexpr uint8_t kChecksumOf10 = 0x69;

TEST_F(LinFlexRayTest, LinScheduleRunsInOrderWithChecksumsAndNoResponseSlots) {
  const kxRef s = Open(driver::kDatabaseSubordinate, "LIN1");
  ASSERT_EQ(Set<uint8_t>(s, driver::kPropLinNoResponseFrames, 1), 0);
  ASSERT_EQ(Set<uint8_t>(s, driver::kPropLinChecksumFlag, 1), 0);
  const auto frames = ReadUntil(s, [](const auto& f) { return f.size() >= 9; });
  ASSERT_GE(frames.size(), 9u);
  size_t i = 0;
  while (frames[i].identifier != 0x10) ++i;
  const uint32_t order[] = {0x10, 0x11, 0x12, 0x13};
  for (size_t k = 0; k < 4; ++k) EXPECT_EQ(frames[i + k].identifier, order[k]);
  EXPECT_EQ(frames[i].type, driver::kFrameLinData);
  EXPECT_EQ(frames[i].payload, (std::vector<uint8_t>{0x12, 0x34}));
  EXPECT_EQ(frames[i].info, kChecksumOf10);
  EXPECT_EQ(frames[i].flags & driver::kFlagLinEnhancedChecksum, driver::kFlagLinEnhancedChecksum);
  EXPECT_EQ(frames[i + 2].type, driver::kFrameLinNoResponse);
  EXPECT_EQ(frames[i + 2].length, 0u);
  EXPECT_EQ(frames[i + 3].payload, (std::vector<uint8_t>{0xDE, 0xAD, 0xBE, 0xEF}));
  // Slots are 10 ms apart: 100000 units of 100 ns between the headers of 0x12 and 0x13 plus the
  // difference of their lengths; between two rounds of 0x10 exactly four slots.
  for (size_t k = i + 4; k < frames.size(); ++k) {
    if (frames[k].identifier == 0x10) {
      EXPECT_EQ(frames[k].timestamp - frames[i].timestamp, 400000u);
      break;
    }
  }
}

TEST_F(LinFlexRayTest, LinFiltersNoResponseAndChecksumUnlessAskedAndSeesErrorsAtTheWrongRate) {
  const kxRef s = Open(driver::kDatabaseMemory, "LIN2");
  ASSERT_EQ(kxStop(s, driver::kScopeInterfaceOnly), 0);
  ASSERT_EQ(Set<uint64_t>(s, driver::kPropBaudRate, 19200), 0);
  ASSERT_EQ(kxStart(s, driver::kScopeNormal), 0);
  const auto frames = ReadUntil(s, [](const auto& f) { return f.size() >= 6; });
  for (const Frame& f : frames) {
    EXPECT_NE(f.type, driver::kFrameLinNoResponse);
    EXPECT_EQ(f.info, 0u);
  }
  uint64_t state = 0;
  uint32_t fault = 0;
  ASSERT_EQ(kxReadState(s, driver::kStateLin, 8, &state, &fault), 0);
  EXPECT_EQ(state & 1u, 1u) << "communicating";
  EXPECT_EQ((state >> 2) & 3u, driver::kLinCommActive);
  EXPECT_EQ(state >> 31, 0u) << "running";
  EXPECT_EQ(kxReadState(s, driver::kStateLin, 4, &state, &fault), driver::kWrongStateSize);
  EXPECT_EQ(kxReadState(s, driver::kStateCan, 4, &state, &fault), driver::kUnknownState);

  // At the wrong rate only bus errors arrive.
  const kxRef wrong = Open(driver::kDatabaseMemory, "LIN1");
  ASSERT_EQ(Set<uint64_t>(wrong, driver::kPropBaudRate, 9600), 0);
  ASSERT_EQ(kxSetProperty(wrong, driver::kPropBusErrorFrames, 2, kErrorsOn), 0);
  const auto errors = ReadUntil(wrong, [](const auto& f) { return f.size() >= 4; });
  ASSERT_GE(errors.size(), 4u);
  for (const Frame& f : errors) EXPECT_EQ(f.type, driver::kFrameLinBusError);
}

TEST_F(LinFlexRayTest, FlexRaySessionIntegratesAndSeesBothChannels) {
  const kxRef s = Open("SimDB", "FlexRay1", "FlexRay");
  uint64_t rate = 0;
  ASSERT_EQ(kxGetProperty(s, driver::kPropBaudRate, 8, &rate), 0);
  EXPECT_EQ(rate, 10000000u);
  ASSERT_EQ(kxStop(s, driver::kScopeInterfaceOnly), 0);
  ASSERT_EQ(Set<uint32_t>(s, driver::kPropFlexRayTermination, 1), 0);
  ASSERT_EQ(Set<uint8_t>(s, driver::kPropFlexRayNullFrames, 1), 0);
  ASSERT_EQ(Set<uint32_t>(s, driver::kPropKeySlot, 0), 0);
  ASSERT_EQ(kxStart(s, driver::kScopeNormal), 0);
  ASSERT_EQ(kxWait(s, driver::kWaitInterfaceCommunicating, 0, 20.0, nullptr), 0);
  const auto frames = ReadUntil(s, [](const auto& f) {
    return CountId(f, 3, driver::kFrameFlexRayNull) >= 1 && f.size() >= 12;
  });
  bool slot1A = false;
  bool slot1B = false;
  for (const Frame& f : frames) {
    if (f.identifier == 1) {
      const uint8_t common = driver::kFlagFlexRayStartup | driver::kFlagFlexRaySync;
      EXPECT_EQ(f.flags & common, common);
      slot1A |= (f.flags & driver::kFlagFlexRayChannelA) != 0;
      slot1B |= (f.flags & driver::kFlagFlexRayChannelB) != 0;
      EXPECT_EQ(f.length, 16u);
    }
    if (f.identifier == 3) {
      EXPECT_EQ(f.type == driver::kFrameFlexRayNull, f.info % 2 == 1) << "null in odd cycles";
    }
    if (f.identifier == 40) {
      EXPECT_EQ(f.flags & driver::kFlagFlexRayChannelB, driver::kFlagFlexRayChannelB);
    }
    EXPECT_LT(f.info, 64u);
  }
  EXPECT_TRUE(slot1A && slot1B);
  uint32_t word = 0;
  uint32_t fault = 0;
  ASSERT_EQ(kxReadState(s, driver::kStateFlexRay, 4, &word, &fault), 0);
  EXPECT_EQ(word & 0xF, driver::kFlexRayStateNormalActive);
  uint32_t counters[6] = {};
  ASSERT_EQ(kxReadState(s, driver::kStateFlexRayCounters, 24, counters, &fault), 0);
  EXPECT_GT(counters[driver::kFlexRayCounterDataFrames], 0u);
  ASSERT_EQ(kxReadState(s, driver::kStateFlexRayChannels, 4, &word, &fault), 0);
  EXPECT_EQ(word, driver::kFlexRayChannelA | driver::kFlexRayChannelB);
}

TEST_F(LinFlexRayTest, FlexRayNullFramesStayOutUnlessAsked) {
  const kxRef s = Open(driver::kDatabaseSubordinate, "FlexRay2");
  const auto frames =
      ReadUntil(s, [](const auto& f) { return CountId(f, 3, driver::kFrameFlexRayData) >= 2; });
  EXPECT_EQ(CountId(frames, 3, driver::kFrameFlexRayNull), 0u);
}

}  // namespace
}  // namespace tarvix::test
