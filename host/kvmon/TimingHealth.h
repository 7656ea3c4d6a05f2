// Per-identifier timing health from the controller's periodic tables: mean period, jitter,
// smallest and largest gap, and whether an identifier is overdue.
#pragma once

#include <cstdint>
#include <map>
#include <optional>
#include <vector>

#include "host/RecordDecoder.h"
#include "host/kvmon/FrameNames.h"

namespace kvmon {

// Times are 100 ns units since 1601-01-01 UTC, as the records carry them.
struct Timing {
  std::optional<double> meanMs;    // span of the frames seen / frames in it
  std::optional<double> jitterMs;  // standard deviation of the gaps sampled (two or more)
  std::optional<double> minGapMs;  // smallest gap seen (a sample, or a report's mean gap)
  std::optional<double> maxGapMs;  // largest gap seen
  bool overdue = false;            // silent for more than the factor times the mean period
};

// The controller reports each identifier's last two time stamps and its count once per report, so
// a host sees one gap per identifier and report, and the mean gap between two reports; the
// smallest and largest gap are the extremes of those. Silence is judged at the time of the last
// report, so that a 10 ms identifier does not look overdue while the next report is on its way.
// Not thread-safe; one per interface.
class TimingTracker {
 public:
  explicit TimingTracker(double overdueFactor) : overdueFactor_(overdueFactor) {}

  // One report's records, received at host time `receivedAt`. An identifier whose count went
  // down (a reset on the controller) starts again.
  void update(Bus bus, const std::vector<kvhost::IdentifierRecord>& records, uint64_t receivedAt);
  // The health of `record`'s row as of the last report.
  Timing of(Bus bus, const kvhost::IdentifierRecord& record) const;
  // The bus time of the last report: its newest time stamp, or later when the host clock says so
  // by more than half a second (carried on from the report that was least behind it), so that a
  // bus that falls silent while the controller goes on reporting still ages. 0 before the first
  // report.
  uint64_t reportTime() const { return reportTime_; }
  void clear();

 private:
  struct Row {
    uint32_t firstCount = 0, lastCount = 0;
    uint64_t firstStamp = 0, lastStamp = 0;
    uint64_t samples = 0;
    double sum = 0, sumOfSquares = 0;  // of the sampled gaps, in ms
    std::optional<double> minGap, maxGap;
  };
  void take(Row& row, const kvhost::IdentifierRecord& record, bool fresh);
  static void sample(Row& row, double gapMs);
  static void bound(Row& row, double gapMs);

  double overdueFactor_;
  std::map<RowKey, Row> rows_;
  std::optional<int64_t> busAhead_;  // newest stamp minus receipt time, the largest seen
  uint64_t reportTime_ = 0;
};

// The host's clock in the records' units.
uint64_t HostNow();

}  // namespace kvmon
