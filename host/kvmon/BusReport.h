// A statistics message decoded for people: frame rates by kind, bus load and the driver's state
// word in words, the same for every display.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "host/kvmon/FrameNames.h"

namespace kvmon {

struct NamedCount {
  std::string name;  // "standard", "extended", "remote", "error", "data", "null", "no-resp"
  uint32_t perSecond = 0;
  uint32_t total = 0;
};

struct NamedValue {
  std::string name;   // machine name: "state", "last_error", "tec", ...
  std::string label;  // for people: "TEC"; empty when the value speaks for itself
  std::string text;   // the value in words or digits
  bool numeric = false;
};

struct BusReport {
  Bus bus = Bus::kCan;
  std::vector<NamedCount> frames;
  std::optional<uint32_t> busLoad;   // 0.01 % units (CAN only)
  std::optional<uint32_t> peakLoad;  // 0.01 % units (CAN only)
  uint32_t faultCode = 0;
  std::vector<NamedValue> state;  // the state word decoded, most important first
};

// nullopt when the payload is none of the three statistics blocks.
std::optional<BusReport> DecodeBusReport(const std::vector<uint8_t>& payload);

// "12.34" for 1234 hundredths of a percent.
std::string PercentText(uint32_t hundredths);

}  // namespace kvmon
