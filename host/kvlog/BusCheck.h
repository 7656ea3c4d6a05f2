// Whether the records of a binary log belong to the bus the user named: a log does not name its
// bus, and records read as another bus's give garbage.
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>

#include "host/voradump/RecordDecoder.h"

namespace kvlog {

// The first record (its number from 1 and its byte offset within the records) whose frame type is
// not one of `bus`, read in `layout`; nullopt when every whole record fits.
struct ForeignRecord {
  uint64_t number = 0;
  size_t offset = 0;
  uint8_t type = 0;
};
std::optional<ForeignRecord> FirstForeignRecord(const uint8_t* records, size_t size,
                                                voradump::BinaryRecordLayout layout,
                                                voradump::RecordBus bus);

// Why the records cannot be `bus`'s, in plain words, naming a bus they do read as when there is
// one; empty when they fit `bus` (read in the layout `canRecords` settles).
std::string ExplainForeignRecords(const uint8_t* records, size_t size, voradump::RecordBus bus,
                                  voradump::CanRecords canRecords);

}  // namespace kvlog
