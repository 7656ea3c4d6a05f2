// What kvmon shows its sessions on: the live terminal table or one of the line formats.
#pragma once

#include <string>

#include "host/kvmon/SourceModel.h"

namespace kvmon {

// Called from the tool's one thread, one message at a time, after the message went into the
// source's model.
class Display {
 public:
  virtual ~Display() = default;
  // An identifier-record message of `source`: its rows start at `firstRow` of the source's table
  // (the controller's whole table, or part of it when the table needs more than one message).
  virtual void showRecords(const SourceModel& source, size_t firstRow) = 0;
  // `source` received a statistics report.
  virtual void showStatistics(const SourceModel& source) = 0;
  // Something the controller said during the session, in plain words.
  virtual void showNotice(const std::string& words) = 0;
  // The sessions are over; leave the terminal as it was.
  virtual void close() {}
  // True once the output could not be written (a closed pipe): the tool ends the sessions.
  virtual bool failed() const = 0;
};

}  // namespace kvmon
