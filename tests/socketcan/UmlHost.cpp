// Test support inside the user-mode kernel: controller, hosts, background programs, candump text.
#include "tests/socketcan/UmlHost.h"

#include <signal.h>
#include <spawn.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <thread>

extern char** environ;

namespace kvtest {
namespace {

constexpr uint16_t kPort = 13999;
constexpr auto kHeartbeatEvery = 2s;
// A heartbeat has no reply; the pause keeps the next command out of its TCP segment.
constexpr auto kPauseAfterHeartbeat = 300ms;
constexpr auto kControllerStart = 60s;  // the module listens 10 s after it is loaded
const char* const kDrive = "/tmp/kv-drive";

std::string Normalised(const std::string& token) {
  const size_t fd = token.find("##");
  if (fd == std::string::npos || fd + 2 >= token.size()) return token;
  const int flags = std::stoi(token.substr(fd + 2, 1), nullptr, 16);
  return token.substr(0, fd + 2) + ((flags & 1) ? "1" : "0") + token.substr(fd + 3);
}

}  // namespace

bool WaitFor(const std::function<bool()>& condition, std::chrono::milliseconds timeout) {
  const auto end = std::chrono::steady_clock::now() + timeout;
  while (!condition()) {
    if (std::chrono::steady_clock::now() >= end) return condition();
    std::this_thread::sleep_for(10ms);
  }
  return true;
}

int Shell(const std::string& command) {
  const int status = std::system(command.c_str());
  return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

bool UmlController::Start(std::string& error) {
  std::filesystem::remove_all(kDrive);
  std::filesystem::create_directories(std::string(kDrive) + "/QV-RT/tarvix/kelvane");
  std::ofstream(std::string(kDrive) + "/QV-RT/tarvix/kelvane/kelvanert.ini")
      << "PORT=" << kPort << "\n";
  setenv("KELVANERT_DRIVE_C", kDrive, 1);
  setenv("TARVIX_SOCKETCAN", "vcan0,vcan1,slcan0", 1);
  char program[] = KV_CONTROLLER_PATH;
  char* arguments[] = {program, nullptr};
  if (posix_spawn(&pid_, program, nullptr, nullptr, arguments, environ) != 0) {
    error = "cannot start " KV_CONTROLLER_PATH;
    return false;
  }
  kvhost::HostClient probe;
  if (WaitFor([&] { return probe.Connect("127.0.0.1", kPort); }, kControllerStart)) return true;
  error = "the controller did not listen";
  return false;
}

void UmlController::Stop() {
  if (pid_ <= 0) return;
  kill(pid_, SIGTERM);
  int status = 0;
  waitpid(pid_, &status, 0);
  pid_ = -1;
}

uint16_t UmlController::Port() { return kPort; }

std::string UmlController::ServiceFile(const std::string& name) {
  return std::string(kDrive) + "/QV-RT/tarvix/kelvane/" + name;
}

Host::Host() : heartbeatDue_(std::chrono::steady_clock::now() + kHeartbeatEvery) {
  if (!client_.Connect("127.0.0.1", UmlController::Port())) return;
  WaitFor([&] { return greeted_; });
}

void Host::heartbeatIfDue() {
  const auto now = std::chrono::steady_clock::now();
  if (now < heartbeatDue_) return;
  (void)client_.Send("CMD_HEARTBEAT");
  heartbeatSent_ = now;
  heartbeatDue_ = now + kHeartbeatEvery;
}

std::optional<kvhost::HostMessage> Host::receive(std::chrono::milliseconds timeout) {
  if (!replyAwaited_) heartbeatIfDue();
  auto message = client_.Receive(std::min<std::chrono::milliseconds>(timeout, 500ms));
  if (message) take(*message);
  return message;
}

void Host::take(const kvhost::HostMessage& m) {
  lastStatus = m.header.lastStatus;
  if (m.header.type == kvhost::kText && m.text() == "<Connected to Kelvane>\n") greeted_ = true;
  if (m.header.type == kvhost::kCanRecords) {
    if (auto decoded = kvhost::DecodeCanRecords(m.payload, m.header.idCount)) {
      for (auto& r : *decoded) records[r.identifier] = r;
    }
  } else if (m.header.type == kvhost::kStatistics) {
    statistics = kvhost::DecodeCanStatistics(m.payload);
  }
}

std::string Host::Command(const std::string& text) {
  heartbeatIfDue();
  std::this_thread::sleep_until(heartbeatSent_ + kPauseAfterHeartbeat);
  if (!client_.Send(text)) return "(not sent)";
  replyAwaited_ = true;
  const auto end = std::chrono::steady_clock::now() + kDeadline;
  std::string reply = "(no reply)";
  while (std::chrono::steady_clock::now() < end && !client_.closed()) {
    auto m = receive(kDeadline);
    const bool text =
        m && (m->header.type == kvhost::kText || m->header.type == kvhost::kErrorText);
    if (text && m->text() != "<Connected to Kelvane>\n") {
      reply = m->text();
      break;
    }
  }
  replyAwaited_ = false;
  return reply;
}

std::string Host::Start(const std::vector<std::string>& properties) {
  for (const std::string& p : properties) {
    const std::string reply = Command(p);
    if (reply.rfind("<ACK", 0) != 0) return p + " answered " + reply;
  }
  const std::string reply = Command("CMD_SESSION_START");
  return reply == "<ACK: CMD_SESSION_START>\n" ? "" : "CMD_SESSION_START answered " + reply;
}

bool Host::WaitFor(const std::function<bool()>& condition, std::chrono::milliseconds timeout) {
  const auto end = std::chrono::steady_clock::now() + timeout;
  while (!condition()) {
    if (std::chrono::steady_clock::now() >= end || client_.closed()) return condition();
    (void)receive(200ms);
  }
  return true;
}

Background::Background(const std::string& command) {
  const char* arguments[] = {"/bin/sh", "-c", command.c_str(), nullptr};
  if (posix_spawn(&pid_, "/bin/sh", nullptr, nullptr, const_cast<char**>(arguments), environ) != 0)
    pid_ = -1;
}

Background::~Background() { Stop(); }

void Background::Stop() {
  if (pid_ <= 0) return;
  kill(pid_, SIGINT);
  int status = 0;
  waitpid(pid_, &status, 0);
  pid_ = -1;
}

Capture::Capture(const std::string& device, const std::string& filters, const std::string& path)
    : path_(path),
      candump_("exec stdbuf -oL candump -L " + device +
               (filters.empty() ? "" : filters + ",7FF:7FF") + " > " + path) {
  WaitFor([&] {
    Shell("cansend " + device + " 7FF#4B56");
    return WaitFor([&] { return ReadFile(path_).find("7FF#4B56") != std::string::npos; }, 200ms);
  });
}

std::string Capture::Stop() {
  candump_.Stop();
  return ReadFile(path_);
}

bool Background::Ended(std::chrono::milliseconds timeout) {
  int status = 0;
  rusage usage{};
  const bool ended =
      WaitFor([&] { return pid_ <= 0 || wait4(pid_, &status, WNOHANG, &usage) == pid_; }, timeout);
  if (ended && pid_ > 0) {
    cpuSeconds_ = static_cast<double>(usage.ru_utime.tv_sec + usage.ru_stime.tv_sec) +
                  static_cast<double>(usage.ru_utime.tv_usec + usage.ru_stime.tv_usec) / 1e6;
    exitStatus_ = WIFEXITED(status) ? WEXITSTATUS(status) : -1;
  }
  if (ended) pid_ = -1;
  return ended;
}

double CpuSeconds(pid_t pid) {
  std::istringstream stat(ReadFile("/proc/" + std::to_string(pid) + "/stat"));
  std::string field;
  double ticks = 0;
  for (int i = 1; i <= 15 && stat >> field; ++i) {
    if (i == 14 || i == 15) ticks += std::stod(field);  // utime, stime (the name has no blank)
  }
  return ticks / static_cast<double>(sysconf(_SC_CLK_TCK));
}

std::vector<LoggedFrame> ReadCandumpText(const std::string& text) {
  std::vector<LoggedFrame> frames;
  std::istringstream lines(text);
  std::string time, interfaceName, token;
  while (lines >> time >> interfaceName >> token) {
    std::string rest;
    std::getline(lines, rest);
    if (time.size() < 3 || time.front() != '(' || token.find('#') == std::string::npos) continue;
    LoggedFrame f;
    f.time = time.substr(1, time.size() - 2);
    f.frame = Normalised(token);
    const std::string id = token.substr(0, token.find('#'));
    f.id = static_cast<uint32_t>(std::stoul(id, nullptr, 16)) | (id.size() == 8 ? 0x20000000 : 0);
    frames.push_back(f);
  }
  return frames;
}

std::string ReadFile(const std::string& path) {
  std::ifstream in(path);
  std::ostringstream text;
  text << in.rdbuf();
  return text.str();
}

}  // namespace kvtest
