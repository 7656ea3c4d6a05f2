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
  bool resized = false;       // the payload length differs from the previous report's

  // New, or its payload changed since the previous report.
  bool anyChange() const;
};

// Keeps the payloads of the last report per row key. Not thread-safe.
class LiveTable {
 public:
  explicit LiveTable(Bus bus) : bus_(bus) {}

  // Takes one record message of `payloadBytes` bytes. The controller sends its whole table,
  // sorted by identifier, as one message of at most 100000 bytes, or as several when it needs
  // more: a message continues the report before it when that one was full and this one goes on in
  // identifier order. A new report replaces the rows; identifiers missing from it (after a reset
  // on the controller) are forgotten.
  // Returns the index of the first row the message added.
  size_t update(const std::vector<kvhost::IdentifierRecord>& records, size_t payloadBytes = 0);
  // Forgets every row and payload, as if no report had come.
  void clear();

  const std::vector<LiveRow>& rows() const { return rows_; }
  Bus bus() const { return bus_; }

 private:
  Bus bus_;
  std::vector<LiveRow> rows_;
  std::map<RowKey, std::vector<uint8_t>> lastPayloads_;  // of the report before the current one
  std::map<RowKey, std::vector<uint8_t>> payloads_;      // of the current report so far
  size_t lastMessageBytes_ = 0;
};

}  // namespace kvmon
