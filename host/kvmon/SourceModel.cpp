// Folding one session's messages into the model the displays draw from.
#include "host/kvmon/SourceModel.h"

namespace kvmon {

SourceModel::SourceModel(std::string interfaceName, Bus bus, double overdueFactor)
    : interfaceName_(std::move(interfaceName)), bus_(bus), table_(bus), timing_(overdueFactor) {}

size_t SourceModel::takeRecords(const std::vector<kvhost::IdentifierRecord>& records,
                                size_t messageBytes, uint64_t receivedAt) {
  const size_t first = table_.update(records, messageBytes);
  if (first == 0) ++tables_;  // a message that continues a table is no new report
  tableSinceStatistics_ = true;
  timing_.update(bus_, records, receivedAt);
  return first;
}

void SourceModel::takeStatistics(const BusReport& report) {
  report_ = report;
  // The first period is left out: its table may still be on its way behind the statistics.
  if (++statistics_ > 1 && !tableSinceStatistics_) ++quietPeriods_;
  tableSinceStatistics_ = false;
}

std::optional<uint32_t> SourceModel::echoCount(uint32_t identifier, uint8_t type) const {
  for (const auto& row : table_.rows()) {
    const auto& r = row.record;
    if (r.identifier == identifier && r.type == type && (r.echo & 0x80) != 0) return r.count;
  }
  return std::nullopt;
}

void SourceModel::clear() {
  table_.clear();
  timing_.clear();
  report_.reset();
}

}  // namespace kvmon
