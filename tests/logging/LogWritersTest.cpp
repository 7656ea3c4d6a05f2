// The per-bus writers: exact text lines, binary records, frame selection, batch bounds.
#include "logging/LogFile.h"
#include "logging/LogFileName.h"
#include "logging/LogWriters.h"
#include "logging/TextLogFormat.h"
#include "tests/logging/FrameBuilder.h"
#include "tests/logging/LogSessionHarness.h"

namespace kvtest {
namespace {

using namespace nKV_DLL300;

constexpr uint8_t kEcho = 0x80;
constexpr uint32_t kExtended = 0x2000'0000;

using Writer = void (*)(SessionLog&, const uint8_t*, uint32_t, uint32_t);

struct BusCase {
  const char* name;
  driver::BusKind bus;
  Writer writer;
  std::string_view header;
};

class LogWritersTest : public LogSessionTest {
 protected:
  // Opens a log of `type` named "w", writes `batch` (all frames), closes, returns the file.
  std::string LogOf(const BusCase& bus, uint8_t type, const std::vector<uint8_t>& batch,
                    uint32_t frames) {
    UseBus(bus.bus);
    settings().logFileType.store(type);
    settings().logFileName.set("w");
    OpenLogFile(log(), bus.header);
    bus.writer(log(), batch.data(), static_cast<uint32_t>(batch.size()), frames);
    CloseLogFile(log());
    return ReadLog("w" + LogFileExtension(type)).value_or("<no file>");
  }
};

const BusCase kCan{"CAN", driver::BusKind::kCan, &WriteCanLog, kCanTextLogHeader};
const BusCase kLin{"LIN", driver::BusKind::kLin, &WriteLinLog, kLinTextLogHeader};
const BusCase kFlexRay{"FlexRay", driver::BusKind::kFlexRay, &WriteFlexRayLog,
                       kFlexRayTextLogHeader};

// The lines themselves are checked per frame kind by the text format's table.
TEST_F(LogWritersTest, CanLinesFollowTheHeaderAndEchoFramesNeedTheSetting) {
  const std::vector<uint8_t> batch = Batch({
      {.identifier = 0x100, .payload = {0x05, 1, 2, 3, 4, 5, 6, 7}},
      {.identifier = 0x7FF, .type = 0x02, .flags = kEcho},  // an echo: only with the setting
      {.identifier = kExtended | 0x1ABCDE00, .type = 0x18, .payload = {0xF0, 0xF1}},
  });
  const std::string head = std::string(kCanTextLogHeader) + "\n" +
                           "09:05:03,042\t100\t05  01  02  03  04  05  06  07  \t8\tS\n";
  const std::string echoLine = "09:05:03,042\t7ff\t\t0\tS\n";
  const std::string rest = "09:05:03,042\t1abcde00\tf0  f1  \t2\tE/BRS\n";
  EXPECT_EQ(LogOf(kCan, kLogTypeText, batch, 3), head + rest);
  settings().logTransmittedFrames.store(1);
  EXPECT_EQ(LogOf(kCan, kLogTypeText, batch, 3), head + echoLine + rest);
}

TEST_F(LogWritersTest, LinLinesPadTheirPayloadAndShowTheChecksumWhileItIsSet) {
  const std::vector<uint8_t> batch = Batch({
      {.identifier = 0x10, .type = 0x40, .info = 0x5E, .payload = {0x12, 0x34}},
      {.identifier = 0x12, .type = 0x42, .info = 0x5A},
      {.identifier = 0x11, .type = 0x40, .flags = kEcho, .payload = {1, 2, 3, 4, 5, 6, 7, 8}},
  });
  const std::string plain =
      "09:05:03,042\t10\t12  34  00  00  00  00  00  00  \t2\tS\n"
      "09:05:03,042\t12\t00  00  00  00  00  00  00  00  \t0\tNR\n";
  EXPECT_EQ(LogOf(kLin, kLogTypeText, batch, 3), std::string(kLinTextLogHeader) + "\n" + plain);
  settings().logChecksum.store(1);
  const BusCase withChecksum{"LIN", driver::BusKind::kLin, &WriteLinLog, LinTextLogHeader(1)};
  EXPECT_EQ(LogOf(withChecksum, kLogTypeText, batch, 3),
            std::string(kLinTextLogHeaderWithChecksum) + "\n" +
                "09:05:03,042\t10\t12  34  00  00  00  00  00  00  \t2\t5e\tS\n"
                "09:05:03,042\t12\t00  00  00  00  00  00  00  00  \t0\t5a\tNR\n");
}

TEST_F(LogWritersTest, FlexRayLinesShowChannelAndIndicators) {
  const std::vector<uint8_t> batch = Batch({
      {.identifier = 1, .type = 0x20, .flags = 0x23, .info = 0, .payload = {1}},
      {.identifier = 0x10028, .type = 0x20, .flags = 0x04, .info = 7},
  });
  EXPECT_EQ(LogOf(kFlexRay, kLogTypeText, batch, 2), std::string(kFlexRayTextLogHeader) + "\n" +
                                                         "09:05:03,042\t1\t01  \t1\t0\tB\tX\tX\t-\n"
                                                         "09:05:03,042\t28\t\t0\t7\t-\t-\t-\tX\n");
}

// Record sizes per bus and session kind, with the bytes taken from the frame as it was read.
struct RecordCase {
  const char* name;
  BusCase bus;
  uint32_t canIoMode;
  FrameSpec frame;
  size_t recordSize;
};

TEST_F(LogWritersTest, BinaryRecordsHaveTheSizeOfTheirBusAndAreTheFramesBytes) {
  const RecordCase cases[] = {
      {"classic CAN, 3 bytes", kCan, 0, {.identifier = 0x1A0, .payload = {1, 2, 3}}, 24},
      {"classic CAN, remote", kCan, 0, {.identifier = 0x321, .type = 0x01}, 24},
      {"FD session, 64 bytes",
       kCan,
       2,
       {.identifier = 0x200, .type = 0x18, .payload = Counting(64)},
       80},
      {"FD session, 12 bytes",
       kCan,
       2,
       {.identifier = 0x201, .type = 0x10, .payload = std::vector<uint8_t>(12, 0xA0)},
       32},
      {"FD session, empty", kCan, 2, {.identifier = 0x321, .type = 0x01}, 16},
      {"LIN, 2 bytes", kLin, 0, {.identifier = 0x10, .type = 0x40, .payload = {0x12, 0x34}}, 24},
      {"LIN, no response", kLin, 0, {.identifier = 0x12, .type = 0x42}, 24},
      {"FlexRay, 254 bytes",
       kFlexRay,
       0,
       {.identifier = 40, .type = 0x20, .payload = std::vector<uint8_t>(254, 0x3C)},
       272},
      {"FlexRay, null frame", kFlexRay, 0, {.identifier = 3, .type = 0x21}, 16},
  };
  for (const RecordCase& c : cases) {
    settings().canIoMode.store(c.canIoMode);
    std::vector<uint8_t> batch;
    for (int i = 0; i < 3; ++i) AppendFrame(batch, c.frame, /*pad=*/0xEE);
    const std::string file = LogOf(c.bus, kLogTypeBinary, batch, 3);
    ASSERT_EQ(file.size(), 12 + 3 * c.recordSize) << c.name;
    const size_t frameSize = batch.size() / 3;
    for (int i = 0; i < 3; ++i) {
      EXPECT_EQ(
          file.compare(12 + i * c.recordSize, c.recordSize,
                       reinterpret_cast<const char*>(batch.data() + i * frameSize), c.recordSize),
          0)
          << c.name << " record " << i;
    }
  }
}

TEST_F(LogWritersTest, RejectedFramesLeaveNoRecordAndTheFramesAfterThemAreFound) {
  const std::vector<uint8_t> batch = Batch({
      {.identifier = 0x200, .type = 0x18, .flags = kEcho, .payload = std::vector<uint8_t>(64, 1)},
      {.identifier = 0x201, .type = 0x10, .payload = std::vector<uint8_t>(12, 2)},
  });
  settings().canIoMode.store(2);
  const std::string file = LogOf(kCan, kLogTypeBinary, batch, 2);
  ASSERT_EQ(file.size(), 12u + 32u);
  EXPECT_EQ(static_cast<uint8_t>(file[12 + 8]), 0x01);  // identifier 0x201
}

TEST_F(LogWritersTest, BatchBoundsWinOverTheFrameCount) {
  std::vector<uint8_t> batch =
      Batch({{.identifier = 0x100, .payload = {1}}, {.identifier = 0x101, .payload = {2}}});
  // A frame count beyond the batch, and a last frame cut short: only whole frames are written.
  batch.resize(batch.size() - 4);
  const std::string text = LogOf(kCan, kLogTypeText, batch, 1000);
  EXPECT_EQ(text, std::string(kCanTextLogHeader) + "\n09:05:03,042\t100\t01  \t1\tS\n");
  EXPECT_EQ(LogOf(kCan, kLogTypeText, batch, 0), std::string(kCanTextLogHeader) + "\n");
}

TEST_F(LogWritersTest, LongJ1939MessagesAreWrittenWhole) {
  settings().applicationProtocol.store(1);
  const std::vector<uint8_t> payload = Counting(1785);
  const std::vector<uint8_t> batch = Batch({{.identifier = kExtended | 0x18EF00FE,
                                             .type = 0xC0,
                                             .info = 1785 / 256,
                                             .payload = payload,
                                             .lengthByte = 1785 % 256}});
  const std::string text = LogOf(kCan, kLogTypeText, batch, 1);
  EXPECT_NE(text.find("\t1785\tE\n"), std::string::npos);
  EXPECT_EQ(text.size(), kCanTextLogHeader.size() + 1 + 13 + 9 + 4 * 1785 + 6 + 2);
  EXPECT_EQ(LogOf(kCan, kLogTypeBinary, batch, 1).size(), 12u + 16u + 1792u);
}

}  // namespace
}  // namespace kvtest
