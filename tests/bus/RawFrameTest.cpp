// Walking a read batch frame by frame.
#include <gtest/gtest.h>

#include "driver/RawFrame.h"
#include "tests/bus/FrameBatch.h"

namespace nKV_DLL300 {
namespace {

std::vector<uint32_t> WalkIdentifiers(const void* data, uint32_t size) {
  driver::RawFrameWalker walker(data, size);
  driver::RawFrameView frame;
  std::vector<uint32_t> identifiers;
  while (walker.next(frame)) {
    EXPECT_LE(frame.payload + frame.payloadLength, static_cast<const uint8_t*>(data) + size);
    identifiers.push_back(frame.header.identifier);
  }
  return identifiers;
}

TEST(RawFrameWalker, LongestJ1939PayloadsStayInsideTheirFrame) {
  for (uint32_t length : {1785u, 2040u, 2041u, 2047u}) {
    test::FrameBatch batch;
    batch.add(1, 0x18FEF100, driver::kFrameJ1939, 0, 0, std::vector<uint8_t>(length, 0xEE))
        .can(2, 0x100, {1});
    EXPECT_EQ(WalkIdentifiers(batch.data(), batch.size()),
              (std::vector<uint32_t>{0x18FEF100, 0x100}))
        << length;
  }
}

TEST(RawFrameWalker, BatchEndingInsideAFrameStopsBeforeIt) {
  test::FrameBatch batch;
  batch.can(1, 0x1, {}).can(2, 0x2, std::vector<uint8_t>(12, 1));
  for (uint32_t cut : {0u, 1u, 15u, 16u, 31u}) {
    EXPECT_EQ(WalkIdentifiers(batch.data(), batch.size() - cut).size(), cut == 0 ? 2u : 1u) << cut;
  }
  EXPECT_TRUE(WalkIdentifiers(batch.data(), 15).empty());
}

}  // namespace
}  // namespace nKV_DLL300
