// Binary log records: copies taken from read batches, the file header, and reading back.
#include <gtest/gtest.h>

#include <cstring>
#include <vector>

#include "logging/BinaryLogFormat.h"
#include "logging/BinaryRecordReader.h"
#include "tests/logging/FrameBuilder.h"

namespace nKV_DLL300 {
namespace {

using kvtest::FrameSpec;

// Sizes per bus are checked through the writers; here: a record is copied whole or not at all.
TEST(BinaryLogFormat, CopyWritesTheWholeRecordOrNothing) {
  const std::pair<BinaryRecordLayout, FrameSpec> cases[] = {
      {BinaryRecordLayout::kFixed24, {.payload = {1, 2, 3}}},
      {BinaryRecordLayout::kCanVariable, {.type = 0x10, .payload = std::vector<uint8_t>(12)}},
      {BinaryRecordLayout::kFlexRayVariable, {.type = 0x20, .payload = std::vector<uint8_t>(254)}}};
  for (const auto& [layout, frame] : cases) {
    const auto batch = kvtest::Batch({frame});
    std::vector<uint8_t> out(4096, 0xEE);
    const size_t n = CopyBinaryRecord(out.data(), out.size(), kvtest::FirstView(batch), layout);
    ASSERT_GT(n, 0u);
    EXPECT_EQ(out[n], 0xEE);
    EXPECT_EQ(CopyBinaryRecord(out.data(), n - 1, kvtest::FirstView(batch), layout), 0u);
  }
}

TEST(BinaryLogFormat, FileHeaderBytes) {
  const uint8_t expected[12] = {'Q', 'V', 0, 3, 1, 1, 2, 0, 1, 0, 0, 0};
  EXPECT_EQ(0, std::memcmp(kBinaryLogFileHeaderBytes.data(), expected, 12));
  EXPECT_TRUE(HasBinaryLogMagic(expected, 12));
  EXPECT_FALSE(HasBinaryLogMagic(expected, 1));
  const uint8_t other[2] = {'Q', 'W'};
  EXPECT_FALSE(HasBinaryLogMagic(other, 2));
}

// Writes each frame of `frames` as a record, as a writer would, and returns the record bytes.
std::vector<uint8_t> Records(std::initializer_list<FrameSpec> frames, BinaryRecordLayout layout) {
  const auto batch = kvtest::Batch(frames);
  driver::RawFrameWalker walker(batch.data(), static_cast<uint32_t>(batch.size()));
  std::vector<uint8_t> records;
  driver::RawFrameView view;
  uint8_t record[4096];
  while (walker.next(view)) {
    const size_t n = CopyBinaryRecord(record, sizeof record, view, layout);
    records.insert(records.end(), record, record + n);
  }
  return records;
}

TEST(BinaryRecordReader, ReadsBackEveryRecordOfEachLayout) {
  const auto fd =
      Records({{.identifier = 0x200, .type = 0x18, .payload = std::vector<uint8_t>(64, 7)},
               {.identifier = 0x321, .type = 0x01},
               {.identifier = 0x201, .type = 0x10, .payload = std::vector<uint8_t>(12, 9)}},
              BinaryRecordLayout::kCanVariable);
  ASSERT_EQ(fd.size(), 80u + 16 + 32);
  BinaryRecordReader reader(fd.data(), fd.size(), BinaryRecordLayout::kCanVariable);
  driver::RawFrameView v;
  ASSERT_TRUE(reader.next(v));
  EXPECT_EQ(v.payloadLength, 64u);
  EXPECT_EQ(v.payload[63], 7);
  ASSERT_TRUE(reader.next(v));
  EXPECT_EQ(v.header.identifier, 0x321u);
  EXPECT_EQ(v.payloadLength, 0u);
  ASSERT_TRUE(reader.next(v));
  EXPECT_EQ(v.payloadLength, 12u);
  EXPECT_FALSE(reader.next(v));
  EXPECT_EQ(reader.remaining(), 0u);
}

TEST(BinaryRecordReader, CutLastRecordStaysUnread) {
  auto lin = Records({{.type = 0x40, .payload = {1}}, {.type = 0x40, .payload = {2}}},
                     BinaryRecordLayout::kFixed24);
  lin.resize(lin.size() - 5);
  BinaryRecordReader reader(lin.data(), lin.size(), BinaryRecordLayout::kFixed24);
  driver::RawFrameView v;
  EXPECT_TRUE(reader.next(v));
  EXPECT_FALSE(reader.next(v));
  EXPECT_EQ(reader.remaining(), 19u);
}

TEST(BinaryRecordReader, FixedRecordBoundsAnOverlongPayloadToItsEightBytes) {
  const auto rec = Records({{.type = 0x10, .payload = std::vector<uint8_t>(20, 1)}},
                           BinaryRecordLayout::kFixed24);
  BinaryRecordReader reader(rec.data(), rec.size(), BinaryRecordLayout::kFixed24);
  driver::RawFrameView v;
  ASSERT_TRUE(reader.next(v));
  EXPECT_EQ(v.payloadLength, 8u);
}

// A log copied while the controller wrote it ends in part of a record, anywhere in it.
TEST(BinaryRecordReader, DetectsTheCanLayoutFromRecordsWithEmptyPayloadsAlsoWhenCut) {
  const auto frames = {
      FrameSpec{.timestamp = 1, .identifier = 0x321, .type = 0x01},
      FrameSpec{.timestamp = 2, .identifier = 0x100, .payload = {1, 2, 3, 4, 5, 6, 7, 8}},
      FrameSpec{.timestamp = 3, .identifier = 0, .type = 0x02},
      FrameSpec{.timestamp = 4, .identifier = 0x1A0, .payload = {0xAA, 0xBB, 0xCC}}};
  for (const auto layout : {BinaryRecordLayout::kFixed24, BinaryRecordLayout::kCanVariable}) {
    const auto records = Records(frames, layout);
    for (const size_t cut : {0, 1, 5, 15, 16, 17, 23}) {
      EXPECT_EQ(DetectCanRecordLayout(records.data(), records.size() - cut), layout)
          << "layout " << static_cast<int>(layout) << ", cut " << cut;
    }
  }
}

}  // namespace
}  // namespace nKV_DLL300
