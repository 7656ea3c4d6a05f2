// Opening LIN and FlexRay sessions in-process: the database mode writes its baud rate back.
#include <gtest/gtest.h>

#include <functional>
#include <string>

#include "bus/CFlexRay.h"
#include "bus/CLIN.h"
#include "hostlink/HostConnection.h"
#include "tarvix/TarvixControl.h"

namespace nKV_DLL300 {
namespace {

constexpr uint64_t kHostBaudRate = 9600;

// The settings' baud rate afterwards is the cluster's: the log writers and the host's later
// sessions see the rate the bus really runs at, not the one the host guessed.
TEST(DatabaseModeTest, ClusterBaudRateReplacesTheHostsValue) {
  struct Case {
    const char* cluster;
    uint64_t clusterBaudRate;
    std::function<int32_t(HostConnection&)> open;  // creates the session and opens it
  };
  const Case cases[] = {
      {"LIN", 19200,
       [](HostConnection& c) {
         return CLIN(&c).openLinSession("LIN1@qv_corle_tarvix", kHostBaudRate);
       }},
      {"FlexRay", 10000000,
       [](HostConnection& c) {
         return CFlexRay(&c).openFlexRaySession("FlexRay1@qv_corle_tarvix", 0);
       }},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.cluster);
    tarvix::ResetToDefaults();
    {
      // Without a socket every send fails quietly; only the settings are watched here.
      HostConnection connection{platform::net::kInvalidSocket, ConnectionSetup{}};
      SessionSettings& settings = connection.settings;
      settings.runMode.set("NORMAL");
      settings.alias.set("SimDB");
      settings.cluster.set(c.cluster);
      settings.baudRate.store(kHostBaudRate);
      EXPECT_EQ(c.open(connection), 0);
      EXPECT_EQ(settings.baudRate.load(), c.clusterBaudRate);
    }
    tarvix::ResetToDefaults();
  }
}

}  // namespace
}  // namespace nKV_DLL300
