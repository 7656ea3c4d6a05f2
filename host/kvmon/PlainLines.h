// kvmon's line output for scripts and logs: one text line per identifier record and per
// statistics report.
#pragma once

#include <cstdio>
#include <string>

#include "host/kvmon/Display.h"

namespace kvmon {

// Lines such as
//   1700000000.123456 CAN1 100 data [8] 2A 01 02 03 04 05 06 07 count=1234 period=10.000ms
//   1700000000.200000 CAN1 statistics standard=100/s ... load=12.34% peak=13.00% state=error-active
//   tec=0
// Notices go to `err`.
class PlainLines : public Display {
 public:
  PlainLines(std::string interfaceName, std::FILE* out, std::FILE* err)
      : interfaceName_(std::move(interfaceName)), out_(out), err_(err) {}

  void ShowRecords(Bus bus, const std::vector<kvhost::IdentifierRecord>& records,
                   size_t messageBytes) override;
  void ShowStatistics(const BusReport& report) override;
  void ShowNotice(const std::string& words) override;
  bool failed() const override { return failed_; }

  // The line of one record, without its line end.
  static std::string RecordLine(const std::string& interfaceName, Bus bus,
                                const kvhost::IdentifierRecord& record);
  // The line of one statistics report, without its line end; `when` is its receipt time text.
  static std::string StatisticsLine(const std::string& interfaceName, const std::string& when,
                                    const BusReport& report);

 private:
  void Write(const std::string& line);

  std::string interfaceName_;
  std::FILE* out_;
  std::FILE* err_;
  bool failed_ = false;
};

// The wall-clock time now as "1700000000.123456".
std::string NowText();

}  // namespace kvmon
