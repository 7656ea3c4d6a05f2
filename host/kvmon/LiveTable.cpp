// Marking the payload bytes that changed between two reports of the same identifier.
#include "host/kvmon/LiveTable.h"

namespace kvmon {

void LiveTable::Update(const std::vector<kvhost::IdentifierRecord>& records) {
  std::map<RowKey, std::vector<uint8_t>> payloads;
  std::vector<LiveRow> rows;
  rows.reserve(records.size());
  for (const auto& record : records) {
    const RowKey key = KeyOf(bus_, record);
    LiveRow row;
    row.record = record;
    row.changed.assign(record.payload.size(), false);
    const auto before = lastPayloads_.find(key);
    row.fresh = before == lastPayloads_.end();
    if (!row.fresh) {
      for (size_t i = 0; i < record.payload.size(); ++i) {
        row.changed[i] = i >= before->second.size() || before->second[i] != record.payload[i];
      }
    }
    payloads[key] = record.payload;
    rows.push_back(std::move(row));
  }
  rows_ = std::move(rows);
  lastPayloads_ = std::move(payloads);
}

}  // namespace kvmon
