// The receive path of a bound interface on vcan0 inside user-mode Linux: the controller's CPU time
// per frame with text logging on, and the frames per second it takes without loss, next to candump
// writing the same frames to a file in the same run. cangen sends at its highest rate (-g 0) from
// 1, 2, 4 or 8 processes at once, 20000 frames each; all of them share the user-mode kernel's one
// CPU, so the rate rises only as far as that CPU takes it. A load without loss shows lost=0.
#include <benchmark/benchmark.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <memory>
#include <string>
#include <vector>

#include "tests/socketcan/UmlHost.h"

namespace {

using kvtest::Background;
using kvtest::Host;
using kvtest::Shell;

constexpr int kFramesPerSender = 20000;
constexpr uint32_t kFirstId = 0x100;

// Frames of the burst the session has counted.
uint64_t Counted(const Host& host, int senders) {
  uint64_t total = 0;
  for (int i = 0; i < senders; ++i) {
    auto it = host.records.find(kFirstId + static_cast<uint32_t>(i));
    if (it != host.records.end()) total += it->second.count;
  }
  return total;
}

// Frames of the burst in candump's log.
uint64_t Logged(const std::string& path, int senders) {
  uint64_t total = 0;
  for (const auto& f : kvtest::ReadCandumpText(kvtest::ReadFile(path))) {
    total += f.id >= kFirstId && f.id < kFirstId + static_cast<uint32_t>(senders);
  }
  return total;
}

void Fail(benchmark::State& state, const std::string& why) { state.SkipWithError(why.c_str()); }

void BM_ReceivePathOnVcan(benchmark::State& state, kvtest::UmlController* controller) {
  const int senders = static_cast<int>(state.range(0));
  const uint64_t frames = static_cast<uint64_t>(senders) * kFramesPerSender;
  for (auto _ : state) {
    Shell("rm -f /tmp/candump-*.log");
    Background candump("cd /tmp && exec candump -l -T 3000 -r 67108864 vcan0");
    Host host;
    const std::string refused =
        host.Start({"SET_PROP_SESSION_PORTNAME=CAN7", "SET_PROP_LOGFILE=1",
                    "SET_PROP_LOGFILE_TYPE=0", "SET_PROP_LOGFILE_NAME=bench"});
    if (!refused.empty()) return Fail(state, refused);
    // Both readers take frames before the measured burst begins.
    kvtest::WaitFor([&] {
      Shell("cansend vcan0 7FF#00");
      return host.WaitFor([&] { return host.records.count(0x7FF) > 0; }, std::chrono::seconds(1));
    });
    const double cpuBefore = kvtest::CpuSeconds(controller->pid());
    std::string burst;
    for (int i = 0; i < senders; ++i) {
      char line[96];
      std::snprintf(line, sizeof line, "cangen vcan0 -g 0 -n %d -I %X -L 8 -D i & ",
                    kFramesPerSender, kFirstId + i);
      burst += line;
    }
    const auto start = std::chrono::steady_clock::now();
    Background cangen(burst + "wait");  // the host keeps its heartbeat while it runs
    host.WaitFor([&] { return cangen.Ended(std::chrono::milliseconds(0)); },
                 std::chrono::minutes(5));
    const double seconds =
        std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
    host.WaitFor([&] { return Counted(host, senders) >= frames; });
    const double cpu = kvtest::CpuSeconds(controller->pid()) - cpuBefore;
    host.Command("CMD_SESSION_TERMINATE");
    candump.Ended(std::chrono::minutes(3));  // it may still work through its queue
    Shell("cat /tmp/candump-*.log > /tmp/candump.log");
    const uint64_t counted = Counted(host, senders);
    const uint64_t logged = Logged("/tmp/candump.log", senders);
    state.SetIterationTime(seconds);
    state.counters["sent_fps"] = static_cast<double>(frames) / seconds;
    state.counters["controller_us_per_frame"] =
        cpu * 1e6 / static_cast<double>(std::max<uint64_t>(1, counted));
    state.counters["controller_lost"] = static_cast<double>(frames - std::min(frames, counted));
    state.counters["candump_us_per_frame"] =
        candump.cpuSeconds() * 1e6 / static_cast<double>(std::max<uint64_t>(1, logged));
    state.counters["candump_lost"] = static_cast<double>(frames - std::min(frames, logged));
  }
}

}  // namespace

int main(int argc, char** argv) {
  struct stat vcan {};
  if (stat("/sys/class/net/vcan0", &vcan) != 0) {
    // Outside user-mode Linux: boot it and run this program there.
    std::vector<char*> args{const_cast<char*>(KV_UML_RUNNER), argv[0]};
    for (int i = 1; i < argc; ++i) args.push_back(argv[i]);
    args.push_back(nullptr);
    execv(args[0], args.data());
    std::perror(KV_UML_RUNNER);
    return 1;
  }
  kvtest::UmlController controller;
  std::string error;
  if (!controller.Start(error)) {
    std::fprintf(stderr, "bench_socketcan: %s\n", error.c_str());
    return 1;
  }
  benchmark::RegisterBenchmark("BM_ReceivePathOnVcan", BM_ReceivePathOnVcan, &controller)
      ->Arg(1)
      ->Arg(2)
      ->Arg(4)
      ->Arg(8)
      ->Iterations(1)
      ->UseManualTime()
      ->Unit(benchmark::kMillisecond);
  benchmark::Initialize(&argc, argv);
  benchmark::RunSpecifiedBenchmarks();
  controller.Stop();
  return 0;
}
