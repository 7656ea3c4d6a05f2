// libFuzzer target: arbitrary bytes as a candump -l log that the simulated driver replays on a CAN
// bus: read by the replay reader, then played in a loop as a bus takes its frames, for ten years
// of bus time at most.
#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <sstream>
#include <string>
#include <vector>

#include "tarvix/CanSource.h"
#include "tarvix/CandumpLog.h"

namespace {

constexpr int64_t kEpochNs = 1'000'000'000'000;  // the monotonic clock after some 17 minutes
constexpr int64_t kHorizonNs = kEpochNs + 10 * 365 * 24 * 3600 * 1'000'000'000LL;
constexpr int64_t kFrameNs = 100'000;

// Takes frames as the bus would, then lets the source skip what nobody heard.
void Play(tarvix::ReplaySource& source, size_t frames) {
  int64_t busFreeNs = kEpochNs;
  for (size_t i = 0; i < 3 * frames + 8; ++i) {
    const tarvix::Pending* next = source.peek();
    if (next == nullptr || next->dueNs > kHorizonNs) break;
    const int64_t startNs = std::max(busFreeNs, next->dueNs);
    busFreeNs = startNs + kFrameNs;
    source.sent(startNs, busFreeNs);
  }
  source.skipTo(busFreeNs + kFrameNs);
  source.skipTo(kHorizonNs);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  std::istringstream log(std::string(reinterpret_cast<const char*>(data), size));
  std::vector<tarvix::LoggedFrame> frames;
  std::string error;
  if (!tarvix::ReadCandumpLog(log, "input.log", frames, error)) return 0;
  const size_t count = frames.size();
  tarvix::ReplayConfig config;
  config.loop = true;
  tarvix::ReplaySource source(std::move(frames), config, kEpochNs);
  Play(source, count);
  return 0;
}
