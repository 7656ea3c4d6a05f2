// Every property message over TCP: exact reply bytes, types, headers and the values stored.
#include <gtest/gtest.h>

#include <functional>
#include <ostream>
#include <string>
#include <vector>

#include "service/HostConnection.h"
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
const ExpectedReply kKelvaneLogAck = Ack("<ACK: SET_PROP_LOGFILE_NAME KelvaneLog> \n");

// Failures name the row, not its bytes.
void PrintTo(const Row& row, std::ostream* out) { *out << row.name; }

Row One(std::string name, std::string message, std::vector<ExpectedReply> replies,
        StoredCheck stored = {}) {
  return {std::move(name), {{std::move(message), std::move(replies)}}, std::move(stored)};
}

const SessionSettings& S(const HostConnection& c) { return c.settings; }

std::vector<Row> PortNameRows() {
  return {
      One("PortNameCanSetsBusTypeAndInterfaceName", kSetPort + "CAN3",
          {Ack("<ACK: SET_PROP_SESSION_PORTNAME CAN3>")},
          [](auto& c) {
            return c.busType == 1 && S(c).portName.Get() == "CAN3" &&
                   S(c).interfaceName.Get() == "CAN3@qv_corle_tarvix";
          }),
      One("PortNameLinSetsBusTypeTwo", kSetPort + "LIN1",
          {Ack("<ACK: SET_PROP_SESSION_PORTNAME LIN1>")}, [](auto& c) { return c.busType == 2; }),
      One("PortNameFlexRaySetsBusTypeThree", kSetPort + "FlexRay2",
          {Ack("<ACK: SET_PROP_SESSION_PORTNAME FlexRay2>")},
          [](auto& c) { return c.busType == 3; }),
      One("PortNameFlexWithoutRayIsWrong", kSetPort + "Flex1", {Error("<ERROR: WRONG PORT NAME>\n")},
          [](auto& c) { return c.busType == 0; }),
      {"PortNameUnknownKeepsBusTypeButStoresTheNames",
       {{kSetPort + "CAN1", {Ack("<ACK: SET_PROP_SESSION_PORTNAME CAN1>")}},
        {kSetPort + "ETH1", {Error("<ERROR: WRONG PORT NAME>\n")}}},
       [](auto& c) {
         return c.busType == 1 && S(c).portName.Get() == "ETH1" &&
                S(c).interfaceName.Get() == "ETH1@qv_corle_tarvix";
       }},
      One("PortNameEmptyIsAnErrorAndStoresTheSuffixAlone", kSetPort,
          {Error("<ERROR: SET_PROP_SESSION_PORTNAME: empty paramter>\n")},
          [](auto& c) { return c.busType == 0 && S(c).interfaceName.Get() == "@qv_corle_tarvix"; }),
      One("PortNameKeepsAHostLineEndInTheValue", kSetPort + "CAN1\n",
          {Ack("<ACK: SET_PROP_SESSION_PORTNAME CAN1\n>")},
          [](auto& c) { return S(c).interfaceName.Get() == "CAN1\n@qv_corle_tarvix"; }),
      One("PortNameLongerThan200CharactersIsAnsweredInFull", kSetPort + "CAN" + kLongTail,
          {Ack("<ACK: SET_PROP_SESSION_PORTNAME CAN" + kLongTail + ">")}),
  };
}

std::vector<Row> PlainRows() {
  const std::string baud = "SET_PROP_SESSION_BAUDRATE=";
  const std::string key = "SET_PROP_SESSION_KEY_SLOT=";
  return {
      One("BaudRateIsStoredAndAcknowledged", baud + "500000",
          {Ack("<ACK: SET_PROP_SESSION_BAUDRATE 500000> \n")},
          [](auto& c) { return S(c).baudRate == 500000; }),
      One("BaudRateSkipsLeadingBlanksAndTakesAPlusSign", baud + " \t+250000kbit",
          {Ack("<ACK: SET_PROP_SESSION_BAUDRATE 250000> \n")}),
      One("BaudRateMinusOneWrapsToTheLargest64BitValue", baud + "-1",
          {Ack("<ACK: SET_PROP_SESSION_BAUDRATE 18446744073709551615> \n")}),
      {"BaudRateThatCannotBeReadKeepsTheOldValue",
       {{baud + "500000", {Ack("<ACK: SET_PROP_SESSION_BAUDRATE 500000> \n")}},
        {baud + "abc", {Ack("<ACK: SET_PROP_SESSION_BAUDRATE 500000> \n")}}},
       [](auto& c) { return S(c).baudRate == 500000; }},
      One("TxTimeDataUsesTheOldAcknowledgementName", "SET_PROP_TX_TIME_DATA=200",
          {Ack("<ACK: SETPROP_TXTIMECAN 200> \n")}, [](auto& c) { return S(c).txTimeData == 200; }),
      One("TxTimeDataNegativeIsStoredAsItsUnsignedBits", "SET_PROP_TX_TIME_DATA=-5",
          {Ack("<ACK: SETPROP_TXTIMECAN -5> \n")},
          [](auto& c) { return S(c).txTimeData == 0xFFFFFFFBu; }),
      One("DataLogIdsMaxUsesTheMemorySizeName", "SET_PROP_DATA_LOG_IDS_MAX=5000",
          {Ack("<ACK: SET_PROP_MEM_SIZE_ID 5000> \n")},
          [](auto& c) { return S(c).dataLogIdsMax == 5000; }),
      One("KeySlotHexadecimal", key + "0x10", {Ack("<ACK: SET_PROP_SESSION_KEY_SLOT 16> \n")},
          [](auto& c) { return S(c).keySlot == 16; }),
      One("KeySlotLeadingZeroIsOctal", key + "010", {Ack("<ACK: SET_PROP_SESSION_KEY_SLOT 8> \n")},
          [](auto& c) { return S(c).keySlot == 8; }),
      One("KeySlotAllBitsIsAcknowledgedAsMinusOne", key + "0xFFFFFFFF",
          {Ack("<ACK: SET_PROP_SESSION_KEY_SLOT -1> \n")},
          [](auto& c) { return S(c).keySlot == 0xFFFFFFFFu; }),
      One("KeySlotTooLargeGivesAllBits", key + "99999999999",
          {Ack("<ACK: SET_PROP_SESSION_KEY_SLOT -1> \n")},
          [](auto& c) { return S(c).keySlot == 0xFFFFFFFFu; }),
      One("CanFdBaudRate", "SET_PROP_SESSION_CANFD_BAUDRATE=2000000",
          {Ack("<ACK: SET_PROP_SESSION_CANFD_BAUDRATE 2000000> \n")},
          [](auto& c) { return S(c).canFdBaudRate == 2000000; }),
      One("IsoFdModeHasTwoBlanksBeforeTheValue", "SET_PROP_SESSION_ISOFD_MODE=1",
          {Ack("<ACK: SET_PROP_SESSION_ISOFD_MODE  1> \n")},
          [](auto& c) { return S(c).isoFdMode == 1; }),
      One("NodeAddressIsAcknowledgedWithoutItsValue", "SET_PROP_SESSION_NODE_ADDRESS=33",
          {Ack("<ACK: SET_PROP_SESSION_NODE_ADDRESS>\n")},
          [](auto& c) { return S(c).nodeAddress == 33; }),
      One("NodeAddress256AsAByteIsZero", "SET_PROP_SESSION_NODE_ADDRESS=256",
          {Ack("<ACK: SET_PROP_SESSION_NODE_ADDRESS>\n")},
          [](auto& c) { return S(c).nodeAddress == 0; }),
      One("NodeAddressMinusOneAsAByteIs255", "SET_PROP_SESSION_NODE_ADDRESS=-1",
          {Ack("<ACK: SET_PROP_SESSION_NODE_ADDRESS>\n")},
          [](auto& c) { return S(c).nodeAddress == 255; }),
      One("NodeNameTakesAFull64BitValue", "SET_PROP_SESSION_NODE_NAME=12345678901234567890",
          {Ack("<ACK: SET_PROP_SESSION_NODE_NAME 12345678901234567890> \n")},
          [](auto& c) { return S(c).nodeName == 12345678901234567890ull; }),
  };
}

std::vector<Row> StoreOnlyValidRows() {
  const std::string io = "SET_PROP_SESSION_CAN_IOMODE=";
  const std::string app = "SET_PROP_SESSION_APPLICATION_PROTOCOL=";
  const std::string ioError = "<ERROR: SET_PROP_SESSION_CAN_IOMODE: Value range error>\n";
  const std::string appError = "<ERROR: SET_PROP_SESSION_APPLICATION_PROTOCOL: Value range error>\n";
  return {
      One("CanIoModeTwoIsStored", io + "2", {Ack("<ACK: SET_PROP_SESSION_IOMODE 2> \n")},
          [](auto& c) { return S(c).canIoMode == 2; }),
      {"CanIoModeOutOfRangeGivesTheErrorThenTheAcknowledgementAndKeepsTheOldMode",
       {{io + "1", {Ack("<ACK: SET_PROP_SESSION_IOMODE 1> \n")}},
        {io + "5", {Error(ioError), Ack("<ACK: SET_PROP_SESSION_IOMODE 5> \n")}}},
       [](auto& c) { return S(c).canIoMode == 1; }},
      One("CanIoModeMinusOneIsOutOfRange", io + "-1",
          {Error(ioError), Ack("<ACK: SET_PROP_SESSION_IOMODE -1> \n")},
          [](auto& c) { return S(c).canIoMode == 0; }),
      One("ApplicationProtocolOneIsStored", app + "1",
          {Ack("<ACK: SET_PROP_SESSION_APPLICATION_PROTOCOL 1> \n")},
          [](auto& c) { return S(c).applicationProtocol == 1; }),
      One("ApplicationProtocolTwoGivesTheErrorThenTheAcknowledgement", app + "2",
          {Error(appError), Ack("<ACK: SET_PROP_SESSION_APPLICATION_PROTOCOL 2> \n")},
          [](auto& c) { return S(c).applicationProtocol == 0; }),
  };
}

std::vector<Row> CheckedRows() {
  const std::string logError = "<ERROR: SET_PROP_LOGFILE: Value range error>\n";
  const std::string statError = "<ERROR: SET_PROP_TX_TIME_STATISTIC: Value range error>\n";
  const std::string xcvrError = "<ERROR: SET_PROP_SESSION_TRANSCEIVER_TYPE: Value range error>\n";
  return {
      One("LogFileOneIsAcknowledged", "SET_PROP_LOGFILE=1", {Ack("<ACK: SET_PROP_LOGFILE 1> \n")},
          [](auto& c) { return S(c).logFileEnabled == 1; }),
      One("LogFileTwoIsARangeErrorAndStaysStored", "SET_PROP_LOGFILE=2", {Error(logError)},
          [](auto& c) { return S(c).logFileEnabled == 2; }),
      One("LogFile256IsAcknowledgedAsZero", "SET_PROP_LOGFILE=256",
          {Ack("<ACK: SET_PROP_LOGFILE 0> \n")}),
      One("LogFileMinusOneIsByte255AndARangeError", "SET_PROP_LOGFILE=-1", {Error(logError)},
          [](auto& c) { return S(c).logFileEnabled == 255; }),
      One("LogFileTypeTwoIsTheHighestAccepted", "SET_PROP_LOGFILE_TYPE=2",
          {Ack("<ACK: SET_PROP_LOGFILE_TYPE 2> \n")},
          [](auto& c) { return S(c).logFileType == 2; }),
      One("LogFileTypeThreeIsARangeError", "SET_PROP_LOGFILE_TYPE=3",
          {Error("<ERROR: SET_PROP_LOGFILE_TYPE: Value range error>\n")},
          [](auto& c) { return S(c).logFileType == 3; }),
      One("TxTimeStatistic999IsARangeError", "SET_PROP_TX_TIME_STATISTIC=999", {Error(statError)},
          [](auto& c) { return S(c).txTimeStatistic == 999; }),
      One("TxTimeStatistic1000IsAcknowledged", "SET_PROP_TX_TIME_STATISTIC=1000",
          {Ack("<ACK: SET_PROP_TX_TIME_STATISTIC 1000> \n")}),
      One("TxTimeStatisticMinusOneIsAcknowledgedByTheUnsignedCheck",
          "SET_PROP_TX_TIME_STATISTIC=-1", {Ack("<ACK: SET_PROP_TX_TIME_STATISTIC -1> \n")}),
      One("TransceiverTypeFourIsTheHighestAccepted", "SET_PROP_SESSION_TRANSCEIVER_TYPE=4",
          {Ack("<ACK: SET_PROP_SESSION_TRANSCEIVER_TYPE 4> \n")}),
      One("TransceiverTypeFiveIsARangeError", "SET_PROP_SESSION_TRANSCEIVER_TYPE=5",
          {Error(xcvrError)}),
      One("TransceiverTypeMinusOneIsARangeError", "SET_PROP_SESSION_TRANSCEIVER_TYPE=-1",
          {Error(xcvrError)}),
      One("ShowNullFramesOne", "SET_PROP_SESSION_SHOW_NULL_FRAMES=1",
          {Ack("<ACK: SET_PROP_SESSION_SHOW_NULL_FRAMES 1> \n")}),
      One("ShowNullFramesTwo", "SET_PROP_SESSION_SHOW_NULL_FRAMES=2",
          {Error("<ERROR: SET_PROP_SESSION_SHOW_NULL_FRAMES: Value range error>\n")}),
      One("NoResponseFramesOne", "SET_PROP_SESSION_NO_RESPONSE_FRAMES=1",
          {Ack("<ACK: SET_PROP_SESSION_NO_RESPONSE_FRAMES 1> \n")},
          [](auto& c) { return S(c).noResponseFrames == 1; }),
      One("NoResponseFramesTwo", "SET_PROP_SESSION_NO_RESPONSE_FRAMES=2",
          {Error("<ERROR: SET_PROP_SESSION_NO_RESPONSE_FRAMES: Value range error>\n")}),
      One("LogChecksumOne", "SET_PROP_SESSION_LOG_CHECKSUM=1",
          {Ack("<ACK: SET_PROP_SESSION_LOG_CHECKSUM 1> \n")},
          [](auto& c) { return S(c).logChecksum == 1; }),
      One("LogChecksumTwo", "SET_PROP_SESSION_LOG_CHECKSUM=2",
          {Error("<ERROR: SET_PROP_SESSION_LOG_CHECKSUM: Value range error>\n")}),
  };
}

std::vector<Row> SessionLockedRows() {
  return {
      One("LogTransmittedFramesOne", "SET_PROP_SESSION_LOG_TRANSMITTED_FRAMES=1",
          {Ack("<ACK: SET_PROP_SESSION_LOG_TRANSMITTED_FRAMES 1> \n")},
          [](auto& c) { return S(c).logTransmittedFrames == 1; }),
      One("LogTransmittedFramesTwo", "SET_PROP_SESSION_LOG_TRANSMITTED_FRAMES=2",
          {Error("<ERROR: SET_PROP_SESSION_LOG_TRANSMITTED_FRAMES: Value range error>\n")}),
      One("TerminationOne", "SET_PROP_SESSION_TERMINATION=1",
          {Ack("<ACK: SET_PROP_SESSION_TERMINATION 1> \n")},
          [](auto& c) { return S(c).termination == 1; }),
      One("TerminationMinusOneFailsTheUnsignedCheckAndStaysStored",
          "SET_PROP_SESSION_TERMINATION=-1",
          {Error("<ERROR: SET_PROP_SESSION_TERMINATION: Value range error>\n")},
          [](auto& c) { return S(c).termination == 0xFFFFFFFFu; }),
      One("RunModeNormal", "SET_PROP_SESSION_RUNMODE=NORMAL",
          {Ack("<ACK: SET_PROP_SESSION_RUNMODE NORMAL> \n")},
          [](auto& c) { return S(c).runMode.Get() == "NORMAL"; }),
      One("RunModeWordAnywhereInTheText", "SET_PROP_SESSION_RUNMODE=XNORMALX",
          {Ack("<ACK: SET_PROP_SESSION_RUNMODE XNORMALX> \n")}),
      One("RunModeWithoutAKnownWordIsARangeErrorAndStaysStored", "SET_PROP_SESSION_RUNMODE=MASTER",
          {Error("<ERROR: SET_PROP_SESSION_RUNMODE: Value range error>\n")},
          [](auto& c) { return S(c).runMode.Get() == "MASTER"; }),
      One("ListenOnlyOne", "SET_PROP_SESSION_LISTEN_ONLY=1",
          {Ack("<ACK: SET_PROP_SESSION_LISTEN_ONLY 1> \n")},
          [](auto& c) { return S(c).listenOnly == 1; }),
      One("ListenOnlyTwo", "SET_PROP_SESSION_LISTEN_ONLY=2",
          {Error("<ERROR: SET_PROP_SESSION_LISTEN_ONLY: Value range error>\n")}),
      One("LogBusErrorFramesOne", "SET_PROP_SESSION_LOG_BUS_ERROR_FRAMES=1",
          {Ack("<ACK: SET_PROP_SESSION_LOG_BUS_ERROR_FRAMES 1> \n")},
          [](auto& c) { return S(c).logBusErrorFrames == 1; }),
      One("LogBusErrorFramesTwo", "SET_PROP_SESSION_LOG_BUS_ERROR_FRAMES=2",
          {Error("<ERROR: SET_PROP_SESSION_LOG_BUS_ERROR_FRAMES: Value range error>\n")}),
      One("AliasKeepsEverythingAfterTheFirstEquals", "SET_PROP_SESSION_ALIAS=a=b",
          {Ack("<ACK: SET_PROP_SESSION_ALIAS a=b> \n")},
          [](auto& c) { return S(c).alias.Get() == "a=b"; }),
      One("AliasEmptyIsAcknowledged", "SET_PROP_SESSION_ALIAS=",
          {Ack("<ACK: SET_PROP_SESSION_ALIAS > \n")}),
      One("AliasLongerThan200CharactersIsAnsweredInFull", "SET_PROP_SESSION_ALIAS=" + kLongTail,
          {Ack("<ACK: SET_PROP_SESSION_ALIAS " + kLongTail + "> \n")}),
      One("Cluster", "SET_PROP_SESSION_CLUSTER=Body", {Ack("<ACK: SET_PROP_SESSION_CLUSTER Body> \n")},
          [](auto& c) { return S(c).cluster.Get() == "Body"; }),
  };
}

std::vector<Row> LogNameRows() {
  const std::string name = "SET_PROP_LOGFILE_NAME=";
  auto isDefault = [](auto& c) { return S(c).logFileName.Get() == "KelvaneLog"; };
  return {
      One("LogFileNameIsStored", name + "drive1.run2",
          {Ack("<ACK: SET_PROP_LOGFILE_NAME drive1.run2> \n")},
          [](auto& c) { return S(c).logFileName.Get() == "drive1.run2"; }),
      One("LogFileNameEmptyGivesTheErrorThenTheDefaultName", name,
          {Error(kNoValidName), kKelvaneLogAck}, isDefault),
      One("LogFileNameWithBackslashIsNoValidName", name + "..\\..\\evil",
          {Error(kNoValidName), kKelvaneLogAck}, isDefault),
      One("LogFileNameWithSlashIsNoValidName", name + "sub/evil",
          {Error(kNoValidName), kKelvaneLogAck}, isDefault),
      One("LogFileNameDotIsNoValidName", name + ".", {Error(kNoValidName), kKelvaneLogAck},
          isDefault),
      One("LogFileNameDotDotIsNoValidName", name + "..", {Error(kNoValidName), kKelvaneLogAck},
          isDefault),
      One("LogFileNameLongerThan200CharactersIsAnsweredInFull", name + kLongTail,
          {Ack("<ACK: SET_PROP_LOGFILE_NAME " + kLongTail + "> \n")}),
      One("VoraGroupNameHasNoLineEnd", "SET_PROP_LOGFILE_VORA_GROUP_NAME=Drive",
          {Ack("<ACK: SET_PROP_LOGFILE_VORA_GROUP_NAME Drive>")},
          [](auto& c) { return S(c).voraGroupName.Get() == "Drive"; }),
      One("VoraGroupNameEmpty", "SET_PROP_LOGFILE_VORA_GROUP_NAME=",
          {Error("<ERROR: SET_PROP_LOGFILE_VORA_GROUP_NAME: empty paramter>\n")}),
      One("VoraChannelNameHasNoLineEnd", "SET_PROP_LOGFILE_VORA_CHANNEL_NAME=Frames",
          {Ack("<ACK: SET_PROP_LOGFILE_VORA_CHANNEL_NAME Frames>")},
          [](auto& c) { return S(c).voraChannelName.Get() == "Frames"; }),
      One("VoraChannelNameEmpty", "SET_PROP_LOGFILE_VORA_CHANNEL_NAME=",
          {Error("<ERROR: SET_PROP_LOGFILE_VORA_CHANNEL_NAME: empty paramter>\n")}),
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
const ExpectedReply kSentinelReply = Error("<ERROR: unknown SETPROP command>\n");

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
