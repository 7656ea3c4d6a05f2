// Logs written by live sessions against the simulated hardware, read back from the test's drive.
#include <gtest/gtest.h>

#include <algorithm>
#include <functional>
#include <iomanip>
#include <map>
#include <regex>
#include <sstream>

#include "driver/FrameTypes.h"
#include "driver/Properties.h"
#include "driver/Sessions.h"
#include "driver/tarvix.h"
#include "logging/BinaryLogFormat.h"
#include "logging/MeasurementLibrary.h"
#include "logging/TextLogFormat.h"
#include "tarvix/TarvixControl.h"
#include "tests/logging/LogRunFixture.h"
#include "tests/voralog/VoraSupport.h"

namespace kvtest {
namespace {

using namespace nKV_DLL300;

const std::regex kTimeCell(R"(^\d\d:\d\d:\d\d,\d\d\d\t)");

std::vector<std::string> Lines(const std::string& text) {
  std::vector<std::string> lines;
  std::istringstream in(text);
  for (std::string line; std::getline(in, line);) lines.push_back(line + "\n");
  return lines;
}

// The line without its time cell, which the test cannot know.
std::string AfterTime(const std::string& line) {
  EXPECT_TRUE(std::regex_search(line, kTimeCell)) << line;
  return line.size() > kTimeCellLength ? line.substr(kTimeCellLength) : line;
}

class LogOverTcpTest : public LogRunTest {
 protected:
  void TearDown() override {
    LogRunTest::TearDown();
    UnloadMeasurementLibrary();  // after the service stopped every session
  }

  // Sends one classic frame on `sender` through an output session of the test's own and waits
  // until it went out.
  void SendOneFrame(const char* sender, uint32_t identifier) {
    static constexpr uint64_t kRate = 500000;
    const std::string database = std::string(":memory_") + sender;
    kxRef db = 0, cluster = 0, frame = 0, out = 0;
    const uint32_t length = 1;
    const uint32_t timing = driver::kTimingEventData;
    ASSERT_EQ(kxdbOpenDatabase(database.c_str(), &db), 0);
    ASSERT_EQ(kxdbCreateObject(db, driver::kClassCluster, "Cluster", &cluster), 0);
    ASSERT_EQ(kxdbSetProperty(cluster, driver::kPropClusterBaudRate, 8, &kRate), 0);
    ASSERT_EQ(kxdbCreateObject(cluster, driver::kClassFrame, "TxFrame", &frame), 0);
    ASSERT_EQ(kxdbSetProperty(frame, driver::kPropFrameIdentifier, 4, &identifier), 0);
    ASSERT_EQ(kxdbSetProperty(frame, driver::kPropFramePayloadLength, 4, &length), 0);
    ASSERT_EQ(kxdbSetProperty(frame, driver::kPropFrameTimingType, 4, &timing), 0);
    ASSERT_EQ(kxCreateSession(database.c_str(), "Cluster", "TxFrame", sender,
                              driver::kModeOutputQueued, &out),
              0);
    ASSERT_EQ(kxSetProperty(out, driver::kPropBaudRate, 8, &kRate), 0);
    std::vector<uint8_t> record(24, 0);
    std::memcpy(record.data() + 8, &identifier, 4);
    record[15] = 1;
    ASSERT_EQ(kxWriteFrame(out, record.data(), 24, 10.0), 0);
    ASSERT_EQ(kxWait(out, driver::kWaitTransmitComplete, 0, 20.0, nullptr), 0);
    EXPECT_EQ(kxClear(out), 0);
    EXPECT_EQ(kxdbCloseDatabase(db, 1), 0);
  }
};

// The text log of each bus's default traffic and, where `recordSizes` is given, its binary log.
struct FormatCase {
  const char* what;
  std::vector<std::string> port;  // the port and its settings
  std::string midRun;             // a property sent once the first records arrived
  uint8_t recordType;
  std::string header;
  std::string line;                   // every line after its time cell matches this
  std::vector<std::string> required;  // each matches the start of one line at least
  driver::BusKind bus;
  BinaryRecordLayout layout;
  std::map<uint32_t, size_t> recordSizes;  // identifier -> bytes of its record
};

std::string CountingCells(int from, int count) {
  std::string cells;
  for (int i = from; i < from + count; ++i) {
    cells +=
        (std::stringstream() << std::hex << std::setw(2) << std::setfill('0') << i).str() + "  ";
  }
  return cells;
}

const FormatCase kFormats[] = {
    {"classic CAN",
     {"SET_PROP_SESSION_PORTNAME=CAN1"},
     "",
     kvhost::kCanRecords,
     std::string(kCanTextLogHeader),
     R"((100\t[0-9a-f]{2}  01  02  03  04  05  06  07  \t8\tS|1a0\taa  bb  cc  \t3\tS|321\t\t0\tS/R)"
     R"(|18fef100\t00  11  22  33  44  55  66  77  \t8\tE|0\t\t0\tS)\n)",
     {"100\t", "1a0\t", "321\t", "18fef100\t"},
     driver::BusKind::kCan,
     BinaryRecordLayout::kFixed24,
     {}},
    {"CAN FD",
     {"SET_PROP_SESSION_PORTNAME=CAN5"},
     "",
     kvhost::kCanRecords,
     std::string(kCanTextLogHeader),
     "(200\t" + CountingCells(0, 64) + "\t64\tBRS|201\t" + CountingCells(0xa0, 12) +
         "\t12\tFD|1abcde00\t" + CountingCells(0xf0, 16) +
         R"(\t16\tE/BRS|80\t[0-9a-f]{2}  (00  ){7}\t8\tS)\n)",
     {"200\t", "201\t", "1abcde00\t", "80\t"},
     driver::BusKind::kCan,
     BinaryRecordLayout::kCanVariable,
     {{0x200, 80}, {0x201, 32}, {kExtendedFlag | 0x1ABCDE00, 32}, {0x080, 24}}},
    // The checksum column stays as the log was opened when the host turns it off mid-run.
    {"LIN",
     {"SET_PROP_SESSION_PORTNAME=LIN1", "SET_PROP_SESSION_BAUDRATE=19200",
      "SET_PROP_SESSION_LOG_CHECKSUM=1", "SET_PROP_SESSION_NO_RESPONSE_FRAMES=1"},
     "SET_PROP_SESSION_LOG_CHECKSUM=0",
     kvhost::kLinRecords,
     std::string(kLinTextLogHeaderWithChecksum),
     R"((10\t12  34  (00  ){6}\t2\t[0-9a-f]{2}\tS|11\t[0-9a-f]{2}  01  02  03  04  05  06  07  )"
     R"(\t8\t[0-9a-f]{2}\tS|12\t(00  ){8}\t0\t[0-9a-f]{2}\tNR|13\tde  ad  be  ef  (00  ){4}\t4)"
     R"(\t[0-9a-f]{2}\tS)\n)",
     {"10\t", "11\t", "12\t", "13\t"},
     driver::BusKind::kLin,
     BinaryRecordLayout::kFixed24,
     {{0x10, 24}, {0x11, 24}, {0x12, 24}, {0x13, 24}}},
    {"FlexRay",
     {"SET_PROP_SESSION_PORTNAME=FlexRay1"},
     "",
     kvhost::kFlexRayRecords,
     std::string(kFlexRayTextLogHeader),
     R"([0-9a-f]+\t([0-9a-f]{2}  )*\t\d+\t([0-9]|[1-5][0-9]|6[0-3])\t[AB-]\t[X-]\t[X-]\t[X-]\n)",
     {R"(1\t.*\tA\tX\tX\t-)", R"(1\t.*\tB\tX\tX\t-)", R"(2\t.*\tA\t-\t-\t-)",
      R"(28\t.*\tB\t-\t-\t-)"},
     driver::BusKind::kFlexRay,
     BinaryRecordLayout::kFlexRayVariable,
     {}},
};

TEST_F(LogOverTcpTest, LogsOfEachBusHoldItsLinesAndRecords) {
  for (const FormatCase& c : kFormats) {
    SCOPED_TRACE(c.what);
    const std::string name = c.bus == driver::BusKind::kLin ? "" : "run";
    // No name at all (LIN) is a file of the bare extension; an empty name is refused when set.
    std::vector<std::string> text = c.port;
    if (!name.empty()) text.push_back("SET_PROP_LOGFILE_NAME=" + name);
    text.push_back("SET_PROP_LOGFILE=1");
    std::vector<std::string> errors;
    kvhost::HostClient host = Configured(text, errors);
    WaitForRecords(host, c.recordType, errors, 1);
    if (!c.midRun.empty()) EXPECT_TRUE(Command(host, c.midRun));
    WaitForRecords(host, c.recordType, errors);
    Terminate(host);
    EXPECT_TRUE(errors.empty());
    const std::vector<std::string> lines = Lines(LogFile(name + ".txt"));
    ASSERT_GT(lines.size(), 20u);
    EXPECT_EQ(lines[0], c.header + "\n");
    const std::regex line("^" + c.line + "$");
    std::vector<int> seen(c.required.size());
    for (size_t i = 1; i < lines.size(); ++i) {
      const std::string rest = AfterTime(lines[i]);
      EXPECT_TRUE(std::regex_match(rest, line)) << lines[i];
      for (size_t r = 0; r < c.required.size(); ++r) {
        seen[r] += std::regex_search(rest, std::regex("^" + c.required[r]));
      }
    }
    for (size_t r = 0; r < c.required.size(); ++r) EXPECT_GT(seen[r], 0) << c.required[r];
    if (c.recordSizes.empty()) continue;

    std::vector<std::string> binary = text;
    binary.insert(binary.end() - 1, "SET_PROP_LOGFILE_TYPE=1");
    EXPECT_TRUE(Run(binary, c.recordType).empty());
    const std::string file = LogFile(name + ".zfl");
    ASSERT_TRUE(HasBinaryLogMagic(reinterpret_cast<const uint8_t*>(file.data()), file.size()));
    EXPECT_TRUE(RecordsAreConsistent(reinterpret_cast<const uint8_t*>(file.data()) + 12,
                                     file.size() - 12, c.layout, c.bus));
    std::map<uint32_t, int> counted;
    size_t remaining = 1, total = 12;
    for (const driver::RawFrameView& frame : ReadRecords(file, c.layout, &remaining)) {
      const auto size = c.recordSizes.find(frame.header.identifier);
      ASSERT_NE(size, c.recordSizes.end()) << std::hex << frame.header.identifier;
      total += size->second;
      ++counted[frame.header.identifier];
    }
    EXPECT_EQ(remaining, 0u);
    EXPECT_EQ(total, file.size());
    EXPECT_EQ(counted.size(), c.recordSizes.size());
  }
}

TEST_F(LogOverTcpTest, EchoFramesAreLoggedOnlyWithTheSetting) {
  // CAN3's own frames come back to its session as echoes; CAN4's frames are ordinary traffic.
  for (uint8_t logTransmitted : {0, 1}) {
    std::vector<std::string> errors;
    kvhost::HostClient host =
        Configured({"SET_PROP_SESSION_PORTNAME=CAN3", "SET_PROP_LOGFILE_NAME=echo",
                    "SET_PROP_LOGFILE_TYPE=1", "SET_PROP_LOGFILE=1",
                    "SET_PROP_SESSION_LOG_TRANSMITTED_FRAMES=" + std::to_string(logTransmitted)},
                   errors);
    EXPECT_TRUE(errors.empty());
    for (const char* sender : {"CAN3", "CAN4"})
      SendOneFrame(sender, sender[3] == '3' ? 0x33 : 0x44);
    // Both frames are in the identifier table once they were read: the log has had its batch.
    ASSERT_TRUE(RecordsWhere(host, [](const RecordMessage& m) { return m.find(0x44) != nullptr; }));
    Terminate(host);
    const std::string file = LogFile("echo.zfl");
    std::vector<uint32_t> ids;
    for (const driver::RawFrameView& frame : ReadRecords(file, BinaryRecordLayout::kCanVariable)) {
      ids.push_back(frame.header.identifier);
    }
    const std::vector<uint32_t> expected =
        logTransmitted ? std::vector<uint32_t>{0x33, 0x44} : std::vector<uint32_t>{0x44};
    EXPECT_EQ(ids, expected);
  }
}

// One frame every 100 ms fills the stream's buffer only after minutes: the records must reach the
// file while the session still runs, text and binary alike.
TEST_F(LogOverTcpTest, LogsReachTheFileWhileTheSessionRuns) {
  std::string error;
  ASSERT_TRUE(tarvix::LoadConfiguration(
      R"({"buses":[{"name":"slow","traffic":[{"id":"0x123","length":1,"periodMs":100}]}],
      "devices":[{"name":"SIM-CAN","interfaces":[{"name":"CAN1","bus":"slow"}]}]})",
      drive_.path().string(), &error))
      << error;
  for (const char* type : {"0", "1"}) {
    std::vector<std::string> errors;
    kvhost::HostClient host =
        Configured({"SET_PROP_SESSION_PORTNAME=CAN1", "SET_PROP_LOGFILE_NAME=follow",
                    std::string("SET_PROP_LOGFILE_TYPE=") + type, "SET_PROP_LOGFILE=1"},
                   errors);
    const bool text = type[0] == '0';
    const std::string name = text ? "follow.txt" : "follow.zfl";
    const size_t twoFrames =
        text ? std::string_view(kCanTextLogHeader).size() + 1 + 2 * kTimeCellLength : 12 + 2 * 24;
    // Heartbeats keep the session alive: the end of a silent connection would close the file.
    auto lastBeat = std::chrono::steady_clock::now();
    EXPECT_TRUE(WaitUntil([&] {
      if (std::chrono::steady_clock::now() - lastBeat > 2s) {
        EXPECT_TRUE(host.Send("CMD_HEARTBEAT"));
        lastBeat = std::chrono::steady_clock::now();
      }
      std::error_code ignored;
      return std::filesystem::file_size(LogPath(name), ignored) >= twoFrames;
    })) << name;
    Terminate(host);
    EXPECT_TRUE(errors.empty());
  }
  tarvix::ResetToDefaults();
}

// A file that cannot be opened is reported once with the session; a name that would leave the
// service directory is refused when set, and the session logs to the default name.
TEST_F(LogOverTcpTest, BadFilesAndNamesAreReported) {
  std::filesystem::create_directories(LogPath("blocked.txt"));
  EXPECT_EQ(
      Run({"SET_PROP_SESSION_PORTNAME=CAN1", "SET_PROP_LOGFILE_NAME=blocked", "SET_PROP_LOGFILE=1"},
          kvhost::kCanRecords),
      std::vector<std::string>{"<ERROR:LOG FILE: -20> \n"});
  EXPECT_EQ(
      Run({"SET_PROP_SESSION_PORTNAME=CAN1", "SET_PROP_LOGFILE_NAME=..\\..\\outside",
           "SET_PROP_LOGFILE=1"},
          kvhost::kCanRecords, 1),
      std::vector<std::string>{"<ERROR: no valid file name, file name KelvaneLog will be used>\n"});
  EXPECT_FALSE(std::filesystem::exists(drive_.Native("QV-RT\\outside.txt")));
  EXPECT_FALSE(std::filesystem::exists(drive_.Native("outside.txt")));
  EXPECT_EQ(Lines(LogFile("KelvaneLog.txt")).at(0), std::string(kCanTextLogHeader) + "\n");
}

// The bus a whole log holds ("CAN" or "LIN"), or what tears it. A binary record says its bus by its
// type (CAN below 0x40, LIN 0x40 to 0x42); a text line by its identifier and cells.
std::string RecordsBus(const uint8_t* bytes, size_t size) {
  size_t remaining = 0;
  std::map<bool, int> lin;
  for (const driver::RawFrameView& record :
       ReadRecords(bytes, size, BinaryRecordLayout::kFixed24, &remaining)) {
    ++lin[record.header.type >= 0x40 && record.header.type <= 0x42];
  }
  if (remaining != 0) return "torn: a cut record";
  if (lin.empty()) return "empty";
  if (lin.size() != 1) return "torn: records of both buses";
  return lin.begin()->first ? "LIN" : "CAN";
}

std::string TextBus(const std::string& file) {
  const std::vector<std::string> lines = Lines(file);
  const std::regex can(R"(^(100|1a0|321|18fef100|0)\t((?:[0-9a-f]{2}  )*)\t\d+\t(S|E|S/R)\n$)");
  const std::regex lin(R"(^1[0-3]\t(?:[0-9a-f]{2}  ){8}\t\d\t(S|NR)\n$)");
  const bool isCan = !lines.empty() && lines[0] == std::string(kCanTextLogHeader) + "\n";
  if (!isCan && (lines.empty() || lines[0] != std::string(kLinTextLogHeader) + "\n"))
    return "torn: no header";
  for (size_t i = 1; i < lines.size(); ++i) {
    if (!std::regex_match(AfterTime(lines[i]), isCan ? can : lin)) return "torn: " + lines[i];
  }
  return file.ends_with('\n') ? (isCan ? "CAN" : "LIN") : "torn: a cut line";
}

struct SharedNameCase {
  const char* type;
  const char* file;
  std::function<std::string(const std::string& file)> bus;  // the bus of the whole log
  // Whether the second session's frames reached the file while the first still writes it (the
  // first one's are mostly in its buffer then); none for a file no reader may open meanwhile.
  std::function<bool(const std::string& file)> holdsLinWhileOpen;
};

// CAN1 logs under a name; LIN1 asking for the same file while that log is open gets the open
// failure and CAN1's log stays whole; once CAN1's session ended, LIN1 logs under the name.
TEST_F(LogOverTcpTest, SecondSessionOnAnOpenLogFileGetsTheOpenFailureAndLeavesItWhole) {
  const std::vector<SharedNameCase> cases = {
      {"0", "shared.txt", [&](const std::string& file) { return TextBus(LogFile(file)); },
       [&](const std::string& file) {
         return LogFile(file).find(std::string(kLinTextLogHeader) + "\n") != std::string::npos;
       }},
      {"1", "shared.zfl",
       [&](const std::string& name) {
         const std::string file = LogFile(name);
         if (!HasBinaryLogMagic(reinterpret_cast<const uint8_t*>(file.data()), file.size()))
           return std::string("torn: no header");
         return RecordsBus(reinterpret_cast<const uint8_t*>(file.data()) + 12, file.size() - 12);
       },
       [&](const std::string& name) {
         const std::string file = LogFile(name);
         const std::vector<driver::RawFrameView> records =
             ReadRecords(file, BinaryRecordLayout::kFixed24);
         return std::any_of(records.begin(), records.end(),
                            [](const auto& r) { return r.header.type >= 0x40; });
       }},
      {"2", "shared.vora",
       [&](const std::string& file) {
         const std::optional<ChannelContents> contents = OnlyChannel(LogPath(file));
         if (!contents) return std::string("torn: unreadable");
         const std::string bus = RecordsBus(contents->bytes.data(), contents->bytes.size());
         const int64_t protocol = bus == "LIN" ? 2 : 0;
         return contents->channel.IntegerProperty("QV_network_protocol") == protocol
                    ? bus
                    : "torn: protocol of the other bus";
       },
       nullptr},
  };
  InstallLibrary(drive_);
  LocateMeasurementLibrary();
  const auto port = [](const std::string& name, const char* type) {
    std::vector<std::string> properties = {
        "SET_PROP_SESSION_PORTNAME=" + name, "SET_PROP_LOGFILE_NAME=shared",
        std::string("SET_PROP_LOGFILE_TYPE=") + type, "SET_PROP_LOGFILE=1"};
    if (name == "LIN1") properties.push_back("SET_PROP_SESSION_BAUDRATE=19200");
    return properties;
  };
  for (const SharedNameCase& c : cases) {
    SCOPED_TRACE(c.file);
    std::vector<std::string> errors;
    kvhost::HostClient first = Configured(port("CAN1", c.type), errors);
    WaitForRecords(first, kvhost::kCanRecords, errors, 1);
    EXPECT_EQ(Run(port("LIN1", c.type), kvhost::kLinRecords, 1),
              std::vector<std::string>{"<ERROR:LOG FILE: -20> \n"});
    if (c.holdsLinWhileOpen) {
      EXPECT_FALSE(c.holdsLinWhileOpen(c.file));
    }
    WaitForRecords(first, kvhost::kCanRecords, errors, 1);
    Terminate(first);
    EXPECT_TRUE(errors.empty());
    EXPECT_EQ(c.bus(c.file), "CAN");

    EXPECT_TRUE(Run(port("LIN1", c.type), kvhost::kLinRecords, 1).empty());
    EXPECT_EQ(c.bus(c.file), "LIN");
  }
}

}  // namespace
}  // namespace kvtest
