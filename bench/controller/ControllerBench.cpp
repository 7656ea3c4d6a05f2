// The controller process end to end on simulated buses, one host per bus with a text log:
//  - BM_SilentSessions: CPU of the whole process with eight sessions open on a silent bus, as a
//    share of one core ("core_pct"); "idle_core_pct" is the same process with the hosts connected
//    and no session.
//  - BM_SaturatedOneBus (quick) and BM_SaturatedBuses (six classic CAN buses at 1 Mbit/s with 2000
//    identifiers, one CAN FD bus with 64-byte frames, one FlexRay bus with every static slot):
//    whole-process CPU per frame ("us_per_frame"), frames per second, frames lost against the
//    capture files and the FlexRay slot sequence, receive-queue overflow warnings the hosts saw,
//    the longest gap between two statistics messages (sent every 1000 ms), resident memory.
//  - BM_DriverAlone: the simulated driver on the same saturated buses, read by plain receive
//    sessions in this process every 2 ms: its CPU per frame ("driver_us_per_frame"), the part of
//    the process's cost that is not the controller's own.
// Each case starts a controller of its own (it listens 10 s after its start).
#include <benchmark/benchmark.h>
#include <sys/resource.h>

#include <algorithm>
#include <chrono>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include "bench/controller/BenchRig.h"
#include "driver/RawFrame.h"
#include "driver/Sessions.h"
#include "driver/tarvix.h"
#include "tarvix/TarvixControl.h"

namespace {

using namespace std::chrono_literals;
using kvbench::Controller;
using kvbench::Hardware;
using kvbench::Host;
using kvbench::Workspace;

constexpr auto kSettle = 3s;  // after the starts, before the measured window
constexpr auto kSaturatedWindow = 8s;
constexpr auto kSilentWindow = 10s;

struct Rig {
  Workspace workspace;
  std::unique_ptr<Controller> controller;
  std::vector<std::unique_ptr<Host>> hosts;
};

void AddHost(Rig& rig, const std::string& interfaceName, const std::string& logName) {
  rig.hosts.push_back(std::make_unique<Host>(rig.controller->port(), interfaceName, logName));
}

// Starts the controller and every session; false (the state skipped) when something failed.
bool StartRig(benchmark::State& state, Rig& rig, const Hardware& hardware) {
  rig.controller = std::make_unique<Controller>(rig.workspace, hardware);
  if (!rig.controller->listening()) {
    state.SkipWithError("the controller did not listen");
    return false;
  }
  for (int i = 0; i < hardware.saturatedCan; ++i) {
    AddHost(rig, "CAN" + std::to_string(i + 1), "sat" + std::to_string(i));
  }
  if (hardware.canFd) AddHost(rig, "CAN7", "satfd");
  if (hardware.flexRay) AddHost(rig, "FlexRay1", "fr");
  for (int i = 0; i < hardware.quietSessions; ++i) {
    AddHost(rig, "CAN" + std::to_string(8 + i), "quiet" + std::to_string(i));
  }
  for (auto& host : rig.hosts) {
    const std::string failed = host->start();
    if (!failed.empty()) {
      state.SkipWithError(failed.c_str());
      return false;
    }
  }
  return true;
}

uint64_t LoggedFrames(const Rig& rig) {
  uint64_t frames = 0;
  for (const auto& host : rig.hosts) {
    frames += kvbench::CountLogFrames(rig.workspace.serviceFile(host->logName() + ".txt"));
  }
  return frames;
}

// Ends the sessions and compares each log with its bus.
void CountLosses(benchmark::State& state, Rig& rig) {
  uint64_t lost = 0, unmatched = 0, overflows = 0, gap = 0;
  for (auto& host : rig.hosts) {
    host->terminate();
    overflows += host->overflowWarnings();
    gap = std::max(gap, host->longestStatisticsGapMs());
    const std::string log = rig.workspace.serviceFile(host->logName() + ".txt");
    if (host->logName() == "fr") {
      lost += kvbench::LostFlexRayFrames(log);
    } else {
      uint64_t none = 0;
      lost +=
          kvbench::LostCanFrames(log, rig.workspace.path() + "/" + host->logName() + ".log", none);
      unmatched += none;
    }
  }
  state.counters["lost"] = static_cast<double>(lost);
  state.counters["unmatched"] = static_cast<double>(unmatched);
  state.counters["overflows"] = static_cast<double>(overflows);
  state.counters["stat_gap_ms"] = static_cast<double>(gap);
}

void RunSaturated(benchmark::State& state, const Hardware& hardware) {
  for (auto _ : state) {
    Rig rig;
    if (!StartRig(state, rig, hardware)) return;
    std::this_thread::sleep_for(kSettle);
    const uint64_t framesBefore = LoggedFrames(rig);
    const double cpuBefore = rig.controller->cpuSeconds();
    std::this_thread::sleep_for(kSaturatedWindow);
    const double cpu = rig.controller->cpuSeconds() - cpuBefore;
    const uint64_t frames = LoggedFrames(rig) - framesBefore;
    const double seconds = std::chrono::duration<double>(kSaturatedWindow).count();
    state.counters["us_per_frame"] = frames ? cpu * 1e6 / static_cast<double>(frames) : 0;
    state.counters["core_pct"] = 100.0 * cpu / seconds;
    state.counters["frames_per_s"] = static_cast<double>(frames) / seconds;
    state.counters["rss_kib"] = static_cast<double>(rig.controller->residentKiB());
    CountLosses(state, rig);
  }
}

void BM_SaturatedOneBus(benchmark::State& state) {
  RunSaturated(state, Hardware{1, false, false, 0});
}
BENCHMARK(BM_SaturatedOneBus)->Iterations(1)->Unit(benchmark::kSecond)->UseRealTime();

void BM_SaturatedBuses(benchmark::State& state) { RunSaturated(state, Hardware{6, true, true, 0}); }
BENCHMARK(BM_SaturatedBuses)->Iterations(1)->Unit(benchmark::kSecond)->UseRealTime();

double CorePercent(const Controller& controller, std::chrono::seconds window) {
  const double before = controller.cpuSeconds();
  std::this_thread::sleep_for(window);
  return 100.0 * (controller.cpuSeconds() - before) / static_cast<double>(window.count());
}

void BM_SilentSessions(benchmark::State& state) {
  for (auto _ : state) {
    Rig rig;
    if (!StartRig(state, rig, Hardware{0, false, false, 8})) return;
    std::this_thread::sleep_for(kSettle);
    state.counters["core_pct"] = CorePercent(
        *rig.controller, std::chrono::duration_cast<std::chrono::seconds>(kSilentWindow));
    for (auto& host : rig.hosts) host->terminate();
    std::this_thread::sleep_for(kSettle);
    state.counters["idle_core_pct"] = CorePercent(
        *rig.controller, std::chrono::duration_cast<std::chrono::seconds>(kSilentWindow));
  }
}
BENCHMARK(BM_SilentSessions)->Iterations(1)->Unit(benchmark::kSecond)->UseRealTime();

double ProcessCpuSeconds() {
  rusage usage{};
  getrusage(RUSAGE_SELF, &usage);
  return static_cast<double>(usage.ru_utime.tv_sec + usage.ru_stime.tv_sec) +
         static_cast<double>(usage.ru_utime.tv_usec + usage.ru_stime.tv_usec) / 1e6;
}

void BM_DriverAlone(benchmark::State& state) {
  Workspace workspace;
  kvbench::WriteReplay(workspace.path());
  std::string error;
  if (!tarvix::LoadConfiguration(kvbench::HardwareJson(Hardware{6, true, true, 0}),
                                 workspace.path(), &error)) {
    state.SkipWithError(error.c_str());
    return;
  }
  std::vector<kxRef> sessions;
  for (const char* name : {"CAN1", "CAN2", "CAN3", "CAN4", "CAN5", "CAN6", "CAN7", "FlexRay1"}) {
    kxRef s = 0;
    kxCreateSession(driver::kDatabaseSubordinate, "", "", name, driver::kModeReceiveStream, &s);
    sessions.push_back(s);
  }
  std::vector<uint8_t> buffer(1 << 20);
  for (auto _ : state) {
    uint64_t frames = 0;
    const double before = ProcessCpuSeconds();
    const auto end = std::chrono::steady_clock::now() + 5s;
    while (std::chrono::steady_clock::now() < end) {
      for (kxRef s : sessions) {
        uint32_t bytes = 0;
        kxReadFrame(s, buffer.data(), static_cast<uint32_t>(buffer.size()), 0.0, &bytes);
        driver::RawFrameWalker walker(buffer.data(), bytes);
        driver::RawFrameView frame;
        while (walker.next(frame)) ++frames;
      }
      std::this_thread::sleep_for(2ms);
    }
    const double cpu = ProcessCpuSeconds() - before;
    state.counters["driver_us_per_frame"] = frames ? cpu * 1e6 / static_cast<double>(frames) : 0;
    state.counters["frames_per_s"] = static_cast<double>(frames) / 5.0;
  }
  for (kxRef s : sessions) kxClear(s);
}
BENCHMARK(BM_DriverAlone)->Iterations(1)->Unit(benchmark::kSecond)->UseRealTime();

}  // namespace

BENCHMARK_MAIN();
