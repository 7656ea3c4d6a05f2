// JSON objects of records and statistics, one per line, flushed one report at a time.
#include "host/kvmon/JsonLines.h"

#include <cstdio>

namespace kvmon {
namespace {

std::string Field(const char* name, const std::string& jsonValue) {
  return std::string(",\"") + name + "\":" + jsonValue;
}

std::string Bool(bool value) { return value ? "true" : "false"; }

std::string Number(const std::optional<double>& value, const char* format = "%.4f") {
  if (!value) return "null";
  char text[48];
  std::snprintf(text, sizeof text, format, *value);
  return text;
}

std::string BusFields(const SourceModel& source, const kvhost::IdentifierRecord& r) {
  if (source.bus() == Bus::kLin) {
    return Field("checksum", source.checksums() ? std::to_string(r.checksum & 0xFF) : "null") +
           Field("flag", std::to_string(r.flag));
  }
  if (source.bus() != Bus::kFlexRay) return "";
  return Field("channel", JsonString(std::string(1, ChannelName(r)))) +
         Field("cycle", std::to_string(r.cycle)) + Field("startup", Bool(r.startup)) +
         Field("sync", Bool(r.sync)) + Field("preamble", Bool(r.preamble));
}

std::string TimingFields(const Timing& t) {
  return Field("mean_period_ms", Number(t.meanMs)) + Field("jitter_ms", Number(t.jitterMs)) +
         Field("min_gap_ms", Number(t.minGapMs)) + Field("max_gap_ms", Number(t.maxGapMs)) +
         Field("overdue", Bool(t.overdue));
}

std::string Counts(const BusReport& report, bool perSecond) {
  std::string object = "{";
  for (const auto& count : report.frames) {
    if (object.size() > 1) object += ",";
    object +=
        JsonString(count.name) + ":" + std::to_string(perSecond ? count.perSecond : count.total);
  }
  return object + "}";
}

std::string Percent(uint32_t hundredths) { return Number(hundredths / 100.0, "%.2f"); }

}  // namespace

std::string JsonString(const std::string& text) {
  std::string out = "\"";
  for (unsigned char c : text) {
    if (c == '"' || c == '\\') {
      out += '\\';
      out += static_cast<char>(c);
    } else if (c < 0x20) {
      char escaped[8];
      std::snprintf(escaped, sizeof escaped, "\\u%04x", c);
      out += escaped;
    } else {
      out += static_cast<char>(c);
    }
  }
  return out + "\"";
}

std::string JsonLines::recordObject(const ShownRow& shown) {
  const SourceModel& source = *shown.source;
  const kvhost::IdentifierRecord& r = shown.row->record;
  const Bus bus = source.bus();
  std::string object =
      "{\"kind\":\"record\"" + Field("timestamp", UnixTimeText(r.lastTimestamp)) +
      Field("interface", JsonString(source.interfaceName())) +
      Field("bus", JsonString(BusName(bus))) +
      Field("id", std::to_string(PlainIdentifier(bus, r))) +
      Field("id_text", JsonString(IdentifierText(bus, r))) +
      Field("extended", Bool(IsExtended(bus, r))) +
      Field("type", JsonString(FrameTypeName(bus, r.type))) +
      Field("type_code", std::to_string(r.type)) +
      Field("length", std::to_string(r.payloadLength)) +
      Field("data", JsonString(HexBytes(r.payload, ""))) + Field("count", std::to_string(r.count)) +
      Field("period_ms", Number(PeriodMs(r))) + Field("echo", Bool((r.echo & 0x80) != 0)) +
      Field("raw_timestamp", std::to_string(r.lastTimestamp));
  return object + BusFields(source, r) + TimingFields(shown.timing) + "}";
}

std::string JsonLines::statisticsObject(const std::string& interfaceName, uint64_t when,
                                        const BusReport& report) {
  std::string object = "{\"kind\":\"statistics\"" + Field("timestamp", UnixTimeText(when)) +
                       Field("interface", JsonString(interfaceName)) +
                       Field("bus", JsonString(BusName(report.bus))) +
                       Field("per_second", Counts(report, true)) +
                       Field("totals", Counts(report, false));
  if (report.busLoad) object += Field("bus_load", Percent(*report.busLoad));
  if (report.peakLoad) object += Field("peak_load", Percent(*report.peakLoad));
  for (const auto& value : report.state) {
    object += Field(value.name.c_str(), value.numeric ? value.text : JsonString(value.text));
  }
  return object + Field("fault", std::to_string(report.faultCode)) + "}";
}

void JsonLines::showRecords(const SourceModel& source, size_t firstRow) {
  for (const auto& shown : SelectMessageRows(source, firstRow, view_)) write(recordObject(shown));
  if (std::fflush(out_) != 0) failed_ = true;
}

void JsonLines::showStatistics(const SourceModel& source) {
  if (!source.report()) return;
  write(statisticsObject(source.interfaceName(), clock_(), *source.report()));
  if (std::fflush(out_) != 0) failed_ = true;
}

void JsonLines::showNotice(const std::string& words) {
  std::fprintf(err_, "kvmon: %s\n", words.c_str());
}

void JsonLines::write(const std::string& line) {
  if (failed_) return;
  if (std::fputs(line.c_str(), out_) < 0 || std::fputc('\n', out_) == EOF) failed_ = true;
}

}  // namespace kvmon
