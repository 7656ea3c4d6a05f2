// What kvmon knows of one interface's session: the live table, the timing of its rows, the
// latest statistics, and how many reports came.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "host/RecordDecoder.h"
#include "host/kvmon/BusReport.h"
#include "host/kvmon/LiveTable.h"
#include "host/kvmon/TimingHealth.h"

namespace kvmon {

// Fed by the tool's one thread with the session's messages, read by the displays.
class SourceModel {
 public:
  SourceModel(std::string interfaceName, Bus bus, double overdueFactor);

  // One identifier-record message received at host time `receivedAt` (TimingHealth.h units);
  // returns the index in table().rows() of the first row it added.
  size_t takeRecords(const std::vector<kvhost::IdentifierRecord>& records, size_t messageBytes,
                     uint64_t receivedAt);
  void takeStatistics(const BusReport& report);
  // Forgets rows, timing and statistics (the controller's table was reset); counts stay.
  void clear();

  const std::string& interfaceName() const { return interfaceName_; }
  Bus bus() const { return bus_; }
  const LiveTable& table() const { return table_; }
  const TimingTracker& timing() const { return timing_; }
  const std::optional<BusReport>& report() const { return report_; }

  // Reports so far: the identifier tables, and on a quiet bus (the controller sends no table
  // while it has none) each statistics period after the first without a table.
  uint64_t reports() const { return tables_ + quietPeriods_; }
  // True once any identifier was reported.
  bool seenFrames() const { return tables_ > 0; }

  // LIN: whether the session asked the driver for checksums (otherwise the records carry 0).
  bool checksums() const { return checksums_; }
  void setChecksums(bool reported) { checksums_ = reported; }

  // The count of the row of `identifier` (with the CAN extended bit) and frame `type` while its
  // last frame was sent by this interface (an echo): how often a transmitted frame went out.
  std::optional<uint32_t> echoCount(uint32_t identifier, uint8_t type) const;

 private:
  std::string interfaceName_;
  Bus bus_;
  LiveTable table_;
  TimingTracker timing_;
  std::optional<BusReport> report_;
  uint64_t tables_ = 0;
  uint64_t statistics_ = 0;
  uint64_t quietPeriods_ = 0;
  bool tableSinceStatistics_ = false;
  bool checksums_ = false;
};

}  // namespace kvmon
