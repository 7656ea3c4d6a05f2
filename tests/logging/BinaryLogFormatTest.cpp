// Binary log records: sizes per bus and settings, copies taken from read batches, and reading back.
#include "logging/BinaryLogFormat.h"

#include <gtest/gtest.h>

#include <cstring>
#include <vector>

#include "logging/BinaryRecordReader.h"
#include "logging/FrameSelection.h"
#include "tests/logging/FrameBuilder.h"

namespace nKV_DLL300 {
namespace {

using kvtest::FrameSpec;

struct SizeCase {
  const char* name;
  BinaryRecordLayout layout;
  FrameSpec frame;
  uint32_t expectedSize;
};
void PrintTo(const SizeCase& c, std::ostream* os) { *os << c.name; }


const SizeCase kSizes[] = {
    {"LinAlways24", BinaryRecordLayout::kFixed24, {.type = 0x40, .payload = {1, 2}}, 24},
    {"LinNoResponse24", BinaryRecordLayout::kFixed24, {.type = 0x42}, 24},
    {"ClassicCanEmpty24", BinaryRecordLayout::kFixed24, {.type = 0x01}, 24},
    {"ClassicCanThreeBytes24", BinaryRecordLayout::kFixed24, {.payload = {1, 2, 3}}, 24},
    {"FdEmptyIsHeadOnly", BinaryRecordLayout::kCanVariable, {.type = 0x01}, 16},
    {"FdTwelveBytes32", BinaryRecordLayout::kCanVariable, {.type = 0x10, .payload = std::vector<uint8_t>(12)}, 32},
    {"FdSixtyFourBytes80", BinaryRecordLayout::kCanVariable, {.type = 0x18, .payload = std::vector<uint8_t>(64)}, 80},
    {"J1939UsesInfoLengthBits", BinaryRecordLayout::kCanVariable,
     {.type = 0xC0, .info = 0x02, .payload = std::vector<uint8_t>(0x205), .lengthByte = 0x05}, 16 + 0x208},
    {"FlexRay254Bytes272", BinaryRecordLayout::kFlexRayVariable, {.type = 0x20, .payload = std::vector<uint8_t>(254)}, 272},
    {"FlexRayNullEmpty16", BinaryRecordLayout::kFlexRayVariable, {.type = 0x21}, 16},
};

class RecordSizes : public testing::TestWithParam<SizeCase> {};

TEST_P(RecordSizes, RecordIsCopiedFromTheFrameStartWithItsBusSize) {
  const auto batch = kvtest::Batch({GetParam().frame});
  const RawFrameView view = kvtest::FirstView(batch);
  std::vector<uint8_t> out(4096, 0xEE);
  const size_t n = CopyBinaryRecord(out.data(), out.size(), view, GetParam().layout);
  ASSERT_EQ(n, GetParam().expectedSize);
  ASSERT_LE(n, batch.size());
  EXPECT_EQ(0, std::memcmp(out.data(), batch.data(), n));
  EXPECT_EQ(out[n], 0xEE);
  EXPECT_EQ(CopyBinaryRecord(out.data(), n - 1, view, GetParam().layout), 0u);
}

INSTANTIATE_TEST_SUITE_P(PerBus, RecordSizes, testing::ValuesIn(kSizes),
                         [](const auto& info) { return std::string(info.param.name); });

TEST(BinaryLogFormat, ClassicCanLayoutOnlyWithBothSettingsZero) {
  EXPECT_EQ(CanBinaryRecordLayout(0, 0), BinaryRecordLayout::kFixed24);
  EXPECT_EQ(CanBinaryRecordLayout(2, 0), BinaryRecordLayout::kCanVariable);
  EXPECT_EQ(CanBinaryRecordLayout(0, 1), BinaryRecordLayout::kCanVariable);
}

TEST(BinaryLogFormat, ClassicRecordKeepsPaddingBytesAsTheBatchHoldsThem) {
  std::vector<uint8_t> batch;
  kvtest::AppendFrame(batch, {.identifier = 0x100, .payload = {1, 2, 3}}, /*pad=*/0x5A);
  std::vector<uint8_t> out(24);
  ASSERT_EQ(CopyBinaryRecord(out.data(), out.size(), kvtest::FirstView(batch), BinaryRecordLayout::kFixed24), 24u);
  EXPECT_EQ(out[16 + 3], 0x5A);
  EXPECT_EQ(out[23], 0x5A);
}

TEST(BinaryLogFormat, FileHeaderBytes) {
  const uint8_t expected[12] = {'Q', 'V', 0, 3, 1, 1, 2, 0, 1, 0, 0, 0};
  EXPECT_EQ(0, std::memcmp(kBinaryLogFileHeaderBytes.data(), expected, 12));
  EXPECT_TRUE(HasBinaryLogMagic(expected, 12));
  EXPECT_FALSE(HasBinaryLogMagic(expected, 1));
  const uint8_t other[2] = {'Q', 'W'};
  EXPECT_FALSE(HasBinaryLogMagic(other, 2));
}

TEST(FrameSelection, EchoFramesOnlyWithTransmittedFramesLogged) {
  const RawFrameHeader echo{0, 1, 0, 0x80, 0, 0};
  const RawFrameHeader received{0, 1, 0, 0x7F, 0, 0};
  EXPECT_FALSE(IsFrameLogged(echo, 0));
  EXPECT_TRUE(IsFrameLogged(echo, 1));
  EXPECT_TRUE(IsFrameLogged(received, 0));
}

// Writes each frame of `frames` as a record, as a writer would, and returns the record bytes.
std::vector<uint8_t> Records(std::initializer_list<FrameSpec> frames, BinaryRecordLayout layout) {
  const auto batch = kvtest::Batch(frames);
  RawFrameWalker walker(batch.data(), static_cast<uint32_t>(batch.size()));
  std::vector<uint8_t> records;
  RawFrameView view;
  uint8_t record[4096];
  while (walker.next(view)) {
    const size_t n = CopyBinaryRecord(record, sizeof record, view, layout);
    records.insert(records.end(), record, record + n);
  }
  return records;
}

TEST(BinaryRecordReader, ReadsBackEveryRecordOfEachLayout) {
  const auto fd = Records({{.identifier = 0x200, .type = 0x18, .payload = std::vector<uint8_t>(64, 7)},
                           {.identifier = 0x321, .type = 0x01},
                           {.identifier = 0x201, .type = 0x10, .payload = std::vector<uint8_t>(12, 9)}},
                          BinaryRecordLayout::kCanVariable);
  ASSERT_EQ(fd.size(), 80u + 16 + 32);
  BinaryRecordReader reader(fd.data(), fd.size(), BinaryRecordLayout::kCanVariable);
  RawFrameView v;
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
  auto lin = Records({{.type = 0x40, .payload = {1}}, {.type = 0x40, .payload = {2}}}, BinaryRecordLayout::kFixed24);
  lin.resize(lin.size() - 5);
  BinaryRecordReader reader(lin.data(), lin.size(), BinaryRecordLayout::kFixed24);
  RawFrameView v;
  EXPECT_TRUE(reader.next(v));
  EXPECT_FALSE(reader.next(v));
  EXPECT_EQ(reader.remaining(), 19u);
}

TEST(BinaryRecordReader, FixedRecordBoundsAnOverlongPayloadToItsEightBytes) {
  const auto rec = Records({{.type = 0x10, .payload = std::vector<uint8_t>(20, 1)}}, BinaryRecordLayout::kFixed24);
  BinaryRecordReader reader(rec.data(), rec.size(), BinaryRecordLayout::kFixed24);
  RawFrameView v;
  ASSERT_TRUE(reader.next(v));
  EXPECT_EQ(v.payloadLength, 8u);
}

TEST(BinaryRecordReader, DetectsTheCanLayoutFromRecordsWithEmptyPayloads) {
  const auto frames = {FrameSpec{.timestamp = 1, .identifier = 0x321, .type = 0x01},
                       FrameSpec{.timestamp = 2, .identifier = 0x100, .payload = {1, 2, 3, 4, 5, 6, 7, 8}},
                       FrameSpec{.timestamp = 3, .identifier = 0, .type = 0x02}};
  const auto fixed = Records(frames, BinaryRecordLayout::kFixed24);
  const auto variable = Records(frames, BinaryRecordLayout::kCanVariable);
  EXPECT_EQ(DetectCanRecordLayout(fixed.data(), fixed.size()), BinaryRecordLayout::kFixed24);
  EXPECT_EQ(DetectCanRecordLayout(variable.data(), variable.size()), BinaryRecordLayout::kCanVariable);
}

}  // namespace
}  // namespace nKV_DLL300
