// Which rows a view shows and in which order: filter, changed-only, age and sorting, the same for
// the live table and the line formats.
#pragma once

#include <cstdint>
#include <optional>
#include <vector>

#include "host/kvmon/RowFilter.h"
#include "host/kvmon/SourceModel.h"

namespace kvmon {

enum class SortOrder : uint8_t {
  kIdentifier,  // interface, then identifier, as the controller sorts its table
  kCount,       // most frames first
  kPeriod,      // shortest period first, rows without a period last
  kRecent,      // latest frame first
};
// "id", "count", "period", "recent"; nullopt for other names.
std::optional<SortOrder> SortOrderNamed(const std::string& name);
const char* SortOrderName(SortOrder order);
// The next order after `order`, round the four.
SortOrder NextSortOrder(SortOrder order);

struct ViewOptions {
  RowFilter filter;
  bool changedOnly = false;          // only rows that are new or whose payload changed
  std::optional<double> ageSeconds;  // hide rows without a frame for this long
  SortOrder sort = SortOrder::kIdentifier;
  bool timing = false;         // the terminal shows timing columns instead of the payload
  double overdueFactor = 3.0;  // a row is overdue after this many mean periods of silence
};

struct ShownRow {
  const SourceModel* source = nullptr;
  const LiveRow* row = nullptr;
  Timing timing;
};

// The rows of `sources` that `view` shows, in its order. Ages count to each source's last report.
std::vector<ShownRow> SelectRows(const std::vector<const SourceModel*>& sources,
                                 const ViewOptions& view);
// The rows of one message of `source` (from `firstRow` on) that `view` shows, in the
// controller's order: what the line formats print.
std::vector<ShownRow> SelectMessageRows(const SourceModel& source, size_t firstRow,
                                        const ViewOptions& view);

}  // namespace kvmon
