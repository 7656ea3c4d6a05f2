// What kvmon shows a session on: the live terminal table or one of the line formats.
#pragma once

#include <string>
#include <vector>

#include "host/RecordDecoder.h"
#include "host/kvmon/BusReport.h"
#include "host/kvmon/FrameNames.h"

namespace kvmon {

// Called from the tool's one thread, one message at a time.
class Display {
 public:
  virtual ~Display() = default;
  // One identifier-record message of `messageBytes` payload bytes: the controller's whole table,
  // or part of it when the table needs more than one message.
  virtual void ShowRecords(Bus bus, const std::vector<kvhost::IdentifierRecord>& records,
                           size_t messageBytes) = 0;
  virtual void ShowStatistics(const BusReport& report) = 0;
  // Something the controller said during the session, in plain words.
  virtual void ShowNotice(const std::string& words) = 0;
  // The session is over; leave the terminal as it was.
  virtual void Close() {}
  // True once the output could not be written (a closed pipe): the tool ends the session.
  virtual bool failed() const = 0;
};

}  // namespace kvmon
