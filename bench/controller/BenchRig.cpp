// The controller benchmark's rig: hardware description, process, hosts and the log comparison.
#include "bench/controller/BenchRig.h"

#include <arpa/inet.h>
#include <netinet/in.h>
#include <signal.h>
#include <spawn.h>
#include <sys/socket.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cctype>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <unordered_map>

extern char** environ;

namespace kvbench {
namespace {

using namespace std::chrono_literals;

constexpr int kIdentifiersPerBus = 2000;
constexpr auto kHeartbeatEvery = 2s;
constexpr const char* kReplayFile = "saturated-replay.log";
constexpr int32_t kReceiveQueueOverflow = 0x3FF63050;
constexpr size_t kSearchAhead =
    100000;  // frames a log may lack in a row before it counts as no match

std::string ReadFile(const std::string& path) {
  std::ifstream in(path, std::ios::binary);
  std::ostringstream text;
  text << in.rdbuf();
  return text.str();
}

// One replay of 2000 frames that are all due at once: the bus carries them back to back, and the
// replay starts over as soon as it is through. A single source keeps the simulated arbitration
// cheap; 2000 periodic sources would make the driver scan them all for every frame.
std::string SaturatedCanBus(int index) {
  return "{\"name\":\"sat" + std::to_string(index) + "\",\"bitRate\":1000000,\"capture\":\"sat" +
         std::to_string(index) + ".log\",\"replay\":[{\"file\":\"" + kReplayFile +
         "\",\"loop\":true}]}";
}

std::string FlexRayBus() {
  std::string bus =
      "{\"name\":\"fr\",\"protocol\":\"FlexRay\",\"bitRate\":10000000,\"cycleMs\":5,"
      "\"slotUs\":50,\"slots\":[";
  for (int slot = 1; slot <= kFlexRaySlots; ++slot) {
    const bool sync = slot <= 2;
    char entry[160];
    std::snprintf(entry, sizeof entry,
                  "%s{\"slot\":%d,\"channels\":\"A\",\"startup\":%s,\"sync\":%s,\"length\":32,"
                  "\"payload\":\"ctr ramp:%02X\"}",
                  slot == 1 ? "" : ",", slot, sync ? "true" : "false", sync ? "true" : "false",
                  slot);
    bus += entry;
  }
  return bus + "]}";
}

std::string Interface(const std::string& name, const std::string& bus, int port, bool fd) {
  return "{\"name\":\"" + name + "\",\"bus\":\"" + bus + "\",\"port\":" + std::to_string(port) +
         (fd ? ",\"canFd\":true}" : "}");
}

std::string Upper(std::string text) {
  for (char& c : text) c = static_cast<char>(std::toupper(static_cast<unsigned char>(c)));
  return text;
}

// Identifier, payload and millisecond of the day of one CAN frame.
struct FrameKey {
  std::string frame;  // "ID#DATA", upper-case hex
  uint32_t ms = 0;
  bool operator==(const FrameKey& o) const { return ms == o.ms && frame == o.frame; }
};

std::vector<FrameKey> CaptureFrames(const std::string& path) {
  std::vector<FrameKey> frames;
  std::istringstream lines(ReadFile(path));
  std::string line;
  while (std::getline(lines, line)) {
    unsigned long long seconds = 0;
    unsigned micros = 0;
    char bus[32];
    char token[300];
    if (std::sscanf(line.c_str(), "(%llu.%u) %31s %299s", &seconds, &micros, bus, token) != 4)
      continue;
    std::string text = token;
    const size_t hash = text.find('#');
    std::string data = text.substr(hash + 1);
    if (!data.empty() && data[0] == '#') data = data.substr(2);  // FD: "##" and the flags
    const unsigned long id = std::stoul(text.substr(0, hash), nullptr, 16);
    char key[16];
    std::snprintf(key, sizeof key, "%lX#", id);
    frames.push_back({key + data, static_cast<uint32_t>((seconds % 86400) * 1000 + micros / 1000)});
  }
  return frames;
}

std::vector<FrameKey> CanLogFrames(const std::string& path) {
  std::vector<FrameKey> frames;
  std::istringstream lines(ReadFile(path));
  std::string line;
  std::getline(lines, line);  // the header
  while (std::getline(lines, line)) {
    unsigned h = 0, m = 0, s = 0, ms = 0;
    if (std::sscanf(line.c_str(), "%u:%u:%u,%u", &h, &m, &s, &ms) != 4) continue;
    // "hh:mm:ss,mmm\tID\tPAYLOAD\t...": the payload cell is "xx  " per byte.
    const size_t idStart = line.find('\t');
    const size_t payloadStart = line.find('\t', idStart + 1);
    if (payloadStart == std::string::npos) continue;
    std::string frame = Upper(line.substr(idStart + 1, payloadStart - idStart - 1)) + "#";
    for (size_t i = payloadStart + 1; i + 1 < line.size() && line[i] != '\t'; i += 4) {
      frame += Upper(line.substr(i, 2));
    }
    frames.push_back({frame, ((h * 60 + m) * 60 + s) * 1000 + ms});
  }
  return frames;
}

}  // namespace

void WriteReplay(const std::string& directory) {
  std::ofstream replay(directory + "/" + kReplayFile);
  uint32_t noise = 12345;
  for (int id = 0; id < kIdentifiersPerBus; ++id) {
    char line[64];
    int used = std::snprintf(line, sizeof line, "(0.000000) can0 %03X#", id);
    for (int i = 0; i < id % 9; ++i) {
      noise = noise * 1103515245u + 12345u;
      used += std::snprintf(line + used, sizeof line - used, "%02X", (noise >> 16) & 0xFF);
    }
    replay << line << "\n";
  }
}

std::string HardwareJson(const Hardware& hardware) {
  std::string buses;
  std::string can;
  for (int i = 0; i < hardware.saturatedCan; ++i) {
    buses += (buses.empty() ? "" : ",") + SaturatedCanBus(i);
    can += (can.empty() ? "" : ",") +
           Interface("CAN" + std::to_string(i + 1), "sat" + std::to_string(i), i + 1, false);
  }
  if (hardware.canFd) {
    buses += (buses.empty() ? "" : ",") +
             std::string(
                 "{\"name\":\"satfd\",\"bitRate\":500000,\"dataBitRate\":2000000,"
                 "\"capture\":\"satfd.log\",\"traffic\":[{\"id\":256,\"kind\":\"fd_brs\","
                 "\"length\":64,\"periodMs\":0,\"payload\":\"ctr ramp:01\"}]}");
    can += (can.empty() ? "" : ",") + Interface("CAN7", "satfd", 7, true);
  }
  buses += (buses.empty() ? "" : ",") + std::string("{\"name\":\"quiet\",\"bitRate\":1000000}");
  for (int i = 0; i < hardware.quietSessions; ++i) {
    can +=
        (can.empty() ? "" : ",") + Interface("CAN" + std::to_string(8 + i), "quiet", 8 + i, false);
  }
  std::string devices = "{\"name\":\"SIM-CAN\",\"interfaces\":[" + can + "]}";
  if (hardware.flexRay) {
    buses += "," + FlexRayBus();
    devices +=
        ",{\"name\":\"SIM-FR\",\"interfaces\":[" + Interface("FlexRay1", "fr", 1, false) + "]}";
  }
  return "{\"buses\":[" + buses + "],\"devices\":[" + devices + "]}";
}

Workspace::Workspace() {
  char name[] = "/tmp/kv-bench-XXXXXX";
  path_ = mkdtemp(name);
  std::filesystem::create_directories(path_ + "/drive/QV-RT/tarvix/kelvane");
}

Workspace::~Workspace() {
  if (std::getenv("KV_BENCH_KEEP") != nullptr) {
    std::fprintf(stderr, "bench_controller: kept %s\n", path_.c_str());
    return;
  }
  std::error_code ignored;
  std::filesystem::remove_all(path_, ignored);
}

std::string Workspace::serviceFile(const std::string& name) const {
  return path_ + "/drive/QV-RT/tarvix/kelvane/" + name;
}

Controller::Controller(const Workspace& workspace, const Hardware& hardware)
    : port_(kvhost::FreeLoopbackPort()) {
  std::ofstream(workspace.serviceFile("kelvanert.ini")) << "PORT=" << port_ << "\n";
  const std::string config = workspace.path() + "/hardware.json";
  std::ofstream(config) << HardwareJson(hardware);
  WriteReplay(workspace.path());
  std::vector<std::string> variables{"KELVANERT_DRIVE_C=" + workspace.path() + "/drive",
                                     "TARVIX_SIM_CONFIG=" + config};
  for (char** e = environ; *e != nullptr; ++e) {
    const std::string v = *e;
    if (v.rfind("KELVANERT_DRIVE_C=", 0) != 0 && v.rfind("TARVIX_", 0) != 0) variables.push_back(v);
  }
  std::vector<char*> envp;
  for (std::string& v : variables) envp.push_back(v.data());
  envp.push_back(nullptr);
  char program[] = KV_CONTROLLER_PATH;
  char* arguments[] = {program, nullptr};
  if (posix_spawn(&pid_, program, nullptr, nullptr, arguments, envp.data()) != 0) return;
  const auto end = std::chrono::steady_clock::now() + 60s;
  while (!listening_ && std::chrono::steady_clock::now() < end) {
    kvhost::HostClient probe;
    listening_ = probe.Connect("127.0.0.1", port_);
    if (!listening_) std::this_thread::sleep_for(100ms);
  }
}

Controller::~Controller() {
  if (pid_ <= 0) return;
  kill(pid_, SIGTERM);
  int status = 0;
  waitpid(pid_, &status, 0);
}

double Controller::cpuSeconds() const {
  std::istringstream stat(ReadFile("/proc/" + std::to_string(pid_) + "/stat"));
  std::string field;
  double ticks = 0;
  for (int i = 1; i <= 15 && stat >> field; ++i) {
    if (i == 14 || i == 15) ticks += std::stod(field);  // utime, stime
  }
  return ticks / static_cast<double>(sysconf(_SC_CLK_TCK));
}

uint64_t Controller::residentKiB() const {
  std::istringstream status(ReadFile("/proc/" + std::to_string(pid_) + "/status"));
  std::string line;
  while (std::getline(status, line)) {
    if (line.rfind("VmRSS:", 0) == 0) return std::stoull(line.substr(6));
  }
  return 0;
}

Host::Host(uint16_t port, std::string interfaceName, std::string logName)
    : port_(port), interfaceName_(std::move(interfaceName)), logName_(std::move(logName)) {}

Host::~Host() { terminate(); }

std::string Host::start() {
  if (!client_.Connect("127.0.0.1", port_)) return "no connection: " + client_.error();
  const std::vector<std::string> commands{"SET_PROP_SESSION_PORTNAME=" + interfaceName_,
                                          "SET_PROP_SESSION_RUNMODE=SUBORDINATE",
                                          "SET_PROP_LOGFILE=1",
                                          "SET_PROP_LOGFILE_TYPE=0",
                                          "SET_PROP_LOGFILE_NAME=" + logName_,
                                          "CMD_SESSION_START"};
  for (const std::string& command : commands) {
    if (!client_.Send(command)) return command + " not sent";
    for (;;) {
      auto reply = client_.Receive(30s);
      if (!reply) return command + ": no reply";
      if (reply->header.type != 3 && reply->header.type != 5) continue;
      const std::string text = reply->text();
      if (text == "<Connected to Kelvane>\n") continue;
      if (text.rfind("<ACK", 0) != 0) return command + " answered " + text;
      break;
    }
  }
  running_ = true;
  receiver_ = std::thread([this] { receiveLoop(); });
  return "";
}

void Host::receiveLoop() {
  auto heartbeat = std::chrono::steady_clock::now() + kHeartbeatEvery;
  std::chrono::steady_clock::time_point lastStatistics{};
  while (running_.load()) {
    if (std::chrono::steady_clock::now() >= heartbeat) {
      (void)client_.Send("CMD_HEARTBEAT");
      heartbeat = std::chrono::steady_clock::now() + kHeartbeatEvery;
    }
    auto m = client_.Receive(100ms);
    if (!m) continue;
    ++messages_;
    if (m->header.lastStatus == kReceiveQueueOverflow) ++overflows_;
    if (m->header.type != 6) continue;
    const auto now = std::chrono::steady_clock::now();
    if (lastStatistics != std::chrono::steady_clock::time_point{}) {
      const auto gap =
          std::chrono::duration_cast<std::chrono::milliseconds>(now - lastStatistics).count();
      if (static_cast<uint64_t>(gap) > longestGapMs_.load()) longestGapMs_ = gap;
    }
    lastStatistics = now;
  }
}

void Host::terminate() {
  if (!running_.exchange(false)) return;
  receiver_.join();
  (void)client_.Send("CMD_SESSION_TERMINATE");
  (void)client_.WaitForClose(30s);
}

uint64_t CountLogFrames(const std::string& path) {
  const std::string text = ReadFile(path);
  uint64_t lines = 0;
  for (char c : text) lines += c == '\n';
  return lines > 0 ? lines - 1 : 0;
}

uint64_t LostCanFrames(const std::string& logPath, const std::string& capturePath,
                       uint64_t& unmatched) {
  const std::vector<FrameKey> capture = CaptureFrames(capturePath);
  const std::vector<FrameKey> log = CanLogFrames(logPath);
  unmatched = 0;
  uint64_t lost = 0;
  size_t next = 0;  // capture index after the last matched frame
  bool anchored = false;
  for (const FrameKey& frame : log) {
    // The first frame may lie anywhere after the bus started; later ones follow closely.
    const size_t end = anchored ? std::min(capture.size(), next + kSearchAhead) : capture.size();
    size_t at = next;
    while (at < end && !(capture[at] == frame)) ++at;
    if (at == end) {
      ++unmatched;
      continue;
    }
    if (anchored) lost += at - next;
    anchored = true;
    next = at + 1;
  }
  return lost;
}

uint64_t LostFlexRayFrames(const std::string& logPath) {
  std::istringstream lines(ReadFile(logPath));
  std::string line;
  std::getline(lines, line);
  constexpr int64_t kRound = 64 * kFlexRaySlots;  // cycles 0-63
  int64_t previous = -1;
  uint64_t lost = 0;
  while (std::getline(lines, line)) {
    unsigned slot = 0, length = 0, cycle = 0;
    const size_t payloadEnd = line.find('\t', line.find('\t', 13) + 1);
    if (payloadEnd == std::string::npos || std::sscanf(line.c_str() + 13, "%x", &slot) != 1 ||
        std::sscanf(line.c_str() + payloadEnd, "\t%u\t%u", &length, &cycle) != 2)
      continue;
    const int64_t index = static_cast<int64_t>(cycle) * kFlexRaySlots + (slot - 1);
    if (previous >= 0) lost += static_cast<uint64_t>((index - previous - 1 + kRound) % kRound);
    previous = index;
  }
  return lost;
}

}  // namespace kvbench
