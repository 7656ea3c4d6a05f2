// Text lines of records and statistics, written and flushed one report at a time.
#include "host/kvmon/PlainLines.h"

#include <cstdio>

namespace kvmon {
namespace {

std::string Dashed(std::string text) {
  for (char& c : text) {
    if (c == ' ') c = '-';
  }
  return text;
}

std::string BusExtras(const SourceModel& source, const kvhost::IdentifierRecord& r) {
  char text[96];
  if (source.bus() == Bus::kLin) {
    if (!source.checksums()) return " checksum=-";
    std::snprintf(text, sizeof text, " checksum=%02X", r.checksum & 0xFF);
  } else if (source.bus() == Bus::kFlexRay) {
    std::snprintf(text, sizeof text, " cycle=%u%s%s", r.cycle, r.startup ? " startup" : "",
                  r.sync ? " sync" : "");
  } else {
    text[0] = '\0';
  }
  return text;
}

std::string Milliseconds(const char* name, const std::optional<double>& value) {
  if (!value) return std::string(" ") + name + "=-";
  char text[48];
  std::snprintf(text, sizeof text, " %s=%.3fms", name, *value);
  return text;
}

}  // namespace

std::string PlainLines::recordLine(const ShownRow& shown, bool withTiming) {
  const SourceModel& source = *shown.source;
  const kvhost::IdentifierRecord& r = shown.row->record;
  const Bus bus = source.bus();
  std::string line = UnixTimeText(r.lastTimestamp) + " " + source.interfaceName() + " " +
                     IdentifierText(bus, r) + " " + FrameTypeName(bus, r.type) + " [" +
                     std::to_string(r.payloadLength) + "]";
  if (!r.payload.empty()) line += " " + HexBytes(r.payload, " ");
  line += " count=" + std::to_string(r.count);
  if (const auto period = PeriodMs(r)) {
    char text[40];
    std::snprintf(text, sizeof text, " period=%.3fms", *period);
    line += text;
  }
  if (r.echo & 0x80) line += " echo";
  line += BusExtras(source, r);
  if (withTiming) {
    line += Milliseconds("mean", shown.timing.meanMs) +
            Milliseconds("jitter", shown.timing.jitterMs) +
            Milliseconds("min", shown.timing.minGapMs) + Milliseconds("max", shown.timing.maxGapMs);
  }
  return shown.timing.overdue ? line + " overdue" : line;
}

std::string PlainLines::statisticsLine(const std::string& interfaceName, const std::string& when,
                                       const BusReport& report) {
  std::string line = when + " " + interfaceName + " statistics";
  for (const auto& count : report.frames)
    line += " " + count.name + "=" + std::to_string(count.perSecond) + "/s";
  if (report.busLoad) line += " load=" + PercentText(*report.busLoad) + "%";
  if (report.peakLoad) line += " peak=" + PercentText(*report.peakLoad) + "%";
  for (const auto& value : report.state)
    line += " " + Dashed(value.name) + "=" + Dashed(value.text);
  if (report.faultCode != 0) line += " fault=" + std::to_string(report.faultCode);
  return line;
}

void PlainLines::showRecords(const SourceModel& source, size_t firstRow) {
  for (const auto& shown : SelectMessageRows(source, firstRow, view_))
    write(recordLine(shown, view_.timing));
  if (std::fflush(out_) != 0) failed_ = true;
}

void PlainLines::showStatistics(const SourceModel& source) {
  if (!source.report()) return;
  write(statisticsLine(source.interfaceName(), UnixTimeText(clock_()), *source.report()));
  if (std::fflush(out_) != 0) failed_ = true;
}

void PlainLines::showNotice(const std::string& words) {
  std::fprintf(err_, "kvmon: %s\n", words.c_str());
}

void PlainLines::write(const std::string& line) {
  if (failed_) return;
  if (std::fputs(line.c_str(), out_) < 0 || std::fputc('\n', out_) == EOF) failed_ = true;
}

}  // namespace kvmon
