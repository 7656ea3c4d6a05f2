// kvmon as a child process against a service on the simulated hardware: JSON and text lines of the
// default traffic, the live table on a pseudo-terminal, the hardware table, transmit, and the
// controller's refusals in plain words.
#include <netinet/in.h>
#include <signal.h>
#include <sys/socket.h>
#include <unistd.h>

#include <cstring>
#include <map>
#include <nlohmann/json.hpp>
#include <set>
#include <string>
#include <vector>

#include "tests/kvmon/KvmonProcess.h"
#include "tests/support/ServiceFixture.h"

namespace kvtest {
namespace {

using nlohmann::json;

constexpr auto kToolDeadline = 60s;  // a loaded machine runs the child slowly

class KvmonSession : public ServiceFixture {
 protected:
  std::vector<std::string> Args(std::vector<std::string> args) const {
    args.insert(args.begin(), {"-c", "127.0.0.1:" + std::to_string(port()), "-w", "30"});
    return args;
  }
  KvmonProcess Start(const std::vector<std::string>& args) {
    auto process = KvmonProcess::WithPipes(KVMON_PATH, Args(args));
    EXPECT_TRUE(process.started());
    return process;
  }
  // Ctrl-C: the tool must end its session and exit 0.
  static void Interrupt(KvmonProcess& process) {
    process.Signal(SIGINT);
    EXPECT_EQ(process.WaitForExit(kToolDeadline), 0) << process.err();
  }
  void ExpectNoHostLeft() {
    EXPECT_TRUE(WaitUntil([&] { return service().statistics().connectionsOpen.load() == 0; }));
  }
};

// The complete JSON lines of `out`, each parsed (a line that is not JSON fails the test).
std::vector<json> JsonObjects(const std::string& out) {
  std::vector<json> objects;
  auto lines = SplitLines(out);
  if (!out.empty() && out.back() != '\n') lines.pop_back();  // still being written
  for (const auto& line : lines) {
    auto object = json::parse(line, nullptr, false);
    EXPECT_FALSE(object.is_discarded()) << line;
    if (!object.is_discarded()) objects.push_back(std::move(object));
  }
  return objects;
}

// The latest record of each "interface id/type" (FlexRay: "interface slot/channel").
std::map<std::string, json> LatestRecords(const std::string& out) {
  std::map<std::string, json> latest;
  for (const auto& object : JsonObjects(out)) {
    if (object["kind"] != "record") continue;
    const std::string second = object.contains("channel") ? object["channel"].get<std::string>()
                                                          : object["type"].get<std::string>();
    latest[object["interface"].get<std::string>() + " " +
           std::to_string(object["id"].get<uint32_t>()) + "/" + second] = object;
  }
  return latest;
}

bool SeenTwice(const std::map<std::string, json>& latest, const std::set<std::string>& keys) {
  for (const auto& key : keys) {
    auto found = latest.find(key);
    if (found == latest.end() || found->second["count"].get<uint32_t>() < 2) return false;
  }
  return true;
}

bool HasStatistics(const std::string& out) {
  for (const auto& object : JsonObjects(out)) {
    if (object["kind"] == "statistics") return true;
  }
  return false;
}

// Several interfaces go through one kvmon, each with a connection and session of its own; the
// default traffic itself is checked over TCP against the controller.
TEST_F(KvmonSession, JsonLinesShowTheRecordsOfEachInterface) {
  const std::set<std::string> keys = {
      "CAN1 256/data", "CAN1 416/data",   "CAN1 801/remote", "CAN1 419361024/data", "LIN2 16/data",
      "LIN2 17/data",  "LIN2 18/no-resp", "LIN2 19/data",    "FlexRay2 1/A",        "FlexRay2 1/B",
      "FlexRay2 2/A",  "FlexRay2 3/A",    "FlexRay2 40/B"};
  auto kvmon = Start({"--json", "-c", "localhost:" + std::to_string(port()), "--no-response",
                      "CAN1", "LIN2", "FlexRay2"});
  EXPECT_TRUE(kvmon.ReadUntil(
      [&](const std::string& out) {
        return SeenTwice(LatestRecords(out), keys) && HasStatistics(out);
      },
      kToolDeadline))
      << kvmon.out() << kvmon.err();
  const auto latest = LatestRecords(kvmon.out());
  EXPECT_EQ(latest.size(), keys.size());
  EXPECT_TRUE(latest.at("LIN2 16/data")["checksum"].is_number());
  EXPECT_EQ(latest.at("CAN1 419361024/data")["id_text"], "18FEF100");
  EXPECT_EQ(latest.at("FlexRay2 40/B")["id_text"], "slot 40 B");
  Interrupt(kvmon);
  ExpectNoHostLeft();
}

// A quiet bus sends no identifier table: its statistics periods count instead.
TEST_F(KvmonSession, TextLinesEndByThemselvesAfterTheAskedNumberOfReports) {
  auto kvmon = Start({"-n", "2", "CAN1"});
  ASSERT_EQ(kvmon.WaitForExit(kToolDeadline), 0) << kvmon.err();
  size_t counterLines = 0, statisticsLines = 0;
  for (const auto& line : SplitLines(kvmon.out())) {
    if (line.find(" CAN1 100 data [8] ") != std::string::npos) ++counterLines;
    if (line.find(" CAN1 statistics standard=") != std::string::npos) ++statisticsLines;
  }
  EXPECT_EQ(counterLines, 2u) << kvmon.out();
  EXPECT_GE(statisticsLines, 1u) << kvmon.out();
  auto quiet = Start({"-n", "1", "CAN3"});
  ASSERT_EQ(quiet.WaitForExit(kToolDeadline), 0) << quiet.err();
  EXPECT_NE(quiet.err().find("CAN3 reported no identifier"), std::string::npos) << quiet.err();
  ExpectNoHostLeft();
}

// The README's walk-through pasted into a script: kvmon returns once the controller closed the
// session, so kvlog at once finds a complete log that holds the frame of the last report.
TEST_F(KvmonSession, LogIsCompleteForKvlogWhenKvmonReturns) {
  auto kvmon = Start({"--json", "--log", "binary", "--log-name", "walk", "-n", "2", "CAN1"});
  ASSERT_EQ(kvmon.WaitForExit(kToolDeadline), 0) << kvmon.err();
  const uint64_t last = LatestRecords(kvmon.out()).at("CAN1 256/data")["raw_timestamp"];
  const std::string path = drive_.Native("QV-RT\\tarvix\\kelvane\\walk.zfl").string();
  auto kvlog = KvmonProcess::WithPipes(KVLOG_PATH, {"--bus", "can", "--candump", path});
  ASSERT_EQ(kvlog.WaitForExit(kToolDeadline), 0) << kvlog.err();
  EXPECT_EQ(kvlog.err(), "");  // no cut record
  EXPECT_GT(SplitLines(kvlog.out()).size(), 100u);
  const auto file = drive_.ReadFile("QV-RT\\tarvix\\kelvane\\walk.zfl");
  ASSERT_TRUE(file);
  bool found = false;
  for (size_t at = 12; at + 24 <= file->size() && !found; at += 24) {
    uint64_t stamp = 0;
    std::memcpy(&stamp, file->data() + at, sizeof stamp);
    found = stamp == last;
  }
  EXPECT_TRUE(found) << "the frame of the last report is missing from the log";
}

TEST_F(KvmonSession, TerminalShowsTheLiveTableAndCtrlCEndsTheSession) {
  auto kvmon = KvmonProcess::OnTerminal(KVMON_PATH, Args({"CAN1"}), 100, 30);
  ASSERT_TRUE(kvmon.started());
  const std::string highlighted = "\x1b[1;31m";  // the counter byte of 0x100 changes every report
  ASSERT_TRUE(kvmon.ReadUntil(
      [&](const std::string& out) {
        return out.find("18FEF100  data") != std::string::npos &&
               out.find("error active") != std::string::npos &&
               out.find(highlighted) != std::string::npos;
      },
      kToolDeadline))
      << kvmon.out();
  EXPECT_NE(kvmon.out().find("CAN1 on 127.0.0.1:"), std::string::npos);
  kvmon.Type("s");  // the next sort order: by count
  EXPECT_TRUE(kvmon.ReadUntil(
      [](const std::string& out) { return out.find("by count") != std::string::npos; },
      kToolDeadline));
  kvmon.Type("\x03");  // Ctrl-C typed on the terminal, which reads single keys
  EXPECT_EQ(kvmon.WaitForExit(kToolDeadline), 0) << kvmon.out();
  EXPECT_NE(kvmon.out().find("\x1b[?25h"), std::string::npos) << "the cursor is shown again";
  ExpectNoHostLeft();
}

// The interfaces themselves are checked over TCP; here: their table for people and as JSON.
TEST_F(KvmonSession, HardwareTableListsTheInterfacesForPeopleAndAsJson) {
  auto table = Start({"--hardware"});
  ASSERT_EQ(table.WaitForExit(kToolDeadline), 0) << table.err();
  const auto lines = SplitLines(table.out());
  ASSERT_EQ(lines.size(), 13u) << table.out();
  EXPECT_EQ(lines[5], "CAN3                 3  CAN      yes");
  EXPECT_EQ(lines[12], "FlexRay2             2  FlexRay  -");
  auto machine = Start({"--hardware", "--json"});
  ASSERT_EQ(machine.WaitForExit(kToolDeadline), 0) << machine.err();
  const auto objects = JsonObjects(machine.out());
  ASSERT_EQ(objects.size(), 10u);
  EXPECT_EQ(objects[5],
            json::parse(R"({"interface":"CAN6","port":6,"protocol":0,"bus":"CAN","can_fd":true})"));
}

TEST_F(KvmonSession, TransmitFrameDefinedWithTxIsSeenOnTheOtherInterfaceOfTheBus) {
  auto watcher = Start({"--json", "CAN4"});
  auto sender = Start({"--run-mode", "normal", "--baud", "500000", "--tx", "123#11223344",
                       "--tx-every", "20", "CAN3"});
  EXPECT_TRUE(watcher.ReadUntil(
      [](const std::string& out) {
        auto latest = LatestRecords(out);
        auto found = latest.find("CAN4 291/data");
        return found != latest.end() && found->second["data"] == "11223344" &&
               found->second["count"] >= 2;
      },
      kToolDeadline))
      << watcher.out() << watcher.err() << sender.err();
  // The sender lists its own frame, marked as sent by its interface.
  EXPECT_TRUE(sender.ReadUntil(
      [](const std::string& out) {
        return out.find(" CAN3 123 data [4] 11 22 33 44 count=") != std::string::npos &&
               out.find(" echo") != std::string::npos;
      },
      kToolDeadline))
      << sender.out() << sender.err();
  Interrupt(sender);
  EXPECT_NE(sender.err().find("CAN3 123#11223344 every 20 ms: "), std::string::npos)
      << sender.err();
  EXPECT_NE(sender.err().find(" sent"), std::string::npos) << sender.err();
  Interrupt(watcher);
  ExpectNoHostLeft();
}

struct RefusalCase {
  std::vector<std::string> args;
  int exitCode;
  std::string words;
};

TEST_F(KvmonSession, RefusalsOfTheControllerAreToldInPlainWords) {
  const RefusalCase cases[] = {
      {{"CAN9"}, 1, "could not open the session on CAN9: no such interface (status 0xBFF63040)"},
      {{"--alias", "SimDB", "--cluster", "Nope", "CAN1"}, 1, "no such cluster in the database"},
  };
  for (const auto& c : cases) {
    auto kvmon = Start(c.args);
    EXPECT_EQ(kvmon.WaitForExit(kToolDeadline), c.exitCode) << c.args.back();
    EXPECT_NE(kvmon.err().find(c.words), std::string::npos) << kvmon.err();
    EXPECT_EQ(kvmon.err().find("<ERROR"), std::string::npos) << kvmon.err();
  }
}

// A controller whose sockets hold little, so that a host that stops reading is soon too slow.
class KvmonSlowHost : public KvmonSession {
 protected:
  nKV_DLL300::ServiceOptions Options() override {
    nKV_DLL300::ServiceOptions options = KvmonSession::Options();
    options.socketSendBufferBytes = 4096;
    return options;
  }
};

// kvmon stops reading while nobody reads its output; the controller then skips its reports.
TEST_F(KvmonSlowHost, SkippedReportsAndAFullTableAreToldOnStandardError) {
  auto kvmon = Start({"--json", "--data-period", "1", "--table-size", "2", "CAN1"});
  EXPECT_TRUE(WaitUntil([&] { return service().statistics().snapshotsSkipped.load() > 0; }));
  EXPECT_TRUE(kvmon.ReadUntil(
      [&](const std::string&) {
        return kvmon.err().find("kvmon: host too slow: ") != std::string::npos;
      },
      kToolDeadline))
      << kvmon.err();
  EXPECT_NE(kvmon.err().find("kvmon: identifier table full (2): new identifiers are counted"),
            std::string::npos)
      << kvmon.err();
  Interrupt(kvmon);
  ExpectNoHostLeft();
}

uint16_t PortWithoutListener() {
  const int probe = socket(AF_INET, SOCK_STREAM, 0);
  sockaddr_in address{};
  address.sin_family = AF_INET;
  address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
  socklen_t size = sizeof address;
  bind(probe, reinterpret_cast<sockaddr*>(&address), sizeof address);
  getsockname(probe, reinterpret_cast<sockaddr*>(&address), &size);
  close(probe);
  return ntohs(address.sin_port);
}

TEST_F(KvmonSession, MissingControllerIsReportedAfterTheWait) {
  auto kvmon = KvmonProcess::WithPipes(
      KVMON_PATH,
      {"-c", "127.0.0.1:" + std::to_string(PortWithoutListener()), "-w", "0.5", "CAN1"});
  EXPECT_EQ(kvmon.WaitForExit(kToolDeadline), 1);
  EXPECT_NE(kvmon.err().find("cannot connect to the controller"), std::string::npos) << kvmon.err();
  EXPECT_NE(kvmon.err().find("is it running?"), std::string::npos) << kvmon.err();
  // A name that does not resolve is no controller that is not running.
  auto unnamed = KvmonProcess::WithPipes(KVMON_PATH, {"-c", "no-such-host.invalid", "CAN1"});
  EXPECT_EQ(unnamed.WaitForExit(kToolDeadline), 1);
  EXPECT_NE(unnamed.err().find("cannot resolve 'no-such-host.invalid'"), std::string::npos)
      << unnamed.err();
  EXPECT_EQ(unnamed.err().find("is it running?"), std::string::npos) << unnamed.err();
}

}  // namespace
}  // namespace kvtest
