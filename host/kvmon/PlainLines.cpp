// Text lines of records and statistics, written and flushed one report at a time.
#include "host/kvmon/PlainLines.h"

#include <chrono>
#include <cstdio>

namespace kvmon {
namespace {

std::string Dashed(std::string text) {
  for (char& c : text) {
    if (c == ' ') c = '-';
  }
  return text;
}

std::string BusExtras(Bus bus, const kvhost::IdentifierRecord& r) {
  char text[96];
  if (bus == Bus::kLin) {
    std::snprintf(text, sizeof text, " checksum=%02X", r.checksum & 0xFF);
  } else if (bus == Bus::kFlexRay) {
    std::snprintf(text, sizeof text, " cycle=%u%s%s", r.cycle, r.startup ? " startup" : "",
                  r.sync ? " sync" : "");
  } else {
    text[0] = '\0';
  }
  return text;
}

}  // namespace

std::string NowText() {
  const auto micros = std::chrono::duration_cast<std::chrono::microseconds>(
                          std::chrono::system_clock::now().time_since_epoch())
                          .count();
  char text[40];
  std::snprintf(text, sizeof text, "%lld.%06lld", static_cast<long long>(micros / 1000000),
                static_cast<long long>(micros % 1000000));
  return text;
}

std::string PlainLines::RecordLine(const std::string& interfaceName, Bus bus,
                                   const kvhost::IdentifierRecord& r) {
  std::string line = UnixTimeText(r.lastTimestamp) + " " + interfaceName + " " +
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
  return line + BusExtras(bus, r);
}

std::string PlainLines::StatisticsLine(const std::string& interfaceName, const std::string& when,
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

void PlainLines::ShowRecords(Bus bus, const std::vector<kvhost::IdentifierRecord>& records,
                             size_t) {
  for (const auto& record : records) Write(RecordLine(interfaceName_, bus, record));
  if (std::fflush(out_) != 0) failed_ = true;
}

void PlainLines::ShowStatistics(const BusReport& report) {
  Write(StatisticsLine(interfaceName_, NowText(), report));
  if (std::fflush(out_) != 0) failed_ = true;
}

void PlainLines::ShowNotice(const std::string& words) {
  std::fprintf(err_, "kvmon: %s\n", words.c_str());
}

void PlainLines::Write(const std::string& line) {
  if (failed_) return;
  if (std::fputs(line.c_str(), out_) < 0 || std::fputc('\n', out_) == EOF) failed_ = true;
}

}  // namespace kvmon
