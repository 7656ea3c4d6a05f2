// Text lines and binary records written per second, per bus, through the session log writers.
//
// The log file of each run is a link to /dev/null in the service directory of a temporary drive,
// so that the figures are the writers' own cost (selection, formatting, the stream) and not the
// disk's.
#include <benchmark/benchmark.h>
#include <unistd.h>

#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <string>
#include <vector>

#include "bus/CBusSystem.h"
#include "driver/RawFrame.h"
#include "hostlink/HostConnection.h"
#include "logging/LogFile.h"
#include "logging/LogFileName.h"
#include "logging/LogWriters.h"
#include "logging/TextLogFormat.h"
#include "platform/net/Socket.h"

namespace {

namespace fs = std::filesystem;
using namespace nKV_DLL300;

constexpr int kFramesPerBatch = 512;
constexpr uint64_t kStart = 133'604'103'030'420'000ull;
constexpr uint64_t kTicksPerFrame = 2'300;

enum class Bus { kCan, kCanFd, kLin, kFlexRay };

class BenchSession : public CBusSystem {
 public:
  explicit BenchSession(HostConnection* connection)
      : CBusSystem(connection, driver::BusKind::kCan) {}
  void startPollThread() override {}
  int32_t pollLoop() override { return 0; }
  void reportBusState(uint64_t) override {}
  SessionLog& log() { return sessionLog; }
};

void Append(std::vector<uint8_t>& batch, driver::RawFrameHeader h, const uint8_t* payload) {
  const size_t at = batch.size();
  batch.resize(at + driver::RawFrameSize(h), 0);
  std::memcpy(batch.data() + at, &h, sizeof h);
  std::memcpy(batch.data() + at + driver::kRawFrameHeaderSize, payload,
              driver::RawPayloadLength(h));
}

// A batch like a loaded bus of the kind: mixed identifiers, types and lengths.
std::vector<uint8_t> MakeBatch(Bus bus) {
  std::vector<uint8_t> batch;
  uint8_t payload[64];
  for (int i = 0; i < 64; ++i) payload[i] = static_cast<uint8_t>(i * 37);
  for (int i = 0; i < kFramesPerBatch; ++i) {
    const uint64_t ts = kStart + i * kTicksPerFrame;
    payload[0] = static_cast<uint8_t>(i);
    switch (bus) {
      case Bus::kCan:
        Append(batch, {ts, i % 4 == 3 ? 0x38FEF100u : 0x100u + (i % 7), 0, 0, 0, 8}, payload);
        break;
      case Bus::kCanFd:
        Append(batch, {ts, 0x200u + (i % 3), 0x18, 0, 0, static_cast<uint8_t>(i % 2 ? 64 : 12)},
               payload);
        break;
      case Bus::kLin:
        Append(batch,
               {ts, 0x10u + (i % 4), static_cast<uint8_t>(i % 4 == 2 ? 0x42 : 0x40), 0, 0x5a,
                static_cast<uint8_t>(i % 4 == 2 ? 0 : 8)},
               payload);
        break;
      case Bus::kFlexRay:
        Append(batch, {ts, 1u + (i % 40), 0x20, 0x12, static_cast<uint8_t>(i % 64), 16}, payload);
        break;
    }
  }
  return batch;
}

// A drive whose service directory holds "bench.txt" and "bench.zfl" as links to /dev/null;
// removed when the program ends.
struct BenchDrive {
  BenchDrive() {
    root = fs::temp_directory_path() / ("kelvanert-bench-" + std::to_string(::getpid()));
    const fs::path directory = root / "QV-RT" / "tarvix" / "kelvane";
    fs::create_directories(directory);
    for (const char* name : {"bench.txt", "bench.zfl"}) {
      fs::remove(directory / name);
      fs::create_symlink("/dev/null", directory / name);
    }
    setenv("KELVANERT_DRIVE_C", root.c_str(), 1);
  }
  ~BenchDrive() {
    std::error_code ignored;
    fs::remove_all(root, ignored);
  }
  fs::path root;
};

void RunWriter(benchmark::State& state, Bus bus, uint8_t logType) {
  static const BenchDrive drive;
  HostConnection connection(platform::net::kInvalidSocket, ConnectionSetup{});
  connection.settings.logFileName.set("bench");
  connection.settings.logFileType.store(logType);
  connection.settings.canIoMode.store(bus == Bus::kCanFd ? 2 : 0);
  BenchSession session(&connection);
  const std::vector<uint8_t> batch = MakeBatch(bus);
  const uint32_t bytes = static_cast<uint32_t>(batch.size());
  const auto writer = bus == Bus::kLin       ? &WriteLinLog
                      : bus == Bus::kFlexRay ? &WriteFlexRayLog
                                             : &WriteCanLog;
  OpenLogFile(session.log(), kCanTextLogHeader);
  if (!session.log().isOpen()) state.SkipWithError("the log could not be opened");
  for (auto _ : state) writer(session.log(), batch.data(), bytes, kFramesPerBatch);
  CloseLogFile(session.log());
  if (session.lastStatus.load() != 0) state.SkipWithError("a write failed");
  state.SetItemsProcessed(state.iterations() * kFramesPerBatch);
}

void TextCan(benchmark::State& s) { RunWriter(s, Bus::kCan, kLogTypeText); }
void TextCanFd(benchmark::State& s) { RunWriter(s, Bus::kCanFd, kLogTypeText); }
void TextLin(benchmark::State& s) { RunWriter(s, Bus::kLin, kLogTypeText); }
void TextFlexRay(benchmark::State& s) { RunWriter(s, Bus::kFlexRay, kLogTypeText); }
void BinaryCan(benchmark::State& s) { RunWriter(s, Bus::kCan, kLogTypeBinary); }
void BinaryCanFd(benchmark::State& s) { RunWriter(s, Bus::kCanFd, kLogTypeBinary); }
void BinaryLin(benchmark::State& s) { RunWriter(s, Bus::kLin, kLogTypeBinary); }
void BinaryFlexRay(benchmark::State& s) { RunWriter(s, Bus::kFlexRay, kLogTypeBinary); }

BENCHMARK(TextCan);
BENCHMARK(TextCanFd);
BENCHMARK(TextLin);
BENCHMARK(TextFlexRay);
BENCHMARK(BinaryCan);
BENCHMARK(BinaryCanFd);
BENCHMARK(BinaryLin);
BENCHMARK(BinaryFlexRay);

}  // namespace
