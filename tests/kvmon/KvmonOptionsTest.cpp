// kvmon's command line: the property messages each option set becomes, the refused values, and
// the --tx frame texts with their transmit messages.
#include <gtest/gtest.h>

#include <cstdio>
#include <string>
#include <vector>

#include "host/kvmon/KvmonOptions.h"
#include "host/kvmon/SessionSetup.h"
#include "host/kvmon/TransmitText.h"

namespace kvmon {
namespace {

struct Parsed {
  ParseResult result;
  Options options;
  std::string err;
};

Parsed Parse(std::vector<std::string> args, const char* controllerVariable = nullptr) {
  args.insert(args.begin(), "kvmon");
  std::vector<char*> argv;
  for (auto& arg : args) argv.push_back(arg.data());
  argv.push_back(nullptr);
  Parsed parsed;
  char* text = nullptr;
  size_t size = 0;
  std::FILE* err = open_memstream(&text, &size);
  parsed.result = ParseOptions(static_cast<int>(args.size()), argv.data(), parsed.options, err,
                               controllerVariable);
  std::fclose(err);
  parsed.err.assign(text, size);
  std::free(text);
  return parsed;
}

struct PropertyCase {
  std::vector<std::string> args;
  std::vector<std::string> properties;
};

TEST(KvmonOptions, OptionsBecomeTheControllersPropertyMessagesInOrder) {
  const PropertyCase cases[] = {
      {{"CAN1"}, {"SET_PROP_SESSION_PORTNAME=CAN1"}},
      {{"--alias", "SimDB", "--cluster", "FlexRay", "FlexRay1"},
       {"SET_PROP_SESSION_PORTNAME=FlexRay1", "SET_PROP_SESSION_RUNMODE=NORMAL",
        "SET_PROP_SESSION_ALIAS=SimDB", "SET_PROP_SESSION_CLUSTER=FlexRay"}},
      {{"LIN1", "--run-mode", "Normal", "-b", "19200"},
       {"SET_PROP_SESSION_PORTNAME=LIN1", "SET_PROP_SESSION_RUNMODE=NORMAL",
        "SET_PROP_SESSION_BAUDRATE=19200", "SET_PROP_SESSION_LOG_CHECKSUM=1"}},
      {{"--baud", "0x7A120", "--fd-baud", "2000000", "--io-mode", "fd-brs", "--iso-fd", "1",
        "CAN3"},
       {"SET_PROP_SESSION_PORTNAME=CAN3", "SET_PROP_SESSION_BAUDRATE=500000",
        "SET_PROP_SESSION_CANFD_BAUDRATE=2000000", "SET_PROP_SESSION_CAN_IOMODE=2",
        "SET_PROP_SESSION_ISOFD_MODE=1"}},
      {{"--j1939", "--node-address", "0x80", "--node-name", "0x10", "CAN1"},
       {"SET_PROP_SESSION_PORTNAME=CAN1", "SET_PROP_SESSION_APPLICATION_PROTOCOL=1",
        "SET_PROP_SESSION_NODE_ADDRESS=128", "SET_PROP_SESSION_NODE_NAME=16"}},
      {{"--listen-only", "--bus-errors", "--echo", "--termination", "--transceiver", "4", "CAN1"},
       {"SET_PROP_SESSION_PORTNAME=CAN1", "SET_PROP_SESSION_LISTEN_ONLY=1",
        "SET_PROP_SESSION_LOG_BUS_ERROR_FRAMES=1", "SET_PROP_SESSION_LOG_TRANSMITTED_FRAMES=1",
        "SET_PROP_SESSION_TERMINATION=1", "SET_PROP_SESSION_TRANSCEIVER_TYPE=4"}},
      {{"--data-period", "200", "--stats-period", "1000", "--table-size", "50", "LIN2"},
       {"SET_PROP_SESSION_PORTNAME=LIN2", "SET_PROP_TX_TIME_DATA=200",
        "SET_PROP_TX_TIME_STATISTIC=1000", "SET_PROP_DATA_LOG_IDS_MAX=50",
        "SET_PROP_SESSION_LOG_CHECKSUM=1"}},
      // A text log gets a checksum column only when asked for.
      {{"--log", "text", "--log-name", "lin", "LIN2"},
       {"SET_PROP_SESSION_PORTNAME=LIN2", "SET_PROP_LOGFILE=1", "SET_PROP_LOGFILE_TYPE=0",
        "SET_PROP_LOGFILE_NAME=lin"}},
      // The transmitting session sees its own frame.
      {{"--run-mode", "normal", "-b", "500000", "--tx", "123#11", "CAN3"},
       {"SET_PROP_SESSION_PORTNAME=CAN3", "SET_PROP_SESSION_RUNMODE=NORMAL",
        "SET_PROP_SESSION_BAUDRATE=500000", "SET_PROP_SESSION_LOG_TRANSMITTED_FRAMES=1"}},
      {{"-l", "vora", "--log-name", "run", "--log-group", "g", "--log-channel", "c", "CAN1"},
       {"SET_PROP_SESSION_PORTNAME=CAN1", "SET_PROP_LOGFILE=1", "SET_PROP_LOGFILE_TYPE=2",
        "SET_PROP_LOGFILE_NAME=run", "SET_PROP_LOGFILE_VORA_GROUP_NAME=g",
        "SET_PROP_LOGFILE_VORA_CHANNEL_NAME=c"}},
      {{"--no-response", "--log-checksum", "--log", "text", "--log-name", "l", "LIN1"},
       {"SET_PROP_SESSION_PORTNAME=LIN1", "SET_PROP_SESSION_NO_RESPONSE_FRAMES=1",
        "SET_PROP_SESSION_LOG_CHECKSUM=1", "SET_PROP_LOGFILE=1", "SET_PROP_LOGFILE_TYPE=0",
        "SET_PROP_LOGFILE_NAME=l"}},
      {{"--null-frames", "--key-slot", "5", "FlexRay2"},
       {"SET_PROP_SESSION_PORTNAME=FlexRay2", "SET_PROP_SESSION_SHOW_NULL_FRAMES=1",
        "SET_PROP_SESSION_KEY_SLOT=5"}},
  };
  for (const auto& c : cases) {
    const auto parsed = Parse(c.args);
    EXPECT_EQ(parsed.result, ParseResult::kRun) << c.args.back() << ": " << parsed.err;
    ASSERT_EQ(parsed.options.interfaces.size(), 1u) << c.args.back();
    EXPECT_EQ(SessionProperties(parsed.options, parsed.options.interfaces[0]), c.properties)
        << c.args.back();
  }
}

TEST(KvmonOptions, SeveralInterfacesShareTheSettingsAndLogToFilesOfTheirOwn) {
  const auto parsed = Parse({"--log", "binary", "--log-name", "run", "CAN1", "LIN1"});
  ASSERT_EQ(parsed.result, ParseResult::kRun) << parsed.err;
  EXPECT_EQ(parsed.options.interfaces, (std::vector<std::string>{"CAN1", "LIN1"}));
  EXPECT_EQ(
      SessionProperties(parsed.options, "CAN1"),
      (std::vector<std::string>{"SET_PROP_SESSION_PORTNAME=CAN1", "SET_PROP_LOGFILE=1",
                                "SET_PROP_LOGFILE_TYPE=1", "SET_PROP_LOGFILE_NAME=run-CAN1"}));
  EXPECT_EQ(SessionProperties(parsed.options, "LIN1").back(), "SET_PROP_SESSION_LOG_CHECKSUM=1");
}

TEST(KvmonOptions, ConnectionOutputAndViewOptionsAreRead) {
  const auto parsed = Parse({"-c",       "10.0.0.7:2000", "--json",    "-n",  "3",
                             "-d",       "2.5",           "-w",        "1",   "-f",
                             "100,~1A0", "--changed",     "--age",     "2",   "--sort",
                             "count",    "--timing",      "--overdue", "2.5", "CAN2"});
  ASSERT_EQ(parsed.result, ParseResult::kRun) << parsed.err;
  EXPECT_EQ(parsed.options.controller.host, "10.0.0.7");
  EXPECT_EQ(parsed.options.controller.port, 2000);
  EXPECT_EQ(parsed.options.output, OutputMode::kJson);
  EXPECT_EQ(parsed.options.reports, 3u);
  EXPECT_EQ(parsed.options.durationSeconds, 2.5);
  const ViewOptions& view = parsed.options.view;
  EXPECT_EQ(view.filter.text(), "100,~1A0");
  EXPECT_TRUE(view.changedOnly);
  EXPECT_EQ(view.ageSeconds, 2.0);
  EXPECT_EQ(view.sort, SortOrder::kCount);
  EXPECT_TRUE(view.timing);
  EXPECT_EQ(view.overdueFactor, 2.5);
  EXPECT_TRUE(Parse({"--hardware"}).options.hardware);
  EXPECT_EQ(Parse({"--help"}).result, ParseResult::kHelp);
}

struct AddressCase {
  const char* option;    // -c, or nullptr
  const char* variable;  // KVMON_CONTROLLER, or nullptr
  const char* host;
  uint16_t port;
};

TEST(KvmonOptions, ControllerComesFromTheOptionOrElseTheEnvironment) {
  const AddressCase cases[] = {
      {nullptr, nullptr, "127.0.0.1", 13456},
      {"bench-pc", nullptr, "bench-pc", 13456},
      {"bench-pc:2000", nullptr, "bench-pc", 2000},
      {"[fe80::1]:2000", nullptr, "fe80::1", 2000},
      {"[::1]", nullptr, "::1", 13456},
      {"::1", nullptr, "::1", 13456},
      {nullptr, "rig7:2100", "rig7", 2100},
      {"10.0.0.7", "rig7:2100", "10.0.0.7", 13456},
  };
  for (const auto& c : cases) {
    std::vector<std::string> args = {"CAN1"};
    if (c.option != nullptr) args = {"-c", c.option, "CAN1"};
    const auto parsed = Parse(args, c.variable);
    ASSERT_EQ(parsed.result, ParseResult::kRun) << parsed.err;
    EXPECT_EQ(parsed.options.controller.host, c.host);
    EXPECT_EQ(parsed.options.controller.port, c.port) << c.host;
  }
  const auto bad = Parse({"CAN1"}, "rig7:0");
  EXPECT_EQ(bad.result, ParseResult::kUsageError);
  EXPECT_NE(bad.err.find("KVMON_CONTROLLER: '0' is not a TCP port"), std::string::npos) << bad.err;
}

TEST(KvmonOptions, BadValuesAreUsageErrorsThatNameTheProblem) {
  const std::pair<std::vector<std::string>, std::string> cases[] = {
      {{}, "name the interface"},
      {{"CAN1", "CAN1"}, "named twice"},
      {{"--log", "text", "CAN1"}, "--log needs --log-name"},
      {{"--log-name", "run", "CAN1"}, "--log-name needs --log"},
      {{"--log", "text", "--log-name", "../x", "CAN1"}, "not a plain file name"},
      {{"--run-mode", "normal", "LIN1"}, "needs its bit rate: give --baud"},
      {{"--run-mode", "normal", "-b", "500000", "--io-mode", "fd-brs", "CAN3"}, "--fd-baud"},
      {{"--tx", "123#11", "CAN3", "CAN4"}, "one interface only"},
      {{"-f", "1G0", "CAN1"}, "'1G0' is no identifier"},
      {{"--sort", "name", "CAN1"}, "--sort"},
      {{"--overdue", "1", "CAN1"}, "--overdue"},
      {{"--stats-period", "999", "CAN1"}, "--stats-period"},
      {{"--node-address", "256", "CAN1"}, "--node-address"},
      {{"--io-mode", "3", "CAN1"}, "--io-mode"},
      {{"--baud", "-5", "CAN1"}, "--baud"},
      {{"--log", "xml", "CAN1"}, "--log"},
      {{"--log-name", "", "CAN1"}, "--log-name"},
      {{"--run-mode", "fast", "CAN1"}, "--run-mode"},
      {{"--tx", "123#11", "LIN1"}, "CAN interfaces only"},
      {{"--tx-every", "10", "CAN1"}, "needs a --tx frame"},
      {{"-c", "127.0.0.1:70000", "CAN1"}, "not a TCP port"},
      {{"-c", ":2000", "CAN1"}, "names no host"},
      {{"--frobnicate", "CAN1"}, "unknown option"},
      {{"CAN1=x"}, "not an interface name"},
  };
  for (const auto& [args, words] : cases) {
    const auto parsed = Parse(args);
    EXPECT_EQ(parsed.result, ParseResult::kUsageError) << (args.empty() ? "" : args.front());
    EXPECT_NE(parsed.err.find(words), std::string::npos) << parsed.err;
  }
}

struct FrameCase {
  const char* text;
  uint32_t identifier;
  bool extended;
  uint8_t frameType;
  std::vector<uint8_t> payload;
  uint32_t length;
};

TEST(KvmonTransmitText, FrameTextsGiveIdentifierKindAndPayload) {
  const FrameCase cases[] = {
      {"123#11223344", 0x123, false, 0, {0x11, 0x22, 0x33, 0x44}, 4},
      {"7FF#", 0x7FF, false, 0, {}, 0},
      {"18FEF100#00.11", 0x18FEF100, true, 0, {0x00, 0x11}, 2},
      {"0123#aa", 0x123, true, 0, {0xAA}, 1},
      {"321#R", 0x321, false, 1, {}, 0},
      {"321#R4", 0x321, false, 1, {}, 4},
      {"200##1000102030405060708090A0B",
       0x200,
       false,
       0x18,
       {0, 1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11},
       12},
      {"201##0AB", 0x201, false, 0x10, {0xAB}, 1},
  };
  for (const auto& c : cases) {
    std::string error;
    const auto frame = ParseTransmitFrame(c.text, error);
    ASSERT_TRUE(frame) << c.text << ": " << error;
    EXPECT_EQ(frame->identifier, c.identifier) << c.text;
    EXPECT_EQ(frame->extended, c.extended) << c.text;
    EXPECT_EQ(frame->frameType, c.frameType) << c.text;
    EXPECT_EQ(frame->payload, c.payload) << c.text;
    EXPECT_EQ(frame->length, c.length) << c.text;
  }
}

TEST(KvmonTransmitText, MalformedOrOversizedFramesAreRefused) {
  const std::string allFf64 = "200##0" + std::string(128, 'F');
  for (const std::string text :
       {"123", "800#11", "20000000#00", "123#112", "123#1122334455667788AA", "12G#11", "123#R9",
        "123##1001122334455667788", "#11", allFf64.c_str()}) {
    std::string error;
    EXPECT_FALSE(ParseTransmitFrame(text, error)) << text;
    EXPECT_FALSE(error.empty()) << text;
  }
}

TEST(KvmonTransmitText, MessagesDefineTheFrameThenStartIt) {
  std::string error;
  auto cyclic = *ParseTransmitFrame("18FEF100#0102000000", error);
  cyclic.periodMs = 100;
  EXPECT_EQ(
      TransmitMessages(cyclic),
      (std::vector<std::string>{"SET_TX_PROP_IDENTIFIER=419361024", "SET_TX_PROP_EXTENDED_ID=1",
                                "SET_TX_PROP_FRAME_TYPE=0", "SET_TX_PROP_PAYLOAD_LENGTH=5",
                                "SET_TX_PROP_TIMING_TYPE=0", "SET_TX_PROP_CYCLIC_RATE=0.1",
                                "SET_TX_PROP_PAYLOAD=1,2", "CMD_TX_START"}));
  const auto remote = *ParseTransmitFrame("321#R2", error);
  const auto messages = TransmitMessages(remote);
  EXPECT_EQ(messages[2], "SET_TX_PROP_FRAME_TYPE=1");
  EXPECT_EQ(messages[4], "SET_TX_PROP_TIMING_TYPE=3");
  EXPECT_EQ(messages[5], "SET_TX_PROP_CYCLIC_RATE=0");
  for (const auto& message : TransmitMessages(
           *ParseTransmitFrame("200##0" + std::string(118, 'F') + std::string(10, '0'), error))) {
    EXPECT_LE(message.size(), 256u);
  }
}

}  // namespace
}  // namespace kvmon
