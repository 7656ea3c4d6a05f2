// Gap statistics per row key, updated from consecutive reports.
#include "host/kvmon/TimingHealth.h"

#include <algorithm>
#include <chrono>
#include <cmath>

namespace kvmon {
namespace {

constexpr double kUnitsPerMs = 10000.0;
constexpr uint64_t kUnixEpochIn1601Units = 116444736000000000ULL;
// The host clock only speaks for a silent bus: a report that reaches the host late (a busy host,
// a slow network) must not look like silence.
constexpr int64_t kHostClockSlack = 500 * 10000;

double Ms(uint64_t units) { return static_cast<double>(units) / kUnitsPerMs; }

}  // namespace

uint64_t HostNow() {
  const auto micros = std::chrono::duration_cast<std::chrono::microseconds>(
                          std::chrono::system_clock::now().time_since_epoch())
                          .count();
  return kUnixEpochIn1601Units + static_cast<uint64_t>(micros) * 10;
}

void TimingTracker::sample(Row& row, double gapMs) {
  ++row.samples;
  row.sum += gapMs;
  row.sumOfSquares += gapMs * gapMs;
  bound(row, gapMs);
}

void TimingTracker::bound(Row& row, double gapMs) {
  row.minGap = row.minGap ? std::min(*row.minGap, gapMs) : gapMs;
  row.maxGap = row.maxGap ? std::max(*row.maxGap, gapMs) : gapMs;
}

void TimingTracker::take(Row& row, const kvhost::IdentifierRecord& r, bool fresh) {
  const bool newFrames = fresh || (r.count > row.lastCount && r.lastTimestamp > row.lastStamp);
  if (!newFrames) return;
  // The gap between the last two frames is new whenever the last frame is.
  if (r.count >= 2 && r.lastTimestamp >= r.previousTimestamp)
    sample(row, Ms(r.lastTimestamp - r.previousTimestamp));
  // Between two reports: the mean of the gaps in between, which lies between their extremes.
  if (!fresh) bound(row, Ms(r.lastTimestamp - row.lastStamp) / (r.count - row.lastCount));
  if (fresh) {
    row.firstCount = r.count;
    row.firstStamp = r.lastTimestamp;
  }
  row.lastCount = r.count;
  row.lastStamp = r.lastTimestamp;
}

void TimingTracker::update(Bus bus, const std::vector<kvhost::IdentifierRecord>& records,
                           uint64_t receivedAt) {
  uint64_t newest = 0;
  for (const auto& record : records) {
    const RowKey key = KeyOf(bus, record);
    auto found = rows_.find(key);
    const bool fresh = found == rows_.end() || record.count < found->second.lastCount;
    if (fresh) found = rows_.insert_or_assign(key, Row{}).first;
    take(found->second, record, fresh);
    newest = std::max(newest, record.lastTimestamp);
  }
  if (newest == 0) return;
  const int64_t ahead = static_cast<int64_t>(newest - receivedAt);
  busAhead_ = busAhead_ ? std::max(*busAhead_, ahead) : ahead;
  const uint64_t byHostClock =
      static_cast<uint64_t>(static_cast<int64_t>(receivedAt) + *busAhead_ - kHostClockSlack);
  reportTime_ = std::max({reportTime_, newest, byHostClock});
}

Timing TimingTracker::of(Bus bus, const kvhost::IdentifierRecord& record) const {
  Timing timing;
  const auto found = rows_.find(KeyOf(bus, record));
  if (found == rows_.end()) return timing;
  const Row& row = found->second;
  if (row.lastCount > row.firstCount) {
    timing.meanMs = Ms(row.lastStamp - row.firstStamp) / (row.lastCount - row.firstCount);
  } else if (row.samples > 0) {
    timing.meanMs = row.sum / static_cast<double>(row.samples);
  }
  if (row.samples >= 2) {
    const double n = static_cast<double>(row.samples);
    const double mean = row.sum / n;
    timing.jitterMs = std::sqrt(std::max(0.0, row.sumOfSquares / n - mean * mean));
  }
  timing.minGapMs = row.minGap;
  timing.maxGapMs = row.maxGap;
  timing.overdue = timing.meanMs && *timing.meanMs > 0 && reportTime_ > row.lastStamp &&
                   Ms(reportTime_ - row.lastStamp) > overdueFactor_ * *timing.meanMs;
  return timing;
}

void TimingTracker::clear() {
  rows_.clear();
  busAhead_.reset();
  reportTime_ = 0;
}

}  // namespace kvmon
