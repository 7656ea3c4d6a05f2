// Marking the payload bytes that changed between two reports of the same identifier.
#include "host/kvmon/LiveTable.h"

namespace kvmon {

namespace {

// The largest message payload of the controller, less the largest record (CAN: 28 bytes and a
// J1939 payload of 2047): a message this long may have been cut at the buffer's end.
constexpr size_t kFullMessage = 100000 - (28 + 2047);

}  // namespace

bool LiveRow::anyChange() const {
  if (fresh || resized) return true;
  for (const bool byte : changed) {
    if (byte) return true;
  }
  return false;
}

void LiveTable::clear() {
  rows_.clear();
  lastPayloads_.clear();
  payloads_.clear();
  lastMessageBytes_ = 0;
}

size_t LiveTable::update(const std::vector<kvhost::IdentifierRecord>& records,
                         size_t payloadBytes) {
  const bool continues = lastMessageBytes_ >= kFullMessage && !rows_.empty() && !records.empty() &&
                         records.front().identifier >= rows_.back().record.identifier;
  lastMessageBytes_ = payloadBytes;
  if (!continues) {
    lastPayloads_ = std::move(payloads_);
    payloads_.clear();
    rows_.clear();
  }
  const size_t first = rows_.size();
  for (const auto& record : records) {
    const RowKey key = KeyOf(bus_, record);
    LiveRow row;
    row.record = record;
    row.changed.assign(record.payload.size(), false);
    const auto before = lastPayloads_.find(key);
    row.fresh = before == lastPayloads_.end();
    if (!row.fresh) {
      row.resized = before->second.size() != record.payload.size();
      for (size_t i = 0; i < record.payload.size(); ++i) {
        row.changed[i] = i >= before->second.size() || before->second[i] != record.payload[i];
      }
    }
    payloads_[key] = record.payload;
    rows_.push_back(std::move(row));
  }
  return first;
}

}  // namespace kvmon
