// The rows of the live identifier table: the latest record of each identifier and which payload
// bytes changed since the report before.
#pragma once

#include <map>
#include <vector>

#include "host/RecordDecoder.h"
#include "host/kvmon/FrameNames.h"

namespace kvmon {

struct LiveRow {
  kvhost::IdentifierRecord record;
  std::vector<bool> changed;  // one per payload byte: differs from the previous report
  bool fresh = false;         // first report of this identifier
};

// Keeps the payloads of the last report per row key. Not thread-safe.
class LiveTable {
 public:
  explicit LiveTable(Bus bus) : bus_(bus) {}

  // Takes one report (the controller sends its whole table, sorted by identifier) and makes it
  // the rows. Identifiers missing from it (after a reset on the controller) are forgotten.
  void Update(const std::vector<kvhost::IdentifierRecord>& records);

  const std::vector<LiveRow>& rows() const { return rows_; }
  Bus bus() const { return bus_; }

 private:
  Bus bus_;
  std::vector<LiveRow> rows_;
  std::map<RowKey, std::vector<uint8_t>> lastPayloads_;
};

}  // namespace kvmon
