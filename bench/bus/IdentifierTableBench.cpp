// Frames per second through the identifier table, and the cost of one identifier-record send,
// measured for the indexed table and for the plain linear-search, adjacent-swap table in one run.
#include <benchmark/benchmark.h>

#include <algorithm>
#include <memory>
#include <numeric>
#include <random>
#include <vector>

#include "bus/IdentifierTable.h"
#include "tests/bus/FrameBatch.h"
#include "tests/bus/LiteralIdentifierTable.h"

namespace nKV_DLL300 {
namespace {

using test::FrameBatch;
using Indexed = CanIdentifierTable;
using Literal = test::LiteralIdentifierTable<CanIdentifierRules>;

constexpr uint32_t kFramesPerBatch = 4000;  // 96 000 bytes of classic frames: a nearly full read
constexpr TableSettings kSettings{};

uint32_t IdentifierOf(uint32_t i) { return i < 2048 ? i : (0x20000000u | i); }

// Batches that present the identifiers 0 to n - 1 in a shuffled order, `frames` frames in all.
std::vector<FrameBatch> ShuffledBatches(uint32_t n, uint32_t frames, uint32_t seed) {
  std::vector<uint32_t> order(n);
  std::iota(order.begin(), order.end(), 0u);
  std::mt19937 random(seed);
  std::vector<FrameBatch> batches(1);
  for (uint32_t f = 0; f < frames; ++f) {
    if (f % n == 0) std::shuffle(order.begin(), order.end(), random);
    if (batches.back().size() >= kFramesPerBatch * 24) batches.emplace_back();
    batches.back().can(f, IdentifierOf(order[f % n]), {uint8_t(f), 1, 2, 3, 4, 5, 6, 7});
  }
  return batches;
}

std::unique_ptr<Indexed> Make(Indexed*, uint32_t n) { return Indexed::create(n); }
std::unique_ptr<Literal> Make(Literal*, uint32_t n) { return std::make_unique<Literal>(n); }

template <class Table>
void Fill(Table& table, const std::vector<FrameBatch>& batches) {
  for (const auto& b : batches) table.updateIdentifierTable(b.data(), b.size(), kSettings);
}

auto NullSink() {
  return [](uint8_t, const void* payload, uint32_t length, uint16_t) {
    benchmark::DoNotOptimize(payload);
    benchmark::DoNotOptimize(length);
    return int32_t{0};
  };
}

// Steady state: every identifier is already in the table; a batch of frames in shuffled order.
template <class Table>
void BM_UpdateIdentifierTable(benchmark::State& state) {
  const auto n = static_cast<uint32_t>(state.range(0));
  auto table = Make(static_cast<Table*>(nullptr), n);
  Fill(*table, ShuffledBatches(n, n, 1));
  const FrameBatch batch = ShuffledBatches(n, kFramesPerBatch, 2).front();
  for (auto _ : state) table->updateIdentifierTable(batch.data(), batch.size(), kSettings);
  state.SetItemsProcessed(state.iterations() * kFramesPerBatch);
}

// The first send after n identifiers were seen in shuffled order: a full sort and the messages.
template <class Table>
void BM_SendIdentifierRecords(benchmark::State& state) {
  const auto n = static_cast<uint32_t>(state.range(0));
  const auto batches = ShuffledBatches(n, n, 3);
  std::unique_ptr<Literal> pristine;
  if constexpr (std::is_same_v<Table, Literal>) {
    pristine = Make(static_cast<Literal*>(nullptr), n);
    Fill(*pristine, batches);
  }
  for (auto _ : state) {
    state.PauseTiming();
    std::unique_ptr<Table> table;
    if constexpr (std::is_same_v<Table, Literal>) {
      table = std::make_unique<Literal>(*pristine);
    } else {
      table = Make(static_cast<Table*>(nullptr), n);
      Fill(*table, batches);
    }
    state.ResumeTiming();
    table->sendIdentifierRecords(false, NullSink());
    state.PauseTiming();
    table.reset();
    state.ResumeTiming();
  }
}

// A later send with no new identifier since the last one.
void BM_SendIdentifierRecordsAgain(benchmark::State& state) {
  const auto n = static_cast<uint32_t>(state.range(0));
  auto table = Indexed::create(n);
  Fill(*table, ShuffledBatches(n, n, 3));
  table->sendIdentifierRecords(false, NullSink());
  for (auto _ : state) table->sendIdentifierRecords(false, NullSink());
}

BENCHMARK(BM_UpdateIdentifierTable<Indexed>)->Arg(100)->Arg(2000)->Arg(65535)->MinTime(0.3);
BENCHMARK(BM_UpdateIdentifierTable<Literal>)->Arg(100)->Arg(2000)->Arg(65535)->MinTime(0.3);
BENCHMARK(BM_SendIdentifierRecords<Indexed>)
    ->Arg(2000)
    ->Arg(65535)
    ->MinTime(0.3)
    ->Unit(benchmark::kMicrosecond);
BENCHMARK(BM_SendIdentifierRecords<Literal>)
    ->Arg(2000)
    ->Arg(65535)
    ->MinTime(0.3)
    ->Unit(benchmark::kMicrosecond);
BENCHMARK(BM_SendIdentifierRecordsAgain)
    ->Arg(2000)
    ->Arg(65535)
    ->MinTime(0.3)
    ->Unit(benchmark::kMicrosecond);

}  // namespace
}  // namespace nKV_DLL300
