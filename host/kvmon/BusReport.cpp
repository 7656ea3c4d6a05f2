// Statistics blocks of CAN, LIN and FlexRay turned into rates, load and state words.
#include "host/kvmon/BusReport.h"

#include <cstdio>

#include "host/RecordDecoder.h"

namespace kvmon {
namespace {

const char* Pick(const char* const* names, size_t count, uint32_t value) {
  return value < count ? names[value] : nullptr;
}

std::string Word(const char* const* names, size_t count, uint32_t value) {
  if (const char* name = Pick(names, count, value)) return name;
  return "code " + std::to_string(value);
}

NamedValue Words(const char* name, const char* label, std::string text) {
  return NamedValue{name, label, std::move(text), false};
}

NamedValue Number(const char* name, const char* label, uint32_t value) {
  return NamedValue{name, label, std::to_string(value), true};
}

BusReport CanReport(const kvhost::CanStatisticsView& s) {
  static const char* const kStates[] = {"error active", "error passive", "bus off", "stopped"};
  static const char* const kErrors[] = {"none", "stuff", "form", "acknowledge"};
  BusReport report;
  report.bus = Bus::kCan;
  report.frames = {{"standard", s.standardFramesPerSecond, s.standardFrames},
                   {"extended", s.extendedFramesPerSecond, s.extendedFrames},
                   {"remote", s.remoteFramesPerSecond, s.remoteFrames},
                   {"error", s.errorFramesPerSecond, s.errorFrames}};
  report.busLoad = s.busLoad;
  report.peakLoad = s.peakBusLoad;
  report.faultCode = s.faultCode;
  report.state = {Words("state", "", Word(kStates, 4, s.stateBits0to3)),
                  Number("tec", "TEC", s.stateBits16to23), Number("rec", "REC", s.stateBits24to31),
                  Words("last_error", "last error", Word(kErrors, 4, s.stateBits8to11))};
  if (s.stateBit4) report.state.push_back(Words("transceiver", "", "transceiver fault"));
  if (s.stateBit5) report.state.push_back(Words("sleep", "", "sleeping"));
  return report;
}

BusReport LinReport(const kvhost::LinStatisticsView& s) {
  static const char* const kActivity[] = {"idle", "active", "inactive"};
  static const char* const kErrors[] = {"none", "bit rate", "no response"};
  BusReport report;
  report.bus = Bus::kLin;
  report.frames = {{"data", s.dataFramesPerSecond, s.dataFrames},
                   {"no-resp", s.noResponseFramesPerSecond, s.noResponseFrames},
                   {"error", s.errorFramesPerSecond, s.errorFrames}};
  report.faultCode = s.faultCode;
  report.state = {
      Words("state", "", s.stateBit31 ? "stopped" : Word(kActivity, 3, s.stateBits2to3)),
      Words("last_error", "last error", Word(kErrors, 3, s.stateBits4to7))};
  if (s.stateBits4to7 != 0) {
    char id[8];
    std::snprintf(id, sizeof id, "%02X", s.stateBits8to15);
    report.state.push_back(Words("last_error_id", "on identifier", id));
  }
  if (s.stateBit1) report.state.push_back(Words("sleep", "", "sleeping"));
  return report;
}

std::string ChannelsText(uint32_t word) {
  if ((word & 3) == 3) return "A+B";
  if (word & 1) return "A";
  if (word & 2) return "B";
  return "none";
}

BusReport FlexRayReport(const kvhost::FlexRayStatisticsView& s) {
  static const char* const kStates[] = {"config", "code 1", "normal active", "code 3",
                                        "code 4", "code 5", "startup"};
  BusReport report;
  report.bus = Bus::kFlexRay;
  report.frames = {{"data", s.dataFramesPerSecond, s.dataFrames},
                   {"null", s.nullFramesPerSecond, s.nullFrames}};
  report.faultCode = s.faultCode;
  report.state = {Words("state", "", Word(kStates, 7, s.stateBits0to3)),
                  Number("sync_frames", "sync frames", s.stateBits8to12),
                  Words("channels", "channels", ChannelsText(s.lastStateWord)),
                  Number("cycle", "cycle", s.statisticsWords[5]),
                  Number("syntax_errors", "syntax errors", s.statisticsWords[3]),
                  Number("content_errors", "content errors", s.statisticsWords[4])};
  return report;
}

}  // namespace

std::optional<BusReport> DecodeBusReport(const std::vector<uint8_t>& payload) {
  if (auto can = kvhost::DecodeCanStatistics(payload)) return CanReport(*can);
  if (auto lin = kvhost::DecodeLinStatistics(payload)) return LinReport(*lin);
  if (auto flexRay = kvhost::DecodeFlexRayStatistics(payload)) return FlexRayReport(*flexRay);
  return std::nullopt;
}

std::string PercentText(uint32_t hundredths) {
  char text[24];
  std::snprintf(text, sizeof text, "%u.%02u", hundredths / 100, hundredths % 100);
  return text;
}

}  // namespace kvmon
