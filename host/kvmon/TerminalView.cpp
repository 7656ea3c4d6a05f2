// Drawing the live table: fixed columns first, the payload last so a narrow window cuts it.
#include "host/kvmon/TerminalView.h"

#include <algorithm>
#include <cstdio>

namespace kvmon {
namespace {

constexpr char kHome[] = "\x1b[H";
constexpr char kClearScreen[] = "\x1b[2J";
constexpr char kClearLineEnd[] = "\x1b[K";
constexpr char kClearBelow[] = "\x1b[J";
constexpr char kHideCursor[] = "\x1b[?25l";
constexpr char kShowCursor[] = "\x1b[?25h";
constexpr char kBold[] = "\x1b[1m";
constexpr char kChanged[] = "\x1b[1;31m";
constexpr char kReset[] = "\x1b[0m";
// ID, type, length, count and period columns, with their blanks; the payload takes the rest.
constexpr int kFixedColumns = 9 + 1 + 7 + 1 + 4 + 1 + 10 + 1 + 10 + 2;
constexpr int kLinesAroundRows = 6;  // title, column names, two statistics lines, notice, spare

std::string Columns(const std::string& id, const std::string& type, const std::string& length,
                    const std::string& count, const std::string& period) {
  char text[128];
  std::snprintf(text, sizeof text, "%-9s %-7s %4s %10s %10s  ", id.c_str(), type.c_str(),
                length.c_str(), count.c_str(), period.c_str());
  return text;
}

std::string PeriodText(const kvhost::IdentifierRecord& record) {
  const auto period = PeriodMs(record);
  if (!period) return "-";
  char text[32];
  std::snprintf(text, sizeof text, "%.1f", *period);
  return text;
}

// `text` (without escape sequences) cut to the window's width, leaving the last column free.
std::string Fit(std::string text, int columns) {
  const size_t width = static_cast<size_t>(std::max(columns - 1, 10));
  if (text.size() > width) text.resize(width);
  return text;
}

}  // namespace

TerminalView::TerminalView(Bus bus, std::string title, std::FILE* out,
                           std::function<TerminalSize()> size)
    : table_(bus), title_(std::move(title)), out_(out), size_(std::move(size)) {}

std::string TerminalView::RowLine(const LiveRow& row, int columns) const {
  const auto& r = row.record;
  std::string line =
      Columns(IdentifierText(table_.bus(), r), FrameTypeName(table_.bus(), r.type),
              std::to_string(r.payloadLength), std::to_string(r.count), PeriodText(r));
  // The payload gets the columns left of the last one; a cut payload ends in "+N" (at most "
  // +2047").
  constexpr int kMarkRoom = 6;
  constexpr int kLeastRoom = kMarkRoom + 2;  // one byte and the mark
  const int room = columns - 1 - kFixedColumns;
  const bool narrow = room < kLeastRoom;  // plain text, cut at the window's edge
  size_t shown = r.payload.size();
  if (narrow || shown * 3 > static_cast<size_t>(room + 1)) {
    shown = narrow ? shown : static_cast<size_t>((room + 1 - kMarkRoom) / 3);
  }
  for (size_t i = 0; i < shown; ++i) {
    if (i > 0) line += ' ';
    const std::string hex = HexBytes({r.payload[i]}, "");
    line += row.changed[i] && !narrow ? std::string(kChanged) + hex + kReset : hex;
  }
  if (shown < r.payload.size()) line += " +" + std::to_string(r.payload.size() - shown);
  return narrow ? Fit(line, columns) : line;
}

std::string TerminalView::RatesLine() const {
  if (!report_) return "waiting for the first statistics report";
  std::string line = BusName(report_->bus);
  for (const auto& count : report_->frames)
    line += "  " + count.name + " " + std::to_string(count.perSecond) + "/s";
  if (report_->busLoad) line += "   load " + PercentText(*report_->busLoad) + " %";
  if (report_->peakLoad) line += "  peak " + PercentText(*report_->peakLoad) + " %";
  return line;
}

std::string TerminalView::StateLine() const {
  if (!report_) return "";
  std::string line = "bus";
  for (const auto& value : report_->state) {
    line += (line.size() == 3 ? " " : "  ") +
            (value.label.empty() ? value.text : value.label + " " + value.text);
  }
  if (report_->faultCode != 0) line += "  fault " + std::to_string(report_->faultCode);
  return line;
}

std::vector<std::string> TerminalView::Lines(TerminalSize size) const {
  const auto& rows = table_.rows();
  std::vector<std::string> lines;
  const int width = size.columns;
  lines.push_back(kBold +
                  Fit("kvmon  " + title_ + "   " + std::to_string(rows.size()) +
                          " identifiers   Ctrl-C ends the session",
                      width) +
                  kReset);
  lines.push_back(Fit(Columns("ID", "Type", "Len", "Count", "Period ms") + "Data", width));
  const size_t room = static_cast<size_t>(std::max(size.rows - kLinesAroundRows, 1));
  const size_t shown = rows.size() <= room ? rows.size() : room - 1;
  for (size_t i = 0; i < shown; ++i) lines.push_back(RowLine(rows[i], size.columns));
  if (shown < rows.size())
    lines.push_back("... " + std::to_string(rows.size() - shown) + " more identifiers");
  if (rows.empty()) lines.push_back("waiting for the first identifier report");
  lines.push_back(Fit(RatesLine(), width));
  lines.push_back(Fit(StateLine(), width));
  lines.push_back(Fit(notice_, width));
  return lines;
}

void TerminalView::Draw() {
  if (failed_) return;
  std::string screen;
  if (!started_) screen = std::string(kHideCursor) + kClearScreen;
  started_ = true;
  screen += kHome;
  const auto lines = Lines(size_ ? size_() : TerminalSize{});
  for (size_t i = 0; i < lines.size(); ++i) {
    screen += lines[i] + kClearLineEnd;
    if (i + 1 < lines.size()) screen += '\n';
  }
  screen += kClearBelow;
  if (std::fwrite(screen.data(), 1, screen.size(), out_) != screen.size() || std::fflush(out_) != 0)
    failed_ = true;
}

void TerminalView::ShowRecords(Bus, const std::vector<kvhost::IdentifierRecord>& records,
                               size_t messageBytes) {
  table_.Update(records, messageBytes);
  Draw();
}

void TerminalView::ShowStatistics(const BusReport& report) {
  report_ = report;
  Draw();
}

void TerminalView::ShowNotice(const std::string& words) {
  notice_ = words;
  Draw();
}

void TerminalView::Close() {
  if (!started_) return;
  std::fprintf(out_, "%s\n", kShowCursor);
  std::fflush(out_);
}

}  // namespace kvmon
