// What kvmon shows: controller errors in plain words, changed payload bytes, decoded bus states
// and the line formats of records and statistics.
#include <gtest/gtest.h>

#include <cctype>
#include <cstring>
#include <string>
#include <vector>

#include "host/kvmon/BusReport.h"
#include "host/kvmon/JsonLines.h"
#include "host/kvmon/LiveTable.h"
#include "host/kvmon/PlainLines.h"
#include "host/kvmon/PlainWords.h"
#include "host/kvmon/SourceModel.h"
#include "host/kvmon/TerminalView.h"

namespace kvmon {
namespace {

TEST(KvmonPlainWords, ControllerErrorsAreToldInPlainWords) {
  const std::pair<const char*, const char*> cases[] = {
      {"<ERROR: WRONG PORT NAME>\n", "no interface named 'ETH1'"},
      {"<ERROR: -1074384832>\n",
       "could not open the session on ETH1: no such interface (status 0xBFF63040)"},
      {"<ERROR: -1074384845>\n", "a value is out of range (status 0xBFF63033) (is a bit rate"},
      {"<ERROR: no valid file name, file name KelvaneLog will be used>\n", "logs to KelvaneLog"},
      {"<ERROR: CMD_SESSION_START: no Alias and Cluster defined>\n", "give --alias and --cluster"},
      {"<ERROR: CAN session is already started>\n", "already has a session"},
      {"<ERROR: Heartbeat message missing| TCP Client disconnect> \n",
       "no heartbeat from this host for 10 seconds"},
      {"<ERROR: SET_PROP_TX_TIME_STATISTIC: Value range error>\n",
       "refused the value of --stats-period"},
      {"<ERROR: SET_PROP_SESSION_RUNMODE: LIN Session yet created>\n",
       "--run-mode cannot be changed while a session"},
      {"<ERROR: SET_PROP_LOGFILE_NAME, logging is active>\n",
       "cannot be changed while the session logs"},
      {"<ERROR:LOG FILE: -20> \n",
       "logging failed on the controller: the log file could not be opened (status -20)"},
      {"<ERROR: unknown SETPROP command>\n", "does not know this setting"},
      {"<ERROR: something new>\n", "the controller reports: something new"},
  };
  for (const auto& [reply, words] : cases) {
    const std::string explained = ExplainError(reply, "ETH1");
    EXPECT_NE(explained.find(words), std::string::npos) << reply << " gave: " << explained;
    EXPECT_EQ(explained.find("<ERROR"), std::string::npos) << explained;
  }
  EXPECT_EQ(DescribeStatus(static_cast<int32_t>(0xBFF6ABCD)), "status 0xBFF6ABCD");
}

kvhost::IdentifierRecord Record(uint32_t id, std::vector<uint8_t> payload, uint32_t count = 1) {
  kvhost::IdentifierRecord r;
  r.identifier = id;
  r.count = count;
  r.payloadLength = static_cast<uint32_t>(payload.size());
  r.payload = std::move(payload);
  return r;
}

TEST(KvmonLiveTable, ChangedBytesAreMarkedAgainstThePreviousReportOfTheSameRow) {
  LiveTable table(Bus::kCan);
  table.update({Record(0x100, {1, 2, 3}), Record(0x200, {9})});
  ASSERT_EQ(table.rows().size(), 2u);
  EXPECT_TRUE(table.rows()[0].fresh);
  EXPECT_EQ(table.rows()[0].changed, (std::vector<bool>{false, false, false}));

  auto remote = Record(0x100, {});
  remote.type = 1;  // a remote frame of the same identifier is a row of its own
  table.update({Record(0x100, {1, 7, 3, 4}), remote, Record(0x200, {9})});
  ASSERT_EQ(table.rows().size(), 3u);
  EXPECT_FALSE(table.rows()[0].fresh);
  EXPECT_EQ(table.rows()[0].changed, (std::vector<bool>{false, true, false, true}));
  EXPECT_TRUE(table.rows()[1].fresh);
  EXPECT_EQ(table.rows()[2].changed, (std::vector<bool>{false}));
}

TEST(KvmonLiveTable, AFullMessageIsContinuedByTheNextInIdentifierOrder) {
  constexpr size_t kFullMessageBytes = 100000;
  LiveTable table(Bus::kCan);
  table.update({Record(0x100, {1}), Record(0x200, {2})}, kFullMessageBytes);
  table.update({Record(0x300, {3})}, 40);  // the rest of the same report
  ASSERT_EQ(table.rows().size(), 3u);
  EXPECT_EQ(table.rows()[2].record.identifier, 0x300u);

  table.update({Record(0x100, {9}), Record(0x200, {2})}, kFullMessageBytes);  // the next report
  table.update({Record(0x300, {4})}, 40);
  ASSERT_EQ(table.rows().size(), 3u);
  EXPECT_EQ(table.rows()[0].changed, (std::vector<bool>{true}));
  EXPECT_EQ(table.rows()[2].changed, (std::vector<bool>{true}));

  table.update({Record(0x100, {9})}, 40);  // after a short message every message is a new report
  table.update({Record(0x300, {4})}, 40);
  ASSERT_EQ(table.rows().size(), 1u);
  EXPECT_EQ(table.rows()[0].record.identifier, 0x300u);
}

// A line as the terminal shows it: without escape sequences.
std::string Visible(const std::string& line) {
  std::string text;
  for (size_t i = 0; i < line.size(); ++i) {
    if (line[i] == '\x1b') {
      while (i < line.size() && !std::isalpha(static_cast<unsigned char>(line[i]))) ++i;
      continue;
    }
    text += line[i];
  }
  return text;
}

TEST(KvmonTerminalView, LongPayloadsAreCutToTheWindowWithTheCountOfHiddenBytes) {
  std::FILE* screen = std::fopen("/dev/null", "w");
  ASSERT_NE(screen, nullptr);
  SourceModel can5("CAN5", Bus::kCan, 3.0);
  TerminalView view({&can5}, "CAN5 on test", ViewOptions{}, screen, nullptr);
  std::vector<uint8_t> ramp(64);
  for (size_t i = 0; i < ramp.size(); ++i) ramp[i] = static_cast<uint8_t>(i);
  view.showRecords(can5, can5.takeRecords({Record(0x200, ramp, 2)}, 0, 0));
  for (const int columns : {40, 60, 80, 96, 132, 240}) {
    const auto lines = view.lines(TerminalSize{columns, 24});
    for (const auto& line : lines)
      EXPECT_LT(Visible(line).size(), static_cast<size_t>(columns)) << Visible(line);
    const std::string row = Visible(lines[2]);
    EXPECT_EQ(row.rfind("200 ", 0), 0u) << row;
    if (columns >= 60 && columns < 240) {  // narrower windows cut the row before the payload
      EXPECT_NE(row.find(" +"), std::string::npos) << row;
    }
  }
  const std::string whole = Visible(view.lines(TerminalSize{240, 24})[2]);
  EXPECT_NE(whole.find("3D 3E 3F"), std::string::npos) << whole;
  std::fclose(screen);
}

std::vector<uint8_t> Words(const std::vector<uint32_t>& words) {
  std::vector<uint8_t> bytes(words.size() * 4);
  std::memcpy(bytes.data(), words.data(), bytes.size());  // the test host is little-endian too
  return bytes;
}

std::string StateText(const BusReport& report, const std::string& name) {
  for (const auto& value : report.state) {
    if (value.name == name) return value.text;
  }
  return "(missing)";
}

TEST(KvmonBusReport, StatisticsBlocksAreDecodedByBusWithTheirStateWords) {
  // CAN: error passive, last error acknowledge, TEC 128, REC 3, load 12.34 %.
  const auto can =
      DecodeBusReport(Words({10, 1, 20, 2, 30, 3, 40, 4, 1234, 2000, 0, 1, 3, 3, 128, 0, 0}));
  ASSERT_TRUE(can);
  EXPECT_EQ(can->bus, Bus::kCan);
  EXPECT_EQ(can->frames[1].name, "extended");
  EXPECT_EQ(can->frames[1].perSecond, 2u);
  EXPECT_EQ(PercentText(*can->busLoad), "12.34");
  EXPECT_EQ(StateText(*can, "state"), "error passive");
  EXPECT_EQ(StateText(*can, "last_error"), "acknowledge");
  EXPECT_EQ(StateText(*can, "tec"), "128");
  EXPECT_EQ(StateText(*can, "rec"), "3");

  // LIN: stopped wins over the activity bits; last error no response on 0x12.
  const auto lin = DecodeBusReport(Words({5, 1, 0, 0, 2, 1, 0, 0, 1, 2, 0x12, 0, 0, 1, 0}));
  ASSERT_TRUE(lin);
  EXPECT_EQ(StateText(*lin, "state"), "stopped");
  EXPECT_EQ(StateText(*lin, "last_error"), "no response");
  EXPECT_EQ(StateText(*lin, "last_error_id"), "12");

  const auto flexRay =
      DecodeBusReport(Words({9, 1, 3, 1, 0, 0, 2, 0, 1, 0, 0, 100, 9, 3, 0, 0, 17, 3}));
  ASSERT_TRUE(flexRay);
  EXPECT_EQ(StateText(*flexRay, "state"), "normal active");
  EXPECT_EQ(StateText(*flexRay, "channels"), "A+B");
  EXPECT_EQ(StateText(*flexRay, "cycle"), "17");

  EXPECT_FALSE(DecodeBusReport(std::vector<uint8_t>(64)));
}

TEST(KvmonLines, RecordLinesCarryIdentifierTypePayloadCountAndPeriod) {
  auto extended = Record(0x20000000 | 0x18FEF100, {0x00, 0x11}, 7);
  extended.lastTimestamp =
      116444736000000000ULL + 10'000'000ULL * 5 + 1234567;          // 1970 + 5.1234567 s
  extended.previousTimestamp = extended.lastTimestamp - 1'000'000;  // 100 ms before
  SourceModel can1("CAN1", Bus::kCan, 3.0);
  can1.takeRecords({extended}, 0, extended.lastTimestamp);
  const ShownRow row{&can1, &can1.table().rows()[0], Timing{}};
  EXPECT_EQ(PlainLines::recordLine(row, false),
            "5.123456 CAN1 18FEF100 data [2] 00 11 count=7 period=100.000ms");
  EXPECT_EQ(JsonLines::recordObject(row),
            "{\"kind\":\"record\",\"timestamp\":5.123456,\"interface\":\"CAN1\",\"bus\":\"CAN\","
            "\"id\":419361024,\"id_text\":\"18FEF100\",\"extended\":true,\"type\":\"data\","
            "\"type_code\":0,\"length\":2,\"data\":\"0011\",\"count\":7,\"period_ms\":100.0000,"
            "\"echo\":false,\"raw_timestamp\":116444736051234567,\"mean_period_ms\":null,"
            "\"jitter_ms\":null,\"min_gap_ms\":null,\"max_gap_ms\":null,\"overdue\":false}");

  auto slot = Record(40, {0x40}, 1);
  slot.type = 0x20;
  slot.channel = 1;
  slot.cycle = 5;
  SourceModel flexRay("Fr\"1", Bus::kFlexRay, 3.0);
  flexRay.takeRecords({slot}, 0, 0);
  const ShownRow slotRow{&flexRay, &flexRay.table().rows()[0], Timing{}};
  EXPECT_EQ(PlainLines::recordLine(slotRow, false),
            "0.000000 Fr\"1 slot 40 B data [1] 40 count=1 cycle=5");
  const std::string object = JsonLines::recordObject(slotRow);
  EXPECT_NE(object.find("\"interface\":\"Fr\\\"1\""), std::string::npos) << object;
  EXPECT_NE(object.find("\"id\":40,\"id_text\":\"slot 40 B\""), std::string::npos) << object;
  EXPECT_NE(object.find("\"period_ms\":null"), std::string::npos) << object;
  EXPECT_NE(object.find("\"channel\":\"B\",\"cycle\":5"), std::string::npos) << object;
}

}  // namespace
}  // namespace kvmon
