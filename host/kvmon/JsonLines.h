// kvmon's machine format: one JSON object per line for each identifier record and statistics
// report.
#pragma once

#include <cstdio>
#include <string>

#include "host/kvmon/Display.h"

namespace kvmon {

// Objects such as
//   {"kind":"record","interface":"CAN1","bus":"CAN","id":256,"extended":false,"type":"data",
//    "type_code":0,"length":8,"data":"2A01020304050607","count":1234,"period_ms":10.0,
//    "timestamp":133400000000000000,"echo":false}
//   {"kind":"statistics","interface":"CAN1","bus":"CAN","per_second":{"standard":100,...},
//    "totals":{...},"bus_load":12.34,"peak_load":13.0,"state":"error active","tec":0,...}
// Notices go to `err` as plain text.
class JsonLines : public Display {
 public:
  JsonLines(std::string interfaceName, std::FILE* out, std::FILE* err)
      : interfaceName_(std::move(interfaceName)), out_(out), err_(err) {}

  void ShowRecords(Bus bus, const std::vector<kvhost::IdentifierRecord>& records,
                   size_t messageBytes) override;
  void ShowStatistics(const BusReport& report) override;
  void ShowNotice(const std::string& words) override;
  bool failed() const override { return failed_; }

  static std::string RecordObject(const std::string& interfaceName, Bus bus,
                                  const kvhost::IdentifierRecord& record);
  static std::string StatisticsObject(const std::string& interfaceName, const BusReport& report);

 private:
  void Write(const std::string& line);

  std::string interfaceName_;
  std::FILE* out_;
  std::FILE* err_;
  bool failed_ = false;
};

// `text` as a JSON string literal, quotes included.
std::string JsonString(const std::string& text);

}  // namespace kvmon
