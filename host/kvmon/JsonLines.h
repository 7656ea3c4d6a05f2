// kvmon's machine format: one JSON object per line for each identifier record and statistics
// report; docs/kvmon.md describes every field.
#pragma once

#include <cstdio>
#include <functional>
#include <string>

#include "host/kvmon/Display.h"
#include "host/kvmon/RowSelection.h"

namespace kvmon {

// Objects such as
//   {"kind":"record","timestamp":1700000000.123456,"interface":"CAN1","bus":"CAN","id":256,
//    "id_text":"100","extended":false,"type":"data","type_code":0,"length":8,
//    "data":"2A01020304050607","count":1234,"period_ms":10.0,"echo":false,
//    "raw_timestamp":133400000000000000,"mean_period_ms":10.0,...,"overdue":false}
//   {"kind":"statistics","timestamp":1700000000.200000,"interface":"CAN1","bus":"CAN",
//    "per_second":{"standard":100,...},"totals":{...},"bus_load":12.34,...}
// Times are Unix seconds (the raw 100 ns count since 1601 is an extra field). Rows the view
// hides are left out. Notices go to `err` as plain text.
class JsonLines : public Display {
 public:
  JsonLines(ViewOptions view, std::FILE* out, std::FILE* err,
            std::function<uint64_t()> clock = HostNow)
      : view_(std::move(view)), out_(out), err_(err), clock_(std::move(clock)) {}

  void showRecords(const SourceModel& source, size_t firstRow) override;
  void showStatistics(const SourceModel& source) override;
  void showNotice(const std::string& words) override;
  bool failed() const override { return failed_; }

  static std::string recordObject(const ShownRow& row);
  // `when`: the receipt time in TimingHealth.h units.
  static std::string statisticsObject(const std::string& interfaceName, uint64_t when,
                                      const BusReport& report);

 private:
  void write(const std::string& line);

  ViewOptions view_;
  std::FILE* out_;
  std::FILE* err_;
  std::function<uint64_t()> clock_;
  bool failed_ = false;
};

// `text` as a JSON string literal, quotes included.
std::string JsonString(const std::string& text);

}  // namespace kvmon
