// kvmon's live terminal table: the identifiers of the session updated in place, changed payload
// bytes highlighted, with the statistics line below.
#pragma once

#include <cstdio>
#include <functional>
#include <optional>
#include <string>

#include "host/kvmon/Display.h"
#include "host/kvmon/LiveTable.h"

namespace kvmon {

struct TerminalSize {
  int columns = 80;
  int rows = 24;
};

// Draws with ANSI escape sequences on `out`, which must be a terminal; `size` is asked before
// every drawing (the window may have changed).
class TerminalView : public Display {
 public:
  TerminalView(Bus bus, std::string title, std::FILE* out, std::function<TerminalSize()> size);

  void ShowRecords(Bus bus, const std::vector<kvhost::IdentifierRecord>& records,
                   size_t messageBytes) override;
  void ShowStatistics(const BusReport& report) override;
  void ShowNotice(const std::string& words) override;
  void Close() override;
  bool failed() const override { return failed_; }

  // The screen's lines without escape sequences other than the highlighting, for `size`.
  std::vector<std::string> Lines(TerminalSize size) const;

 private:
  void Draw();
  std::string RowLine(const LiveRow& row, int columns) const;
  std::string RatesLine() const;
  std::string StateLine() const;

  LiveTable table_;
  std::string title_;
  std::optional<BusReport> report_;
  std::string notice_;
  std::FILE* out_;
  std::function<TerminalSize()> size_;
  bool started_ = false;
  bool failed_ = false;
};

}  // namespace kvmon
