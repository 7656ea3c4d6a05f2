// JSON objects of records and statistics, one per line, flushed one report at a time.
#include "host/kvmon/JsonLines.h"

#include <cstdio>

namespace kvmon {
namespace {

std::string Field(const char* name, const std::string& jsonValue) {
  return std::string(",\"") + name + "\":" + jsonValue;
}

std::string Bool(bool value) { return value ? "true" : "false"; }

std::string BusFields(Bus bus, const kvhost::IdentifierRecord& r) {
  if (bus == Bus::kLin)
    return Field("checksum", std::to_string(r.checksum)) + Field("flag", std::to_string(r.flag));
  if (bus != Bus::kFlexRay) return "";
  return Field("channel", JsonString(std::string(1, ChannelName(r)))) +
         Field("cycle", std::to_string(r.cycle)) + Field("startup", Bool(r.startup)) +
         Field("sync", Bool(r.sync)) + Field("preamble", Bool(r.preamble));
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

std::string Percent(uint32_t hundredths) {
  char text[24];
  std::snprintf(text, sizeof text, "%.2f", hundredths / 100.0);
  return text;
}

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

std::string JsonLines::RecordObject(const std::string& interfaceName, Bus bus,
                                    const kvhost::IdentifierRecord& r) {
  std::string object = "{\"kind\":\"record\"" + Field("interface", JsonString(interfaceName)) +
                       Field("bus", JsonString(BusName(bus))) +
                       Field("id", std::to_string(PlainIdentifier(bus, r))) +
                       Field("extended", Bool(IsExtended(bus, r))) +
                       Field("type", JsonString(FrameTypeName(bus, r.type))) +
                       Field("type_code", std::to_string(r.type)) +
                       Field("length", std::to_string(r.payloadLength)) +
                       Field("data", JsonString(HexBytes(r.payload, ""))) +
                       Field("count", std::to_string(r.count));
  if (const auto period = PeriodMs(r)) {
    char text[40];
    std::snprintf(text, sizeof text, "%.4f", *period);
    object += Field("period_ms", text);
  } else {
    object += Field("period_ms", "null");
  }
  object += Field("timestamp", std::to_string(r.lastTimestamp)) +
            Field("echo", Bool((r.echo & 0x80) != 0));
  return object + BusFields(bus, r) + "}";
}

std::string JsonLines::StatisticsObject(const std::string& interfaceName, const BusReport& report) {
  std::string object = "{\"kind\":\"statistics\"" + Field("interface", JsonString(interfaceName)) +
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

void JsonLines::ShowRecords(Bus bus, const std::vector<kvhost::IdentifierRecord>& records, size_t) {
  for (const auto& record : records) Write(RecordObject(interfaceName_, bus, record));
  if (std::fflush(out_) != 0) failed_ = true;
}

void JsonLines::ShowStatistics(const BusReport& report) {
  Write(StatisticsObject(interfaceName_, report));
  if (std::fflush(out_) != 0) failed_ = true;
}

void JsonLines::ShowNotice(const std::string& words) {
  std::fprintf(err_, "kvmon: %s\n", words.c_str());
}

void JsonLines::Write(const std::string& line) {
  if (failed_) return;
  if (std::fputs(line.c_str(), out_) < 0 || std::fputc('\n', out_) == EOF) failed_ = true;
}

}  // namespace kvmon
