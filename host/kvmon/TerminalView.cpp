// Drawing the live table: fixed columns first, the payload last so a narrow window cuts it.
#include "host/kvmon/TerminalView.h"

#include <algorithm>
#include <cstdint>
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
constexpr int kInterfaceWidth = 9;
constexpr int kMarkRoom = 6;  // " +2047": the count of payload bytes cut off
constexpr char kKeysHelp[] =
    "q quit  space pause  c clear  s sort  t timing  arrows scroll  ! overdue  * sent here";

std::string Columns(int idWidth, const std::string& id, const std::string& type,
                    const std::string& length, const std::string& count, const std::string& rest) {
  char text[160];
  std::snprintf(text, sizeof text, "%-*s %-7s %4s %10s %s", idWidth, id.c_str(), type.c_str(),
                length.c_str(), count.c_str(), rest.c_str());
  return text;
}

std::string Ms(const std::optional<double>& value, int width) {
  char text[40];
  if (value) {
    std::snprintf(text, sizeof text, "%*.*f", width, *value < 100 ? 2 : 1, *value);
  } else {
    std::snprintf(text, sizeof text, "%*s", width, "-");
  }
  return text;
}

// `text` (without escape sequences) cut to the window's width, leaving the last column free.
std::string Fit(std::string text, int columns) {
  const size_t width = static_cast<size_t>(std::max(columns - 1, 10));
  if (text.size() > width) text.resize(width);
  return text;
}

}  // namespace

TerminalView::TerminalView(std::vector<const SourceModel*> sources, std::string title,
                           ViewOptions view, std::FILE* out, std::function<TerminalSize()> size)
    : sources_(std::move(sources)),
      title_(std::move(title)),
      view_(std::move(view)),
      out_(out),
      size_(std::move(size)) {}

int TerminalView::idWidth() const {
  for (const SourceModel* source : sources_) {
    if (source->bus() == Bus::kFlexRay) return 11;  // "slot 2047 B"
  }
  return 9;
}

std::string TerminalView::timingText(const ShownRow& row) const {
  const Timing& t = row.timing;
  return Ms(t.meanMs, 9) + " " + Ms(t.jitterMs, 9) + " " + Ms(t.minGapMs, 9) + " " +
         Ms(t.maxGapMs, 9) + (t.overdue ? " !" : "");
}

std::string TerminalView::payloadText(const LiveRow& row, int room) const {
  const auto& payload = row.record.payload;
  const bool narrow = room < kMarkRoom + 2;  // not even one byte and the mark
  size_t shown = payload.size();
  if (!narrow && shown * 3 > static_cast<size_t>(room + 1))
    shown = static_cast<size_t>((room + 1 - kMarkRoom) / 3);
  std::string text;
  for (size_t i = 0; i < shown; ++i) {
    if (i > 0) text += ' ';
    const std::string hex = HexBytes({payload[i]}, "");
    text += row.changed[i] && !narrow ? std::string(kChanged) + hex + kReset : hex;
  }
  if (shown < payload.size()) text += " +" + std::to_string(payload.size() - shown);
  return text;
}

std::string TerminalView::rowLine(const ShownRow& shown, int columns) const {
  const auto& r = shown.row->record;
  const Bus bus = shown.source->bus();
  std::string line;
  if (sources_.size() > 1) {
    char name[32];
    std::snprintf(name, sizeof name, "%-*.*s ", kInterfaceWidth, kInterfaceWidth,
                  shown.source->interfaceName().c_str());
    line = name;
  }
  const std::string type = FrameTypeName(bus, r.type) + ((r.echo & 0x80) ? "*" : "");
  if (view_.timing) {
    line += Columns(idWidth(), IdentifierText(bus, r), type, std::to_string(r.payloadLength),
                    std::to_string(r.count), timingText(shown));
    return Fit(line, columns);
  }
  char periodText[48] = "-";
  if (const auto period = PeriodMs(r))
    std::snprintf(periodText, sizeof periodText, "%.1f", *period);
  char periodColumn[64];
  std::snprintf(periodColumn, sizeof periodColumn, "%9s%c ", periodText,
                shown.timing.overdue ? '!' : ' ');
  line += Columns(idWidth(), IdentifierText(bus, r), type, std::to_string(r.payloadLength),
                  std::to_string(r.count), periodColumn);
  const int room = columns - 1 - static_cast<int>(line.size());
  const std::string payload = payloadText(*shown.row, room);
  return room < kMarkRoom + 2 ? Fit(line + payload, columns) : line + payload;
}

std::string TerminalView::headerLine(int width) const {
  std::string line = sources_.size() > 1 ? std::string("Interface ") : std::string();
  const std::string rest =
      view_.timing ? "  Mean ms Jitter ms    Min ms    Max ms" : " Period ms  Data";
  return Fit(line + Columns(idWidth(), "ID", "Type", "Len", "Count", rest), width);
}

std::string TerminalView::titleLine(size_t shown) const {
  size_t rows = 0;
  for (const SourceModel* source : sources_) rows += source->table().rows().size();
  std::string line = "kvmon  " + title_ + "   " + std::to_string(rows) + " identifiers";
  if (shown != rows) line += ", " + std::to_string(shown) + " shown";
  if (!view_.filter.empty()) line += "   filter " + view_.filter.text();
  if (view_.changedOnly) line += "   changed only";
  if (view_.sort != SortOrder::kIdentifier)
    line += std::string("   by ") + SortOrderName(view_.sort);
  if (transmit_) {
    const auto sent = transmit_->source->echoCount(transmit_->identifier, transmit_->type);
    line += "   sending " + transmit_->text + ": " +
            (sent ? std::to_string(*sent) + " sent" : "no echo yet");
  }
  if (paused_) line += "   PAUSED";
  return line;
}

std::vector<std::string> TerminalView::statisticsLines(int width) const {
  std::vector<std::string> lines;
  for (const SourceModel* source : sources_) {
    const std::string prefix = sources_.size() > 1 ? source->interfaceName() + "  " : "";
    const auto& report = source->report();
    if (!report) {
      lines.push_back(Fit(prefix + "waiting for the first statistics report", width));
      continue;
    }
    std::string rates = prefix + BusName(report->bus);
    for (const auto& count : report->frames)
      rates += "  " + count.name + " " + std::to_string(count.perSecond) + "/s";
    if (report->busLoad) rates += "   load " + PercentText(*report->busLoad) + " %";
    if (report->peakLoad) rates += "  peak " + PercentText(*report->peakLoad) + " %";
    std::string state = prefix + "bus";
    for (const auto& value : report->state) {
      state += (state.size() == prefix.size() + 3 ? " " : "  ") +
               (value.label.empty() ? value.text : value.label + " " + value.text);
    }
    if (report->faultCode != 0) state += "  fault " + std::to_string(report->faultCode);
    lines.push_back(Fit(rates, width));
    lines.push_back(Fit(state, width));
  }
  return lines;
}

size_t TerminalView::rowRoom(TerminalSize size) const {
  // Title, column names, two statistics lines per source, the notice line and one spare.
  const int around = 2 + 2 * static_cast<int>(sources_.size()) + 2;
  return static_cast<size_t>(std::max(size.rows - around, 1));
}

size_t TerminalView::lastScroll(size_t rows, TerminalSize size) const {
  const size_t room = rowRoom(size);
  return rows > room ? rows - (room - 1) : 0;
}

std::vector<std::string> TerminalView::lines(TerminalSize size) const {
  const auto rows = SelectRows(sources_, view_);
  const auto statistics = statisticsLines(size.columns);
  std::vector<std::string> lines;
  lines.push_back(kBold + Fit(titleLine(rows.size()), size.columns) + kReset);
  lines.push_back(headerLine(size.columns));
  const size_t room = rowRoom(size);
  const size_t first = std::min(scroll_, lastScroll(rows.size(), size));
  const size_t shown = rows.size() - first <= room ? rows.size() - first : room - 1;
  if (first > 0) lines.back() += "   (" + std::to_string(first) + " above)";
  for (size_t i = first; i < first + shown; ++i) lines.push_back(rowLine(rows[i], size.columns));
  if (first + shown < rows.size())
    lines.push_back("... " + std::to_string(rows.size() - first - shown) + " more identifiers");
  if (rows.empty()) lines.push_back("waiting for the first identifier report");
  lines.insert(lines.end(), statistics.begin(), statistics.end());
  lines.push_back(Fit(notice_.empty() ? kKeysHelp : notice_, size.columns));
  return lines;
}

void TerminalView::draw(bool evenPaused) {
  if (failed_ || (paused_ && !evenPaused)) return;
  std::string screen;
  if (!started_) screen = std::string(kHideCursor) + kClearScreen;
  started_ = true;
  screen += kHome;
  const auto shown = lines(size_ ? size_() : TerminalSize{});
  for (size_t i = 0; i < shown.size(); ++i) {
    screen += shown[i] + kClearLineEnd;
    if (i + 1 < shown.size()) screen += '\n';
  }
  screen += kClearBelow;
  if (std::fwrite(screen.data(), 1, screen.size(), out_) != screen.size() || std::fflush(out_) != 0)
    failed_ = true;
}

KeyAction TerminalView::handleKey(Key key) {
  const TerminalSize size = size_ ? size_() : TerminalSize{};
  const size_t page = std::max<size_t>(rowRoom(size) / 2, 1);
  switch (key) {
    case Key::kQuit:
      return KeyAction::kQuit;
    case Key::kClear:
      notice_.clear();
      scroll_ = 0;
      return KeyAction::kClear;
    case Key::kPause:
      paused_ = !paused_;
      break;
    case Key::kSort:
      view_.sort = NextSortOrder(view_.sort);
      break;
    case Key::kTiming:
      view_.timing = !view_.timing;
      break;
    case Key::kUp:
      scroll_ = scroll_ > 0 ? scroll_ - 1 : 0;
      break;
    case Key::kDown:
      ++scroll_;
      break;
    case Key::kPageUp:
      scroll_ = scroll_ > page ? scroll_ - page : 0;
      break;
    case Key::kPageDown:
      scroll_ += page;
      break;
    case Key::kHome:
      scroll_ = 0;
      break;
    case Key::kEnd:
      scroll_ = SIZE_MAX;
      break;
  }
  scroll_ = std::min(scroll_, lastScroll(SelectRows(sources_, view_).size(), size));
  draw(true);  // a paused table shows that it is paused, and is scrolled as it stands
  return KeyAction::kNone;
}

void TerminalView::showRecords(const SourceModel&, size_t) { draw(); }

void TerminalView::showStatistics(const SourceModel&) { draw(); }

void TerminalView::showNotice(const std::string& words) {
  notice_ = words;
  draw();
}

void TerminalView::close() {
  if (!started_) return;
  std::fprintf(out_, "%s\n", kShowCursor);
  std::fflush(out_);
}

}  // namespace kvmon
