// Interfaces bound to SocketCAN devices, inside a user-mode kernel with vcan0 (CAN FD), vcan1
// (classic CAN) and an slcan adapter: the controller over TCP against can-utils as the reference.
#include <gtest/gtest.h>

#include <algorithm>
#include <map>
#include <string>
#include <vector>

#include "tests/socketcan/UmlHost.h"

namespace kvtest {
namespace {

constexpr int kFramesPerKind = 1500;
constexpr uint32_t kExtended = 0x20000000;
constexpr uint8_t kTypeBusError = 0x02;
constexpr uint8_t kTypeJ1939 = 0xC0;
constexpr uint8_t kEcho = 0x80;
constexpr uint32_t kBusOff = 2;

// cangen runs, each with its own identifier: classic, extended, remote, CAN FD with and without
// bit-rate switching, random lengths and data, at cangen's highest rate.
const std::vector<std::pair<uint32_t, std::string>> kCangenRuns = {
    {0x123, "-I 123 -L r -D r"},       {0x1ABCDE00 | kExtended, "-e -I 1ABCDE00 -L r -D r"},
    {0x321, "-R -I 321 -L r"},         {0x200, "-f -I 200 -L r -D r"},
    {0x201, "-f -b -I 201 -L r -D r"}, {0x1ABCDE01 | kExtended, "-e -f -b -I 1ABCDE01 -L r -D r"},
};

// The frames of `log` after its last marker frame (0x7FF).
std::vector<LoggedFrame> AfterMarker(const std::vector<LoggedFrame>& log) {
  auto last = std::find_if(log.rbegin(), log.rend(), [](const auto& f) { return f.id == 0x7FF; });
  return std::vector<LoggedFrame>(last.base(), log.end());
}

// True when no frame matching `filter` (candump's id:mask) appears on `device` for one second.
bool QuietForASecond(const std::string& device, const std::string& filter) {
  Shell("candump -T 1000 -n 1 -L " + device + "," + filter + " > /tmp/quiet.log");
  return ReadFile("/tmp/quiet.log").empty();
}

void StartTransmit(Host& host, uint32_t id, bool extended, int frameType, int timingType,
                   const std::string& payload, int length) {
  for (const std::string& p : {"SET_TX_PROP_IDENTIFIER=" + std::to_string(id),
                               "SET_TX_PROP_EXTENDED_ID=" + std::to_string(extended ? 1 : 0),
                               "SET_TX_PROP_FRAME_TYPE=" + std::to_string(frameType),
                               "SET_TX_PROP_TIMING_TYPE=" + std::to_string(timingType),
                               std::string("SET_TX_PROP_CYCLIC_RATE=0.05"),
                               "SET_TX_PROP_PAYLOAD_LENGTH=" + std::to_string(length),
                               "SET_TX_PROP_PAYLOAD=" + payload, std::string("CMD_TX_START")}) {
    EXPECT_EQ(host.Command(p).rfind("<ACK", 0), 0u) << p;
  }
}

TEST(SocketCanTest, BoundInterfacesReportCanFdFromTheDeviceMtu) {
  kvhost::HostClient client;
  ASSERT_TRUE(client.Connect("127.0.0.1", UmlController::Port()));
  ASSERT_TRUE(client.Receive(kDeadline));
  ASSERT_TRUE(client.Send("CMD_GET_HARDWARE_INFO"));
  auto table = client.Receive(kDeadline);
  ASSERT_TRUE(table);
  auto entries = kvhost::DecodeHardwareTable(table->payload);
  ASSERT_TRUE(entries);
  std::map<std::string, uint32_t> canFd;
  for (const auto& e : *entries) canFd[e.name] = e.canProperty;
  EXPECT_EQ(canFd.at("CAN7"), 1u);  // vcan0, MTU 72
  EXPECT_EQ(canFd.at("CAN8"), 0u);  // vcan1, MTU 16
}

TEST(SocketCanTest, CangenFramesReachTheBinaryLogAndTableAsCandumpSawThem) {
  // candump ends by itself 2 s after the last frame, once it has taken every frame queued for it.
  Background candump("exec candump -T 2000 -L -r 67108864 vcan0 > /tmp/cangen.log");
  Host host;
  ASSERT_EQ(
      host.Start({"SET_PROP_SESSION_PORTNAME=CAN7", "SET_PROP_LOGFILE=1", "SET_PROP_LOGFILE_TYPE=1",
                  "SET_PROP_LOGFILE_NAME=cangen", "SET_PROP_TX_TIME_DATA=100"}),
      "");
  // A marker frame, sent until the session sees it: candump, started first, sees it as well.
  ASSERT_TRUE(WaitFor([&] {
    Shell("cansend vcan0 7FF#4B56");
    return host.WaitFor([&] { return host.records.count(0x7FF) > 0; }, 1s);
  }));
  // The runs go in the background: the host keeps its heartbeat while they last.
  std::string runs = "set -e";
  for (const auto& [id, options] : kCangenRuns)
    runs += "; cangen vcan0 -g 0 -n " + std::to_string(kFramesPerKind) + " " + options;
  Background cangen(runs);
  ASSERT_TRUE(host.WaitFor([&] { return cangen.Ended(0ms); }, 120s));
  ASSERT_EQ(cangen.exitStatus(), 0);
  const auto seenAll = [&] {
    return std::all_of(kCangenRuns.begin(), kCangenRuns.end(), [&](const auto& run) {
      auto it = host.records.find(run.first);
      return it != host.records.end() && it->second.count >= kFramesPerKind;
    });
  };
  host.WaitFor(seenAll);
  EXPECT_EQ(host.Command("CMD_SESSION_TERMINATE"), "<ACK: CMD_SESSION_TERMINATE>\n");
  EXPECT_TRUE(candump.Ended(kDeadline));

  const auto reference = AfterMarker(ReadCandumpText(ReadFile("/tmp/cangen.log")));
  ASSERT_EQ(Shell(std::string(KVLOG_PATH) + " --bus can --candump " +
                  UmlController::ServiceFile("cangen.zfl") + " > /tmp/controller.log"),
            0);
  const auto logged = AfterMarker(ReadCandumpText(ReadFile("/tmp/controller.log")));
  const size_t sent = kCangenRuns.size() * kFramesPerKind;
  std::printf("frames lost at cangen -g 0 (%zu frames): controller %zd, candump %zd\n", sent,
              static_cast<ssize_t>(sent) - static_cast<ssize_t>(logged.size()),
              static_cast<ssize_t>(sent) - static_cast<ssize_t>(reference.size()));
  EXPECT_EQ(logged.size(), sent) << "frames lost";
  // Every frame candump took is in the log, in the same order, with the same kernel time stamp.
  size_t at = 0;
  for (const LoggedFrame& f : reference) {
    while (at < logged.size() && logged[at].time != f.time) ++at;
    ASSERT_LT(at, logged.size()) << "not in the log: " << f.time << " " << f.frame;
    ASSERT_EQ(logged[at].frame, f.frame) << "at " << f.time;
  }
  // The identifier table: every identifier's count and last frame as candump saw them.
  for (const auto& [id, options] : kCangenRuns) {
    const auto count = std::count_if(reference.begin(), reference.end(),
                                     [id = id](const auto& f) { return f.id == id; });
    EXPECT_EQ(host.records.at(id).count, static_cast<uint32_t>(count)) << std::hex << id;
  }
}

TEST(SocketCanTest, HostFramesReachCandumpAndTheCyclicFrameEndsWithItsSession) {
  Capture candump("vcan0", ",123:7FF,1ABCDE02:1FFFFFFF", "/tmp/tx.log");
  Host host;
  ASSERT_EQ(host.Start({"SET_PROP_SESSION_PORTNAME=CAN7", "SET_PROP_SESSION_RUNMODE=NORMAL",
                        "SET_PROP_SESSION_BAUDRATE=500000", "SET_PROP_SESSION_CAN_IOMODE=2",
                        "SET_PROP_SESSION_CANFD_BAUDRATE=2000000",
                        "SET_PROP_SESSION_LOG_TRANSMITTED_FRAMES=1", "SET_PROP_TX_TIME_DATA=100"}),
            "");
  StartTransmit(host, 0x123, false, 0x08, 1, "17,34,51,68", 4);  // once, classic
  EXPECT_TRUE(host.WaitFor([&] { return host.records.count(0x123) > 0; }));
  EXPECT_EQ(host.records[0x123].echo, kEcho) << "its own frame, read back";
  EXPECT_EQ(host.Command("CMD_TX_STOP"), "<ACK: CMD_TX_STOP>\n");
  StartTransmit(host, 0x1ABCDE02, true, 0x18, 0, "1,2,3,4,5,6,7,8,9,10,11,12", 12);  // every 50 ms
  EXPECT_TRUE(host.WaitFor([&] { return host.records[0x1ABCDE02 | kExtended].count >= 5; }));
  EXPECT_EQ(host.Command("CMD_SESSION_TERMINATE"), "<ACK: CMD_SESSION_TERMINATE>\n");
  EXPECT_TRUE(WaitFor([] { return QuietForASecond("vcan0", "1ABCDE02:1FFFFFFF"); }));
  const std::string text = candump.Stop();
  const auto sent = ReadCandumpText(text);
  const auto has = [&](const std::string& frame) {
    return std::any_of(sent.begin(), sent.end(), [&](const auto& f) { return f.frame == frame; });
  };
  EXPECT_TRUE(has("123#11223344")) << text;
  EXPECT_TRUE(has("1ABCDE02##10102030405060708090A0B0C")) << text;
}

TEST(SocketCanTest, TheCyclicFrameEndsWhenItsHostVanishes) {
  Host host;
  ASSERT_EQ(host.Start({"SET_PROP_SESSION_PORTNAME=CAN7", "SET_PROP_SESSION_RUNMODE=NORMAL",
                        "SET_PROP_SESSION_BAUDRATE=500000"}),
            "");
  StartTransmit(host, 0x124, false, 0, 0, "1,2", 2);
  EXPECT_EQ(Shell("candump -T 5000 -n 1 vcan0,124:7FF > /tmp/cyclic.log"), 0);
  EXPECT_FALSE(ReadFile("/tmp/cyclic.log").empty()) << "the cyclic frame never went out";
  host.Vanish();  // the controller's heartbeat watchdog ends the session
  EXPECT_TRUE(WaitFor([] { return QuietForASecond("vcan0", "124:7FF"); }, 60s));
}

TEST(SocketCanTest, J1939SessionClaimsItsAddressAndReadsMultiPacketMessages) {
  Capture candump("vcan1", "", "/tmp/j1939.log");
  const std::vector<std::string> j1939 = {"SET_PROP_SESSION_PORTNAME=CAN8",
                                          "SET_PROP_SESSION_RUNMODE=NORMAL",
                                          "SET_PROP_SESSION_BAUDRATE=250000",
                                          "SET_PROP_SESSION_APPLICATION_PROTOCOL=1",
                                          "SET_PROP_SESSION_NODE_NAME=9223372036854780468",
                                          "SET_PROP_SESSION_NODE_ADDRESS=128",
                                          "SET_PROP_TX_TIME_DATA=100"};
  Host host;
  ASSERT_EQ(host.Start(j1939), "");
  Host rival;  // another session of the interface cannot take the address
  for (size_t i = 0; i + 1 < j1939.size(); ++i) rival.Command(j1939[i]);
  EXPECT_EQ(rival.Command("CMD_SESSION_START"), "<ERROR: -1074384374>\n");

  // A broadcast transfer of 100 bytes (PGN 0x12300) from node 0x20 elsewhere on the bus.
  std::string bam = "cansend vcan1 18ECFF20#2064000FFF002301";
  for (int packet = 1; packet <= 15; ++packet) {
    char frame[64];
    std::snprintf(frame, sizeof frame, "; cansend vcan1 18EBFF20#%02X%s", packet,
                  packet < 15 ? "4A4A4A4A4A4A4A" : "4A4AFFFFFFFFFF");
    bam += frame;
  }
  ASSERT_EQ(Shell(bam), 0);
  const uint32_t transfer = 0x1923FF20 | kExtended;  // priority 6, PGN 0x12300 to all, from 0x20
  EXPECT_TRUE(host.WaitFor([&] { return host.records.count(transfer) > 0; }));
  EXPECT_EQ(host.records[transfer].type, kTypeJ1939);
  EXPECT_EQ(host.records[transfer].payload, std::vector<uint8_t>(100, 'J'));
  const std::string text = candump.Stop();
  EXPECT_NE(text.find(" vcan1 18EEFF80#3412000000000080\n"), std::string::npos) << text;
}

TEST(SocketCanTest, ErrorFramesBecomeBusErrorFramesAndBusState) {
  Host host;
  ASSERT_EQ(host.Start({"SET_PROP_SESSION_PORTNAME=CAN7", "SET_PROP_SESSION_LOG_BUS_ERROR_FRAMES=1",
                        "SET_PROP_TX_TIME_DATA=100"}),
            "");
  ASSERT_EQ(Shell("cansend vcan0 20000004#0004000000000000"), 0);  // controller: receive warning
  EXPECT_TRUE(host.WaitFor([&] { return host.records.count(0x004) > 0; }));
  EXPECT_EQ(host.records[0x004].type, kTypeBusError);
  EXPECT_EQ(host.records[0x004].payload[1], 0x04);
  ASSERT_EQ(Shell("cansend vcan0 20000040#0000000000000000"), 0);  // bus off
  EXPECT_TRUE(
      host.WaitFor([&] { return host.statistics && host.statistics->stateBits0to3 == kBusOff; }));
  ASSERT_EQ(Shell("cansend vcan0 20000100#0000000000000000"), 0);  // restarted
  EXPECT_TRUE(host.WaitFor([&] { return host.statistics && host.statistics->stateBits0to3 == 0; }));
}

TEST(SocketCanTest, ADeviceThatGoesAwayIsALostBusUntilItIsBack) {
  Host host;
  ASSERT_EQ(host.Start({"SET_PROP_SESSION_PORTNAME=CAN8", "SET_PROP_TX_TIME_DATA=100"}), "");
  const auto resumes = [&](const std::string& data) {
    return WaitFor([&] {
      Shell("cansend vcan1 100#" + data);
      return host.WaitFor(
          [&] {
            auto it = host.records.find(0x100);
            return it != host.records.end() &&
                   it->second.payload ==
                       std::vector<uint8_t>{static_cast<uint8_t>(std::stoi(data, nullptr, 16))};
          },
          500ms);
    });
  };
  const auto busState = [&](uint32_t state) {
    return host.WaitFor([&] { return host.statistics && host.statistics->stateBits0to3 == state; });
  };
  EXPECT_TRUE(resumes("01"));
  Shell("ip link set vcan1 down");
  EXPECT_TRUE(busState(kBusOff));
  Shell("ip link set vcan1 up");
  EXPECT_TRUE(resumes("02"));
  EXPECT_TRUE(busState(0));
  Shell("ip link del vcan1");  // unplugged
  EXPECT_TRUE(busState(kBusOff));
  Shell("ip link add dev vcan1 type vcan && ip link set vcan1 mtu 16 up");
  EXPECT_TRUE(resumes("03"));
  EXPECT_TRUE(busState(0));
}

TEST(SocketCanTest, NormalModeSetsTheBitRateOfACanController) {
  Background adapter(std::string("exec ") + KV_SLCAN_ON_PTY + " /tmp/slcan.tty");
  ASSERT_TRUE(WaitFor([] { return Shell("ip link show slcan0 > /dev/null 2>&1") == 0; }));
  Host host;
  ASSERT_EQ(host.Start({"SET_PROP_SESSION_PORTNAME=CAN9", "SET_PROP_SESSION_RUNMODE=NORMAL",
                        "SET_PROP_SESSION_BAUDRATE=250000"}),
            "");
  Shell("ip -d link show slcan0 > /tmp/slcan.link");
  EXPECT_NE(ReadFile("/tmp/slcan.link").find("bitrate 250000"), std::string::npos)
      << ReadFile("/tmp/slcan.link");
  EXPECT_NE(ReadFile("/tmp/slcan.link").find(",UP,"), std::string::npos);
  EXPECT_TRUE(WaitFor([] { return ReadFile("/tmp/slcan.tty").find("S5\r") != std::string::npos; }))
      << "the adapter was not told 250 kbit/s";
}

}  // namespace
}  // namespace kvtest

namespace {

// One controller for the whole program: it listens only 10 s after its start.
class ControllerEnvironment : public ::testing::Environment {
 public:
  void SetUp() override {
    std::string error;
    ASSERT_TRUE(controller_.Start(error)) << error;
  }
  void TearDown() override { controller_.Stop(); }

 private:
  kvtest::UmlController controller_;
};

}  // namespace

int main(int argc, char** argv) {
  ::testing::InitGoogleTest(&argc, argv);
  ::testing::AddGlobalTestEnvironment(new ControllerEnvironment);
  return RUN_ALL_TESTS();
}
