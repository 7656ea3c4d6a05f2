// Logs written by live sessions against the simulated hardware, read back from the test's drive.
#include <gtest/gtest.h>

#include <fstream>
#include <map>
#include <regex>
#include <sstream>

#include "driver/FrameTypes.h"
#include "driver/Properties.h"
#include "driver/Sessions.h"
#include "driver/tarvix.h"
#include "logging/BinaryLogFormat.h"
#include "logging/FileTime.h"
#include "logging/TextLogFormat.h"
#include "tarvix/TarvixControl.h"
#include "tests/logging/LogRunFixture.h"

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

TEST_F(LogOverTcpTest, CanTextLogHoldsExactLinesOfTheBodyTraffic) {
  EXPECT_TRUE(
      Run({"SET_PROP_SESSION_PORTNAME=CAN1", "SET_PROP_LOGFILE_NAME=body", "SET_PROP_LOGFILE=1"},
          kvhost::kCanRecords)
          .empty());
  const std::vector<std::string> lines = Lines(LogFile("body.txt"));
  ASSERT_GT(lines.size(), 100u);
  EXPECT_EQ(lines[0], std::string(kCanTextLogHeader) + "\n");
  const std::regex counterFrame(R"(^100\t[0-9a-f]{2}  01  02  03  04  05  06  07  \t8\tS\n$)");
  std::map<std::string, int> kinds;
  for (size_t i = 1; i < lines.size(); ++i) {
    const std::string rest = AfterTime(lines[i]);
    if (std::regex_match(rest, counterFrame)) {
      ++kinds["100"];
    } else if (rest == "1a0\taa  bb  cc  \t3\tS\n" || rest == "321\t\t0\tS/R\n" ||
               rest == "18fef100\t00  11  22  33  44  55  66  77  \t8\tE\n" ||
               rest == "0\t\t0\tS\n") {
      ++kinds[rest.substr(0, rest.find('\t'))];
    } else {
      ADD_FAILURE() << "unexpected line " << lines[i];
    }
  }
  for (const char* id : {"100", "1a0", "321", "18fef100"}) EXPECT_GT(kinds[id], 0) << id;
  // 0x100 every 10 ms, 0x1A0 every 50 ms: about five times as many.
  EXPECT_GT(kinds["100"], 3 * kinds["1a0"]);
}

TEST_F(LogOverTcpTest, FdTextAndBinaryLogsShowSwitchingAndVariableRecords) {
  EXPECT_TRUE(
      Run({"SET_PROP_SESSION_PORTNAME=CAN5", "SET_PROP_LOGFILE_NAME=fd", "SET_PROP_LOGFILE=1"},
          kvhost::kCanRecords)
          .empty());
  std::map<std::string, int> seen;
  for (const std::string& line : Lines(LogFile("fd.txt"))) {
    if (line == std::string(kCanTextLogHeader) + "\n") continue;
    const std::string rest = AfterTime(line);
    const std::string id = rest.substr(0, rest.find('\t'));
    ++seen[id];
    if (id == "200") {
      std::string payload;
      for (int i = 0; i < 64; ++i)
        payload += (i < 16 ? "0" : "") + (std::stringstream() << std::hex << i).str() + "  ";
      EXPECT_EQ(rest, "200\t" + payload + "\t64\tBRS\n");
    } else if (id == "201") {
      EXPECT_EQ(rest, "201\ta0  a1  a2  a3  a4  a5  a6  a7  a8  a9  aa  ab  \t12\tFD\n");
    } else if (id == "1abcde00") {
      EXPECT_EQ(rest,
                "1abcde00\tf0  f1  f2  f3  f4  f5  f6  f7  f8  f9  fa  fb  fc  fd  fe  ff  "
                "\t16\tE/BRS\n");
    } else {
      EXPECT_TRUE(std::regex_match(rest, std::regex(R"(^80\t[0-9a-f]{2}  (00  ){7}\t8\tS\n$)")))
          << line;
    }
  }
  for (const char* id : {"200", "201", "1abcde00", "80"}) EXPECT_GT(seen[id], 0) << id;

  EXPECT_TRUE(Run({"SET_PROP_SESSION_PORTNAME=CAN5", "SET_PROP_LOGFILE_NAME=fd",
                   "SET_PROP_LOGFILE=1", "SET_PROP_LOGFILE_TYPE=1"},
                  kvhost::kCanRecords)
                  .empty());
  const std::string file = LogFile("fd.zfl");
  ASSERT_TRUE(HasBinaryLogMagic(reinterpret_cast<const uint8_t*>(file.data()), file.size()));
  const std::map<uint32_t, size_t> sizes = {
      {0x200, 80}, {0x201, 32}, {kExtendedFlag | 0x1ABCDE00, 32}, {0x080, 24}};
  std::map<uint32_t, int> counted;
  size_t remaining = 1, total = 12;
  for (const driver::RawFrameView& frame :
       ReadRecords(file, BinaryRecordLayout::kCanVariable, &remaining)) {
    ASSERT_TRUE(sizes.count(frame.header.identifier)) << std::hex << frame.header.identifier;
    total += sizes.at(frame.header.identifier);
    ++counted[frame.header.identifier];
  }
  EXPECT_EQ(remaining, 0u);
  EXPECT_EQ(total, file.size());
  EXPECT_EQ(counted.size(), sizes.size());
}

TEST_F(LogOverTcpTest, LinLogsHaveTheChecksumColumnNoResponseFramesAndFixedRecords) {
  const std::vector<std::string> port = {
      "SET_PROP_SESSION_PORTNAME=LIN1", "SET_PROP_SESSION_BAUDRATE=19200",
      "SET_PROP_SESSION_LOG_CHECKSUM=1", "SET_PROP_SESSION_NO_RESPONSE_FRAMES=1",
      "SET_PROP_LOGFILE=1"};
  // The checksum column stays as the log was opened when the host turns it off mid-run.
  std::vector<std::string> errors;
  kvhost::HostClient host = Configured(port, errors);
  WaitForRecords(host, kvhost::kLinRecords, errors, 1);
  EXPECT_TRUE(Command(host, "SET_PROP_SESSION_LOG_CHECKSUM=0"));
  WaitForRecords(host, kvhost::kLinRecords, errors);
  Terminate(host);
  EXPECT_TRUE(errors.empty());
  const std::vector<std::string> lines = Lines(LogFile(".txt"));
  ASSERT_GT(lines.size(), 20u);
  EXPECT_EQ(lines[0], std::string(kLinTextLogHeaderWithChecksum) + "\n");
  const std::regex line(
      R"(^(10\t12  34  (00  ){6}\t2\t[0-9a-f]{2}\tS|11\t[0-9a-f]{2}  01  02  03  04  05  06  07  \t8\t[0-9a-f]{2}\tS|12\t(00  ){8}\t0\t[0-9a-f]{2}\tNR|13\tde  ad  be  ef  (00  ){4}\t4\t[0-9a-f]{2}\tS)\n$)");
  std::map<char, int> ids;
  for (size_t i = 1; i < lines.size(); ++i) {
    const std::string rest = AfterTime(lines[i]);
    EXPECT_TRUE(std::regex_match(rest, line)) << lines[i];
    ++ids[rest[1]];
  }
  EXPECT_EQ(ids.size(), 4u);

  std::vector<std::string> binary = port;
  binary.insert(binary.end() - 1, {"SET_PROP_LOGFILE_NAME=lin", "SET_PROP_LOGFILE_TYPE=1"});
  EXPECT_TRUE(Run(binary, kvhost::kLinRecords).empty());
  const std::string file = LogFile("lin.zfl");
  ASSERT_GT(file.size(), 12u + 24u);
  EXPECT_EQ((file.size() - 12) % 24, 0u);
  EXPECT_TRUE(RecordsAreConsistent(reinterpret_cast<const uint8_t*>(file.data()) + 12,
                                   file.size() - 12, BinaryRecordLayout::kFixed24,
                                   driver::BusKind::kLin));
}

TEST_F(LogOverTcpTest, FlexRayTextLogShowsChannelsStartupAndSync) {
  EXPECT_TRUE(
      Run({"SET_PROP_SESSION_PORTNAME=FlexRay1", "SET_PROP_LOGFILE_NAME=fr", "SET_PROP_LOGFILE=1"},
          kvhost::kFlexRayRecords)
          .empty());
  const std::vector<std::string> lines = Lines(LogFile("fr.txt"));
  ASSERT_GT(lines.size(), 20u);
  EXPECT_EQ(lines[0], std::string(kFlexRayTextLogHeader) + "\n");
  std::map<std::string, int> kinds;
  const std::regex cells(
      R"(^([0-9a-f]+)\t((?:[0-9a-f]{2}  )*)\t(\d+)\t(\d+)\t([AB-])\t([X-])\t([X-])\t([X-])\n$)");
  for (size_t i = 1; i < lines.size(); ++i) {
    std::smatch m;
    const std::string rest = AfterTime(lines[i]);
    ASSERT_TRUE(std::regex_match(rest, m, cells)) << lines[i];
    EXPECT_EQ(m[2].length(), 4 * std::stoi(m[3])) << lines[i];
    EXPECT_LT(std::stoi(m[4]), 64) << lines[i];
    ++kinds[m[1].str() + m[5].str() + m[6].str() + m[7].str()];
  }
  EXPECT_GT(kinds["1AXX"], 0);  // slot 1 on channel A: startup and sync
  EXPECT_GT(kinds["1BXX"], 0);  // and on channel B
  EXPECT_GT(kinds["2A--"], 0);
  EXPECT_GT(kinds["28B--"], 0);  // slot 40
}

TEST_F(LogOverTcpTest, BinaryLogHoldsEveryFrameOfTheBusCaptureInOrder) {
  const std::string capture = (drive_.path() / "body.log").string();
  std::string error;
  ASSERT_TRUE(tarvix::LoadConfiguration(
      R"({"buses":[{"name":"body","capture":")" + capture + R"(","traffic":[
      {"id":"0x100","length":8,"periodMs":10,"payload":"ctr 01 02 03 04 05 06 07"},
      {"id":"0x1A0","length":3,"periodMs":50,"payload":"AA BB CC"},
      {"id":"0x321","kind":"remote","periodMs":500},
      {"id":"0x18FEF100","extended":true,"length":8,"periodMs":100,"payload":"00 11 22 33 44 55 66 77"}]}],
      "devices":[{"name":"SIM-CAN","interfaces":[{"name":"CAN1","bus":"body"}]}]})",
      drive_.path().string(), &error))
      << error;
  EXPECT_TRUE(Run({"SET_PROP_SESSION_PORTNAME=CAN1", "SET_PROP_LOGFILE_NAME=cap",
                   "SET_PROP_LOGFILE_TYPE=1", "SET_PROP_LOGFILE=1"},
                  kvhost::kCanRecords)
                  .empty());
  tarvix::ResetToDefaults();  // closes the capture
  const std::string file = LogFile("cap.zfl");
  ASSERT_EQ((file.size() - 12) % 24, 0u);
  // Each record as the capture writes it: "(seconds.micros) body ID#DATA".
  std::vector<std::string> logged;
  for (const driver::RawFrameView& frame : ReadRecords(file, BinaryRecordLayout::kFixed24)) {
    const driver::RawFrameHeader& h = frame.header;
    const uint64_t micros = (h.timestamp - kFileTimeUnixEpoch) / 10;
    char text[96];
    int n = std::snprintf(text, sizeof text, "(%llu.%06llu) body ",
                          static_cast<unsigned long long>(micros / 1000000),
                          static_cast<unsigned long long>(micros % 1000000));
    n += (h.identifier & kExtendedFlag)
             ? std::snprintf(text + n, sizeof text - n, "%08X#", h.identifier & 0x1FFFFFFF)
             : std::snprintf(text + n, sizeof text - n, "%03X#", h.identifier & 0x7FF);
    if (h.type == kTypeRemote) n += std::snprintf(text + n, sizeof text - n, "R");
    for (uint32_t i = 0; h.type != kTypeRemote && i < h.length; ++i) {
      n += std::snprintf(text + n, sizeof text - n, "%02X", frame.payload[i]);
    }
    logged.push_back(text);
  }
  ASSERT_GT(logged.size(), 100u);
  std::vector<std::string> carried;
  std::ifstream in(capture);
  for (std::string line; std::getline(in, line);) carried.push_back(line);
  const auto first = std::find(carried.begin(), carried.end(), logged.front());
  ASSERT_NE(first, carried.end()) << logged.front();
  ASSERT_LE(logged.size(), static_cast<size_t>(carried.end() - first));
  EXPECT_TRUE(std::equal(logged.begin(), logged.end(), first));
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

}  // namespace
}  // namespace kvtest
