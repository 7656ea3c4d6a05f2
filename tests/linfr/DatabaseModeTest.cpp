// Opening LIN and FlexRay sessions in-process: the database mode writes its baud rate back.
#include <gtest/gtest.h>

#include <functional>
#include <string>

#include "bus/CFlexRay.h"
#include "bus/CLIN.h"
#include "service/HostConnection.h"
#include "tarvix/TarvixControl.h"

namespace nKV_DLL300 {
namespace {

constexpr uint64_t kHostBaudRate = 9600;

struct DatabaseCase {
  const char* name;
  const char* cluster;
  uint64_t clusterBaudRate;
  // Creates the session on the connection and opens it on the interface.
  std::function<int32_t(HostConnection&)> open;
};
void PrintTo(const DatabaseCase& c, std::ostream* os) { *os << c.name; }

class DatabaseModeTest : public ::testing::TestWithParam<DatabaseCase> {
 protected:
  void SetUp() override { tarvix::ResetToDefaults(); }
  void TearDown() override { tarvix::ResetToDefaults(); }

  // Without a socket every send fails quietly; only the settings are watched here.
  HostConnection connection{platform::net::kInvalidSocket, ConnectionSetup{}};
};

// The settings' baud rate afterwards is the cluster's: the log writers and the host's later
// sessions see the rate the bus really runs at, not the one the host guessed.
TEST_P(DatabaseModeTest, ClusterBaudRateReplacesTheHostsValue) {
  SessionSettings& settings = connection.settings;
  settings.runMode.Set("NORMAL");
  settings.alias.Set("SimDB");
  settings.cluster.Set(GetParam().cluster);
  settings.baudRate.store(kHostBaudRate);
  EXPECT_EQ(GetParam().open(connection), 0);
  EXPECT_EQ(settings.baudRate.load(), GetParam().clusterBaudRate);
}

INSTANTIATE_TEST_SUITE_P(
    Buses, DatabaseModeTest,
    ::testing::Values(
        DatabaseCase{"LIN", "LIN", 19200,
                     [](HostConnection& c) {
                       CLIN session(&c);
                       return session.openLinSession("LIN1@qv_corle_tarvix", kHostBaudRate);
                     }},
        DatabaseCase{"FlexRay", "FlexRay", 10000000,
                     [](HostConnection& c) {
                       CFlexRay session(&c);
                       return session.openFlexRaySession("FlexRay1@qv_corle_tarvix", 0);
                     }}),
    [](const auto& info) { return std::string(info.param.name); });

}  // namespace
}  // namespace nKV_DLL300
