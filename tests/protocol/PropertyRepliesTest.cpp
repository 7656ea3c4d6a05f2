// Every property message over TCP: exact reply bytes, types, headers and the values stored.
#include <gtest/gtest.h>

#include <functional>
#include <ostream>
#include <string>
#include <vector>

#include "hostlink/HostConnection.h"
#include "tests/protocol/PropertyReplyCheck.h"
#include "tests/support/ServiceFixture.h"

namespace kvtest {
namespace {

using nKV_DLL300::HostConnection;
using nKV_DLL300::SessionSettings;

struct Step {
  std::string message;
  std::vector<ExpectedReply> replies;  // in the order the host receives them
};

// Holds once the connection's state is as the case leaves it.
using StoredCheck = std::function<bool(const HostConnection&)>;

struct Row {
  std::string name;
  std::vector<Step> steps;
  StoredCheck stored;  // may be empty
};

const std::string kSetPort = "SET_PROP_SESSION_PORTNAME=";
const std::string kLongTail(220, 'x');  // makes replies longer than 200 characters
const std::string kNoValidName = "<ERROR: no valid file name, file name KelvaneLog will be used>\n";
const ExpectedReply kKelvaneLogAck = "<ACK: SET_PROP_LOGFILE_NAME KelvaneLog> \n";

// Failures name the row, not its bytes.
void PrintTo(const Row& row, std::ostream* out) { *out << row.name; }

Row One(std::string name, std::string message, std::vector<ExpectedReply> replies,
        StoredCheck stored = {}) {
  return {std::move(name), {{std::move(message), std::move(replies)}}, std::move(stored)};
}

// A switch that takes 0 and 1: 2 is a range error, then 1 is acknowledged.
Row Switch(std::string name, const std::string& property, StoredCheck stored = {}) {
  return {std::move(name),
          {{property + "=2", {"<ERROR: " + property + ": Value range error>\n"}},
           {property + "=1", {"<ACK: " + property + " 1> \n"}}},
          std::move(stored)};
}

const SessionSettings& S(const HostConnection& c) { return c.settings; }
// A stored check on the connection's settings, e.g. STORED(baudRate == 500000).
#define STORED(condition) [](const HostConnection& c) { return c.settings.condition; }

std::vector<Row> PortNameRows() {
  return {
      One("PortNameCanSetsBusTypeAndInterfaceName", kSetPort + "CAN3",
          {"<ACK: SET_PROP_SESSION_PORTNAME CAN3>"},
          [](auto& c) {
            return c.busType == driver::BusKind::kCan && S(c).portName.get() == "CAN3" &&
                   S(c).interfaceName.get() == "CAN3@qv_corle_tarvix";
          }),
      One("PortNameLinSetsBusTypeTwo", kSetPort + "LIN1", {"<ACK: SET_PROP_SESSION_PORTNAME LIN1>"},
          [](auto& c) { return c.busType == driver::BusKind::kLin; }),
      One("PortNameFlexRaySetsBusTypeThree", kSetPort + "FlexRay2",
          {"<ACK: SET_PROP_SESSION_PORTNAME FlexRay2>"},
          [](auto& c) { return c.busType == driver::BusKind::kFlexRay; }),
      One("PortNameFlexWithoutRayIsWrong", kSetPort + "Flex1", {"<ERROR: WRONG PORT NAME>\n"},
          [](auto& c) { return c.busType == driver::BusKind::kNone; }),
      {"PortNameUnknownKeepsBusTypeButStoresTheNames",
       {{kSetPort + "CAN1", {"<ACK: SET_PROP_SESSION_PORTNAME CAN1>"}},
        {kSetPort + "ETH1", {"<ERROR: WRONG PORT NAME>\n"}}},
       [](auto& c) {
         return c.busType == driver::BusKind::kCan && S(c).portName.get() == "ETH1" &&
                S(c).interfaceName.get() == "ETH1@qv_corle_tarvix";
       }},
      One("PortNameEmptyIsAnErrorAndStoresTheSuffixAlone", kSetPort,
          {"<ERROR: SET_PROP_SESSION_PORTNAME: empty paramter>\n"},
          [](auto& c) {
            return c.busType == driver::BusKind::kNone &&
                   S(c).interfaceName.get() == "@qv_corle_tarvix";
          }),
      One("PortNameKeepsAHostLineEndInTheValue", kSetPort + "CAN1\n",
          {"<ACK: SET_PROP_SESSION_PORTNAME CAN1\n>"},
          STORED(interfaceName.get() == "CAN1\n@qv_corle_tarvix")),
      One("PortNameLongerThan200CharactersIsAnsweredInFull", kSetPort + "CAN" + kLongTail,
          {"<ACK: SET_PROP_SESSION_PORTNAME CAN" + kLongTail + ">"}),
  };
}

std::vector<Row> PlainRows() {
  const std::string baud = "SET_PROP_SESSION_BAUDRATE=";
  const std::string key = "SET_PROP_SESSION_KEY_SLOT=";
  return {
      One("BaudRateIsStoredAndAcknowledged", baud + "500000",
          {"<ACK: SET_PROP_SESSION_BAUDRATE 500000> \n"}, STORED(baudRate == 500000)),
      {"BaudRateThatCannotBeReadKeepsTheOldValue",
       {{baud + "500000", {"<ACK: SET_PROP_SESSION_BAUDRATE 500000> \n"}},
        {baud + "abc", {"<ACK: SET_PROP_SESSION_BAUDRATE 500000> \n"}}},
       STORED(baudRate == 500000)},
      One("TxTimeDataUsesTheOldAcknowledgementName", "SET_PROP_TX_TIME_DATA=200",
          {"<ACK: SETPROP_TXTIMECAN 200> \n"}, STORED(txTimeData == 200)),
      One("TxTimeDataNegativeIsStoredAsItsUnsignedBits", "SET_PROP_TX_TIME_DATA=-5",
          {"<ACK: SETPROP_TXTIMECAN -5> \n"}, STORED(txTimeData == 0xFFFFFFFBu)),
      One("DataLogIdsMaxUsesTheMemorySizeName", "SET_PROP_DATA_LOG_IDS_MAX=5000",
          {"<ACK: SET_PROP_MEM_SIZE_ID 5000> \n"}, STORED(dataLogIdsMax == 5000)),
      One("KeySlotHexadecimal", key + "0x10", {"<ACK: SET_PROP_SESSION_KEY_SLOT 16> \n"},
          STORED(keySlot == 16)),
      One("KeySlotAllBitsIsAcknowledgedAsMinusOne", key + "0xFFFFFFFF",
          {"<ACK: SET_PROP_SESSION_KEY_SLOT -1> \n"}, STORED(keySlot == 0xFFFFFFFFu)),
      One("CanFdBaudRate", "SET_PROP_SESSION_CANFD_BAUDRATE=2000000",
          {"<ACK: SET_PROP_SESSION_CANFD_BAUDRATE 2000000> \n"}, STORED(canFdBaudRate == 2000000)),
      One("IsoFdModeHasTwoBlanksBeforeTheValue", "SET_PROP_SESSION_ISOFD_MODE=1",
          {"<ACK: SET_PROP_SESSION_ISOFD_MODE  1> \n"}, STORED(isoFdMode == 1)),
      One("NodeAddressIsAcknowledgedWithoutItsValue", "SET_PROP_SESSION_NODE_ADDRESS=33",
          {"<ACK: SET_PROP_SESSION_NODE_ADDRESS>\n"}, STORED(nodeAddress == 33)),
      One("NodeAddressMinusOneAsAByteIs255", "SET_PROP_SESSION_NODE_ADDRESS=-1",
          {"<ACK: SET_PROP_SESSION_NODE_ADDRESS>\n"}, STORED(nodeAddress == 255)),
      One("NodeNameTakesAFull64BitValue", "SET_PROP_SESSION_NODE_NAME=12345678901234567890",
          {"<ACK: SET_PROP_SESSION_NODE_NAME 12345678901234567890> \n"},
          STORED(nodeName == 12345678901234567890ull)),
  };
}

std::vector<Row> StoreOnlyValidRows() {
  const std::string io = "SET_PROP_SESSION_CAN_IOMODE=";
  const std::string app = "SET_PROP_SESSION_APPLICATION_PROTOCOL=";
  const std::string ioError = "<ERROR: SET_PROP_SESSION_CAN_IOMODE: Value range error>\n";
  const std::string appError =
      "<ERROR: SET_PROP_SESSION_APPLICATION_PROTOCOL: Value range error>\n";
  return {
      One("CanIoModeTwoIsStored", io + "2", {"<ACK: SET_PROP_SESSION_IOMODE 2> \n"},
          STORED(canIoMode == 2)),
      {"CanIoModeOutOfRangeGivesTheErrorThenAcknowledgesTheKeptMode",
       {{io + "1", {"<ACK: SET_PROP_SESSION_IOMODE 1> \n"}},
        {io + "5", {ioError, "<ACK: SET_PROP_SESSION_IOMODE 1> \n"}}},
       STORED(canIoMode == 1)},
      One("CanIoModeMinusOneIsOutOfRange", io + "-1",
          {ioError, "<ACK: SET_PROP_SESSION_IOMODE 0> \n"}, STORED(canIoMode == 0)),
      One("ApplicationProtocolOneIsStored", app + "1",
          {"<ACK: SET_PROP_SESSION_APPLICATION_PROTOCOL 1> \n"}, STORED(applicationProtocol == 1)),
      One("ApplicationProtocolTwoGivesTheErrorThenAcknowledgesTheKeptValue", app + "2",
          {appError, "<ACK: SET_PROP_SESSION_APPLICATION_PROTOCOL 0> \n"},
          STORED(applicationProtocol == 0)),
  };
}

std::vector<Row> CheckedRows() {
  const std::string logError = "<ERROR: SET_PROP_LOGFILE: Value range error>\n";
  const std::string statError = "<ERROR: SET_PROP_TX_TIME_STATISTIC: Value range error>\n";
  const std::string xcvrError = "<ERROR: SET_PROP_SESSION_TRANSCEIVER_TYPE: Value range error>\n";
  return {
      One("LogFileOneIsAcknowledged", "SET_PROP_LOGFILE=1", {"<ACK: SET_PROP_LOGFILE 1> \n"},
          STORED(logFileEnabled == 1)),
      One("LogFileTwoIsARangeErrorAndStaysStored", "SET_PROP_LOGFILE=2", {logError},
          STORED(logFileEnabled == 2)),
      One("LogFile256IsAcknowledgedAsZero", "SET_PROP_LOGFILE=256",
          {"<ACK: SET_PROP_LOGFILE 0> \n"}),
      One("LogFileMinusOneIsByte255AndARangeError", "SET_PROP_LOGFILE=-1", {logError},
          STORED(logFileEnabled == 255)),
      One("LogFileTypeTwoIsTheHighestAccepted", "SET_PROP_LOGFILE_TYPE=2",
          {"<ACK: SET_PROP_LOGFILE_TYPE 2> \n"}, STORED(logFileType == 2)),
      One("LogFileTypeThreeIsARangeError", "SET_PROP_LOGFILE_TYPE=3",
          {"<ERROR: SET_PROP_LOGFILE_TYPE: Value range error>\n"}, STORED(logFileType == 3)),
      One("TxTimeStatistic999IsARangeError", "SET_PROP_TX_TIME_STATISTIC=999", {statError},
          STORED(txTimeStatistic == 999)),
      One("TxTimeStatistic1000IsAcknowledged", "SET_PROP_TX_TIME_STATISTIC=1000",
          {"<ACK: SET_PROP_TX_TIME_STATISTIC 1000> \n"}),
      One("TxTimeStatisticMinusOneIsAcknowledgedByTheUnsignedCheck",
          "SET_PROP_TX_TIME_STATISTIC=-1", {"<ACK: SET_PROP_TX_TIME_STATISTIC -1> \n"}),
      One("TransceiverTypeFourIsTheHighestAccepted", "SET_PROP_SESSION_TRANSCEIVER_TYPE=4",
          {"<ACK: SET_PROP_SESSION_TRANSCEIVER_TYPE 4> \n"}),
      One("TransceiverTypeFiveIsARangeError", "SET_PROP_SESSION_TRANSCEIVER_TYPE=5", {xcvrError}),
      One("TransceiverTypeMinusOneIsARangeError", "SET_PROP_SESSION_TRANSCEIVER_TYPE=-1",
          {xcvrError}),
      Switch("ShowNullFramesTakesOnlyZeroOrOne", "SET_PROP_SESSION_SHOW_NULL_FRAMES"),
      Switch("NoResponseFramesTakesOnlyZeroOrOne", "SET_PROP_SESSION_NO_RESPONSE_FRAMES",
             STORED(noResponseFrames == 1)),
      Switch("LogChecksumTakesOnlyZeroOrOne", "SET_PROP_SESSION_LOG_CHECKSUM",
             STORED(logChecksum == 1)),
  };
}

std::vector<Row> SessionLockedRows() {
  return {
      Switch("LogTransmittedFramesTakesOnlyZeroOrOne", "SET_PROP_SESSION_LOG_TRANSMITTED_FRAMES",
             STORED(logTransmittedFrames == 1)),
      One("TerminationOne", "SET_PROP_SESSION_TERMINATION=1",
          {"<ACK: SET_PROP_SESSION_TERMINATION 1> \n"}, STORED(termination == 1)),
      One("TerminationMinusOneFailsTheUnsignedCheckAndStaysStored",
          "SET_PROP_SESSION_TERMINATION=-1",
          {"<ERROR: SET_PROP_SESSION_TERMINATION: Value range error>\n"},
          STORED(termination == 0xFFFFFFFFu)),
      One("RunModeNormal", "SET_PROP_SESSION_RUNMODE=NORMAL",
          {"<ACK: SET_PROP_SESSION_RUNMODE NORMAL> \n"}, STORED(runMode.get() == "NORMAL")),
      One("RunModeWordAnywhereInTheText", "SET_PROP_SESSION_RUNMODE=XNORMALX",
          {"<ACK: SET_PROP_SESSION_RUNMODE XNORMALX> \n"}),
      One("RunModeWithoutAKnownWordIsARangeErrorAndStaysStored", "SET_PROP_SESSION_RUNMODE=MASTER",
          {"<ERROR: SET_PROP_SESSION_RUNMODE: Value range error>\n"},
          STORED(runMode.get() == "MASTER")),
      Switch("ListenOnlyTakesOnlyZeroOrOne", "SET_PROP_SESSION_LISTEN_ONLY",
             STORED(listenOnly == 1)),
      Switch("LogBusErrorFramesTakesOnlyZeroOrOne", "SET_PROP_SESSION_LOG_BUS_ERROR_FRAMES",
             STORED(logBusErrorFrames == 1)),
      One("AliasKeepsEverythingAfterTheFirstEquals", "SET_PROP_SESSION_ALIAS=a=b",
          {"<ACK: SET_PROP_SESSION_ALIAS a=b> \n"}, STORED(alias.get() == "a=b")),
      One("AliasEmptyIsAcknowledged",
          "SET_PROP_SESSION_ALIAS=", {"<ACK: SET_PROP_SESSION_ALIAS > \n"}),
      One("AliasLongerThan200CharactersIsAnsweredInFull", "SET_PROP_SESSION_ALIAS=" + kLongTail,
          {"<ACK: SET_PROP_SESSION_ALIAS " + kLongTail + "> \n"}),
      One("Cluster", "SET_PROP_SESSION_CLUSTER=Body", {"<ACK: SET_PROP_SESSION_CLUSTER Body> \n"},
          STORED(cluster.get() == "Body")),
  };
}

std::vector<Row> LogNameRows() {
  const std::string name = "SET_PROP_LOGFILE_NAME=";
  auto isDefault = STORED(logFileName.get() == "KelvaneLog");
  return {
      One("LogFileNameIsStored", name + "drive1.run2",
          {"<ACK: SET_PROP_LOGFILE_NAME drive1.run2> \n"},
          STORED(logFileName.get() == "drive1.run2")),
      One("LogFileNameEmptyGivesTheErrorThenTheDefaultName", name, {kNoValidName, kKelvaneLogAck},
          isDefault),
      One("LogFileNameWithBackslashIsNoValidName", name + "..\\..\\evil",
          {kNoValidName, kKelvaneLogAck}, isDefault),
      One("LogFileNameWithSlashIsNoValidName", name + "sub/evil", {kNoValidName, kKelvaneLogAck},
          isDefault),
      One("LogFileNameDotIsNoValidName", name + ".", {kNoValidName, kKelvaneLogAck}, isDefault),
      One("LogFileNameDotDotIsNoValidName", name + "..", {kNoValidName, kKelvaneLogAck}, isDefault),
      One("VoraGroupNameHasNoLineEnd", "SET_PROP_LOGFILE_VORA_GROUP_NAME=Drive",
          {"<ACK: SET_PROP_LOGFILE_VORA_GROUP_NAME Drive>"},
          STORED(voraGroupName.get() == "Drive")),
      One("VoraGroupNameEmpty", "SET_PROP_LOGFILE_VORA_GROUP_NAME=",
          {"<ERROR: SET_PROP_LOGFILE_VORA_GROUP_NAME: empty paramter>\n"}),
      One("VoraChannelNameHasNoLineEnd", "SET_PROP_LOGFILE_VORA_CHANNEL_NAME=Frames",
          {"<ACK: SET_PROP_LOGFILE_VORA_CHANNEL_NAME Frames>"},
          STORED(voraChannelName.get() == "Frames")),
      One("VoraChannelNameEmpty", "SET_PROP_LOGFILE_VORA_CHANNEL_NAME=",
          {"<ERROR: SET_PROP_LOGFILE_VORA_CHANNEL_NAME: empty paramter>\n"}),
  };
}

std::vector<Row> AllRows() {
  std::vector<Row> rows;
  for (auto part : {PortNameRows(), PlainRows(), StoreOnlyValidRows(), CheckedRows(),
                    SessionLockedRows(), LogNameRows()}) {
    rows.insert(rows.end(), part.begin(), part.end());
  }
  return rows;
}

// A message whose known reply proves that nothing else was sent before it.
const std::string kSentinel = "SET_PROP_FOO=1";
const ExpectedReply kSentinelReply = "<ERROR: unknown SETPROP command>\n";

class PropertyRepliesTest : public ServiceFixture, public ::testing::WithParamInterface<Row> {
 protected:
  // The connection of the one host of the test. Reading its atomics and guarded texts from this
  // thread is safe; the accept that stored it is ordered before the counter this waits for.
  const HostConnection& OnlyConnection() {
    EXPECT_TRUE(WaitUntil([&] { return service().statistics().connectionsAccepted.load() == 1; }));
    return *service().connections[0].connection;
  }
};

TEST_P(PropertyRepliesTest, RepliesAndStoredValuesAreExact) {
  const Row& row = GetParam();
  kvhost::HostClient host = ConnectHost();
  uint32_t sequence = 1;  // the greeting was 0
  for (const Step& step : row.steps) {
    ASSERT_TRUE(host.Send(step.message)) << host.error();
    for (const ExpectedReply& expected : step.replies) {
      ExpectReply(host.Receive(kReplyDeadline), expected, sequence++, {}, step.message);
    }
  }
  ExpectReply(Exchange(host, kSentinel), kSentinelReply, sequence, {}, "after " + row.name);
  if (row.stored) {
    const HostConnection& connection = OnlyConnection();
    EXPECT_TRUE(WaitUntil([&] { return row.stored(connection); })) << "stored values";
  }
}

INSTANTIATE_TEST_SUITE_P(EveryProperty, PropertyRepliesTest, ::testing::ValuesIn(AllRows()),
                         [](const auto& info) { return info.param.name; });

}  // namespace
}  // namespace kvtest
