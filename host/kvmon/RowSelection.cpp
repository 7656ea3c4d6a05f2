// Selecting and sorting rows for the displays.
#include "host/kvmon/RowSelection.h"

#include <algorithm>

namespace kvmon {
namespace {

constexpr double kUnitsPerSecond = 1e7;

struct OrderName {
  SortOrder order;
  const char* name;
};
constexpr OrderName kOrderNames[] = {{SortOrder::kIdentifier, "id"},
                                     {SortOrder::kCount, "count"},
                                     {SortOrder::kPeriod, "period"},
                                     {SortOrder::kRecent, "recent"}};

bool IsShown(const ViewOptions& view, const SourceModel& source, const LiveRow& row,
             uint64_t busNow) {
  if (!view.filter.accepts(source.bus(), row.record)) return false;
  if (view.changedOnly && !row.anyChange()) return false;
  if (!view.ageSeconds) return true;
  const uint64_t last = row.record.lastTimestamp;
  return busNow <= last || static_cast<double>(busNow - last) <= *view.ageSeconds * kUnitsPerSecond;
}

void Add(std::vector<ShownRow>& shown, const SourceModel& source, size_t firstRow,
         const ViewOptions& view) {
  const uint64_t busNow = source.timing().reportTime();
  const auto& rows = source.table().rows();
  for (size_t i = firstRow; i < rows.size(); ++i) {
    if (!IsShown(view, source, rows[i], busNow)) continue;
    shown.push_back({&source, &rows[i], source.timing().of(source.bus(), rows[i].record)});
  }
}

// Strict weak order of `order`; the stable sort keeps the controller's order among equals.
bool Before(SortOrder order, const ShownRow& a, const ShownRow& b) {
  const auto& x = a.row->record;
  const auto& y = b.row->record;
  switch (order) {
    case SortOrder::kCount:
      return x.count > y.count;
    case SortOrder::kPeriod: {
      const auto px = PeriodMs(x), py = PeriodMs(y);
      if (!px || !py) return px.has_value() && !py.has_value();
      return *px < *py;
    }
    case SortOrder::kRecent:
      return x.lastTimestamp > y.lastTimestamp;
    case SortOrder::kIdentifier:
      break;
  }
  return false;
}

}  // namespace

std::optional<SortOrder> SortOrderNamed(const std::string& name) {
  for (const auto& entry : kOrderNames) {
    if (name == entry.name) return entry.order;
  }
  return std::nullopt;
}

const char* SortOrderName(SortOrder order) {
  for (const auto& entry : kOrderNames) {
    if (entry.order == order) return entry.name;
  }
  return "?";
}

SortOrder NextSortOrder(SortOrder order) {
  constexpr size_t kOrders = sizeof kOrderNames / sizeof kOrderNames[0];
  for (size_t i = 0; i < kOrders; ++i) {
    if (kOrderNames[i].order == order) return kOrderNames[(i + 1) % kOrders].order;
  }
  return SortOrder::kIdentifier;
}

std::vector<ShownRow> SelectRows(const std::vector<const SourceModel*>& sources,
                                 const ViewOptions& view) {
  std::vector<ShownRow> shown;
  for (const SourceModel* source : sources) Add(shown, *source, 0, view);
  std::stable_sort(shown.begin(), shown.end(),
                   [&](const ShownRow& a, const ShownRow& b) { return Before(view.sort, a, b); });
  return shown;
}

std::vector<ShownRow> SelectMessageRows(const SourceModel& source, size_t firstRow,
                                        const ViewOptions& view) {
  std::vector<ShownRow> shown;
  Add(shown, source, firstRow, view);
  return shown;
}

}  // namespace kvmon
