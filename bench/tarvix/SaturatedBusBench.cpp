// Cost of simulating and reading a saturated 1 Mbit/s CAN bus, as a multiple of real time.
#include <benchmark/benchmark.h>

#include <chrono>
#include <string>
#include <thread>
#include <vector>

#include "driver/Sessions.h"
#include "driver/tarvix.h"
#include "tarvix/TarvixControl.h"

namespace {

// Two sources that keep a 1 Mbit/s bus busy all the time, one with a changing payload.
constexpr const char* kSaturated = R"({"buses":[{"name":"sat","bitRate":1000000,"traffic":[
    {"id":"0x100","length":8,"periodMs":0,"payload":"ctr 11 22 33 44 55 66 77"},
    {"id":"0x18FEF100","extended":true,"length":8,"periodMs":0,"payload":"ramp:00"}]}],
  "devices":[{"name":"D","interfaces":[{"name":"CAN1","bus":"sat"}]}]})";

// The poll loop of a monitoring session: read 100000-byte batches without waiting. The bus runs
// in wall-clock time, so the benchmark measures the CPU time one second of bus traffic costs: the
// ratio "sim_speed" of bus time to CPU time must stay above 100.
void BM_SaturatedBusOneSecond(benchmark::State& state) {
  std::string error;
  if (!tarvix::LoadConfiguration(kSaturated, ".", &error)) {
    state.SkipWithError(error.c_str());
    return;
  }
  kxRef s = 0;
  kxCreateSession(driver::kDatabaseSubordinate, "", "", "CAN1", driver::kModeReceiveStream, &s);
  std::vector<uint8_t> buffer(100000);
  uint64_t frames = 0;
  for (auto _ : state) {
    const auto end = std::chrono::steady_clock::now() + std::chrono::milliseconds(200);
    while (std::chrono::steady_clock::now() < end) {
      uint32_t bytes = 0;
      kxReadFrame(s, buffer.data(), static_cast<uint32_t>(buffer.size()), 0.0, &bytes);
      frames += bytes / 24;
      std::this_thread::sleep_for(std::chrono::milliseconds(1));
    }
  }
  state.counters["frames_per_s"] =
      benchmark::Counter(static_cast<double>(frames), benchmark::Counter::kIsRate);
  kxClear(s);
}
BENCHMARK(BM_SaturatedBusOneSecond)
    ->Iterations(5)
    ->Unit(benchmark::kMillisecond)
    ->MeasureProcessCPUTime()
    ->UseRealTime();

// Pure simulation cost per frame: one read after a pause catches up with everything the bus
// carried in the meantime. "speedup" is bus time carried per unit of time spent simulating and
// reading it; the stand-in must stay above 100.
void BM_CatchUpPerFrame(benchmark::State& state) {
  std::string error;
  if (!tarvix::LoadConfiguration(kSaturated, ".", &error)) {
    state.SkipWithError(error.c_str());
    return;
  }
  kxRef s = 0;
  kxCreateSession(driver::kDatabaseSubordinate, "", "", "CAN1", driver::kModeReceiveStream, &s);
  std::vector<uint8_t> buffer(1 << 20);
  uint64_t frames = 0;
  std::chrono::nanoseconds busy{0};
  std::chrono::nanoseconds bus{0};
  for (auto _ : state) {
    state.PauseTiming();
    const auto pauseStart = std::chrono::steady_clock::now();
    std::this_thread::sleep_for(std::chrono::milliseconds(100));
    state.ResumeTiming();
    const auto start = std::chrono::steady_clock::now();
    uint32_t bytes = 0;
    kxReadFrame(s, buffer.data(), static_cast<uint32_t>(buffer.size()), 0.0, &bytes);
    frames += bytes / 24;
    busy += std::chrono::steady_clock::now() - start;
    bus += start - pauseStart;
  }
  state.counters["frames"] = static_cast<double>(frames);
  state.counters["ns_per_frame"] =
      frames ? static_cast<double>(busy.count()) / static_cast<double>(frames) : 0;
  state.counters["speedup"] =
      busy.count() ? static_cast<double>(bus.count()) / static_cast<double>(busy.count()) : 0;
  kxClear(s);
}
BENCHMARK(BM_CatchUpPerFrame)->Iterations(20)->Unit(benchmark::kMicrosecond);

}  // namespace

BENCHMARK_MAIN();
