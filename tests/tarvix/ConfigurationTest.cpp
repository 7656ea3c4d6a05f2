// TARVIX_SIM_CONFIG descriptions: errors leave no hardware, replay of candump logs, bus captures;
// the short form of TARVIX_SOCKETCAN.
#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>

#include "driver/FrameTypes.h"
#include "driver/Properties.h"
#include "tarvix/socketcan/DeviceBinding.h"
#include "tests/tarvix/TarvixTestSupport.h"

namespace tarvix::test {
namespace {

class ConfigurationTest : public TarvixTest {
 protected:
  void SetUp() override {
    TarvixTest::SetUp();
    dir_ = std::filesystem::temp_directory_path() /
           ("tarvix-config-" + std::to_string(::testing::UnitTest::GetInstance()->random_seed()) +
            "-" + ::testing::UnitTest::GetInstance()->current_test_info()->name());
    std::filesystem::create_directories(dir_);
  }
  void TearDown() override {
    TarvixTest::TearDown();
    std::filesystem::remove_all(dir_);
  }
  void Write(const std::string& name, const std::string& text) {
    std::ofstream(dir_ / name) << text;
  }
  std::filesystem::path dir_;
};

TEST_F(ConfigurationTest, BrokenDescriptionsGiveAClearErrorAndNoHardware) {
  const std::pair<const char*, const char*> cases[] = {
      {"{", "not valid JSON"},
      {"[]", "expected a JSON object"},
      {R"({"buses":[{"name":"b","bitRate":"fast"}]})", "buses[0].bitRate"},
      {R"({"buses":[{"name":"b","traffic":[{"id":"0x900"}]}]})", "buses[0].traffic[0].id"},
      {R"({"buses":[{"name":"b","traffic":[{"payload":"zz"}]}]})", "bad payload token"},
      {R"({"buses":[{"name":"b"}],"devices":[{"name":"D","interfaces":[{"name":"CAN1","bus":"x"}]}]})",
       "unknown bus"},
      {R"({"buses":[{"name":"b","replay":[{"file":"missing.log"}]}]})", "cannot read candump log"},
      {R"({"faults":[{"operation":"kxStart"}]})", "\"status\" is missing"},
      {R"({"buses":[{"name":"b"}],"devices":[{"name":"D","interfaces":[{"name":"CAN7","bus":"b","device":"can0"}]}]})",
       "a bus or a device, not both"},
      {R"({"devices":[{"name":"D","interfaces":[{"name":"CAN7","device":"../can0"}]}]})",
       "interfaces[0].device: not a network device name"},
  };
  for (const auto& [json, message] : cases) {
    std::string error;
    EXPECT_FALSE(LoadConfiguration(json, dir_.string(), &error)) << json;
    EXPECT_NE(error.find(message), std::string::npos) << json << " gave: " << error;
    EXPECT_EQ(FirstDevice(), 0u) << json;
    kxRef s = 0;
    EXPECT_EQ(kxCreateSession(":can:", "", "", "CAN1", 6, &s), driver::kInterfaceNotFound);
  }
}

TEST_F(ConfigurationTest, ReplayCarriesEveryFrameKindOfALog) {
  Write("in.log",
        "(1700000000.000000) can0 123#11223344\n"
        "(1700000000.001000) can0 18FEF100#0011223344556677\n"
        "(1700000000.002000) can0 321#R\n"
        "(1700000000.003000) can0 200##1000102030405060708090A0B\n"
        "(1700000000.004000) can0 201##0A0A1\n"
        "(1700000000.005000) can0 20000080#0000000000000000\n"
        "(1700000000.006000) can1 7FF#FF\n");
  Load(R"({"buses":[{"name":"r","dataBitRate":2000000,
      "replay":[{"file":"in.log","logInterface":"can0","loop":true}]}],
      "devices":[{"name":"D","interfaces":[{"name":"CAN1","bus":"r","canFd":true}]}]})",
       dir_.string());
  const kxRef s = Open(driver::kDatabaseSubordinate, "CAN1");
  ASSERT_EQ(kxSetProperty(s, driver::kPropBusErrorFrames, 2, kErrorsOn), 0);
  // The log loops; the session may join mid-round, so one whole round is looked for.
  const auto all = ReadUntil(s, [](const auto& f) { return f.size() >= 12; });
  ASSERT_GE(all.size(), 12u);
  size_t first = 0;
  while (all[first].identifier != 0x123) ++first;
  const std::vector<Frame> frames(all.begin() + first, all.begin() + first + 6);
  EXPECT_EQ(all[first + 6].identifier, 0x123u) << "can1's line is not replayed";
  EXPECT_EQ(frames[0].identifier, 0x123u);
  EXPECT_EQ(frames[0].payload, (std::vector<uint8_t>{0x11, 0x22, 0x33, 0x44}));
  EXPECT_EQ(frames[1].identifier, 0x18FEF100u | driver::kExtendedIdFlag);
  EXPECT_EQ(frames[2].type, driver::kFrameCanRemote);
  EXPECT_EQ(frames[3].type, driver::kFrameCanFdBrsData);
  EXPECT_EQ(frames[3].length, 12u);
  EXPECT_EQ(frames[4].type, driver::kFrameCanFdData);
  EXPECT_EQ(frames[4].payload, (std::vector<uint8_t>{0xA0, 0xA1}));
  EXPECT_EQ(frames[5].type, driver::kFrameCanBusError);
  // 1 ms apart in the log: the second ends 1 ms plus the difference of their bus times later.
  EXPECT_GE(frames[1].timestamp - frames[0].timestamp, 10000u);
  EXPECT_LT(frames[1].timestamp - frames[0].timestamp, 10000u + 3000u);
}

TEST_F(ConfigurationTest, CaptureFileHoldsEveryFrameTheBusCarried) {
  Load(R"({"buses":[{"name":"cap","capture":"cap.log","traffic":[
      {"id":"0x010","length":2,"periodMs":1,"payload":"ctr AB"},
      {"id":"0x1F","extended":true,"kind":"remote","periodMs":5}]}],
      "devices":[{"name":"D","interfaces":[{"name":"CAN1","bus":"cap"}]}]})",
       dir_.string());
  const kxRef s = Open(driver::kDatabaseSubordinate, "CAN1");
  const auto frames = ReadUntil(s, [](const auto& f) { return f.size() >= 20; });
  ASSERT_EQ(kxClear(s), 0);
  ResetToDefaults();  // closes the capture file
  std::ifstream in(dir_ / "cap.log");
  std::vector<std::string> logged;
  for (std::string line; std::getline(in, line);) logged.push_back(line);
  ASSERT_GE(logged.size(), frames.size());
  bool remote = false;
  bool data = false;
  for (const std::string& l : logged) {
    remote |= l.find(" cap 0000001F#R") != std::string::npos;
    data |= l.find(" cap 010#00AB") != std::string::npos;
    EXPECT_EQ(l.front(), '(') << l;
  }
  EXPECT_TRUE(remote);
  EXPECT_TRUE(data);
}

// "NAME=DEVICE:PORT" of each interface of a device, blank-separated.
std::string Describe(const DeviceConfig& device) {
  std::string text;
  for (const InterfaceConfig& i : device.interfaces) {
    text += (text.empty() ? "" : " ") + i.name + "=" + i.device + ":" + std::to_string(i.port);
  }
  return text;
}

TEST(SocketCanShortFormTest, ListedDevicesJoinTheHardwareAsNumberedCanInterfaces) {
  const std::pair<const char*, const char*> cases[] = {
      {"vcan0", "CAN7=vcan0:7"},
      {"can0, can1", "CAN7=can0:7 CAN8=can1:8"},
      {"CAN20=can0 can1", "CAN20=can0:20 CAN21=can1:21"},
      {"Bench=can0,can1", "Bench=can0:7 CAN8=can1:8"},
      {"CAN1=can0", "interface \"CAN1\" is listed twice"},
      {"can/0", "\"can/0\": not a network device name"},
      {"=can0", "\"\": an interface name has 1 to 15 characters, no '@'"},
  };
  for (const auto& [list, expected] : cases) {
    HardwareConfig config = DefaultHardware();
    std::string error;
    const bool added = AddShortFormDevices(list, config, error);
    const std::string got = added ? Describe(config.devices.back()) : error;
    EXPECT_EQ(got, expected) << list;
    EXPECT_EQ(config.devices.back().name, added ? "SocketCAN" : "SIM-FR") << list;
  }
}

}  // namespace
}  // namespace tarvix::test
