// kvmon's line output for scripts and logs: one text line per identifier record and per
// statistics report.
#pragma once

#include <cstdio>
#include <functional>
#include <string>

#include "host/kvmon/Display.h"
#include "host/kvmon/RowSelection.h"

namespace kvmon {

// Lines such as (docs/kvmon.md)
//   1700000000.123456 CAN1 100 data [8] 2A 01 02 03 04 05 06 07 count=1234 period=10.000ms
//   1700000000.123456 FlexRay1 slot 40 B data [2] 40 41 count=9 period=5.000ms cycle=3
//   1700000000.200000 CAN1 statistics standard=100/s ... load=12.34% peak=13.00% state=error-active
// The rows the view shows (filter, changed-only, age); with the view's timing on, each record line
// also carries mean=, jitter=, min= and max=; an overdue row ends in " overdue". Notices go to
// `err`.
class PlainLines : public Display {
 public:
  PlainLines(ViewOptions view, std::FILE* out, std::FILE* err,
             std::function<uint64_t()> clock = HostNow)
      : view_(std::move(view)), out_(out), err_(err), clock_(std::move(clock)) {}

  void showRecords(const SourceModel& source, size_t firstRow) override;
  void showStatistics(const SourceModel& source) override;
  void showNotice(const std::string& words) override;
  bool failed() const override { return failed_; }

  // The line of one shown row, without its line end.
  static std::string recordLine(const ShownRow& row, bool withTiming);
  // The line of one statistics report, without its line end; `when` is its receipt time text.
  static std::string statisticsLine(const std::string& interfaceName, const std::string& when,
                                    const BusReport& report);

 private:
  void write(const std::string& line);

  ViewOptions view_;
  std::FILE* out_;
  std::FILE* err_;
  std::function<uint64_t()> clock_;
  bool failed_ = false;
};

}  // namespace kvmon
