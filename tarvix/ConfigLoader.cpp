// Reading a hardware description from JSON.
#include "tarvix/ConfigLoader.h"

#include <fstream>
#include <map>
#include <nlohmann/json.hpp>
#include <sstream>

#include "driver/FrameTypes.h"
#include "driver/Properties.h"
#include "tarvix/FrameTiming.h"
#include "tarvix/socketcan/DeviceBinding.h"

namespace tarvix {
namespace {

using nlohmann::json;

// Thrown inside the loader only; turned into the error text at its boundary.
struct ConfigError {
  std::string text;
};

[[noreturn]] void Fail(const std::string& where, const std::string& what) {
  throw ConfigError{where + ": " + what};
}

const json* Member(const json& j, const char* key) {
  auto it = j.find(key);
  return it == j.end() ? nullptr : &*it;
}

// An unsigned integer: a JSON number or a text "0x..." / decimal.
uint64_t Unsigned(const json& v, const std::string& where, uint64_t max) {
  uint64_t value = 0;
  if (v.is_number_unsigned()) {
    value = v.get<uint64_t>();
  } else if (v.is_string()) {
    const std::string s = v.get<std::string>();
    size_t used = 0;
    try {
      value = std::stoull(s, &used, 0);
    } catch (...) {
      Fail(where, "\"" + s + "\" is not a number");
    }
    if (used != s.size()) Fail(where, "\"" + s + "\" is not a number");
  } else {
    Fail(where, "expected a non-negative integer");
  }
  if (value > max) Fail(where, "value too large (at most " + std::to_string(max) + ")");
  return value;
}

uint64_t UnsignedOr(const json& j, const char* key, const std::string& where, uint64_t max,
                    uint64_t fallback) {
  const json* v = Member(j, key);
  return v ? Unsigned(*v, where + "." + key, max) : fallback;
}

double NumberOr(const json& j, const char* key, const std::string& where, double fallback) {
  const json* v = Member(j, key);
  if (v == nullptr) return fallback;
  if (!v->is_number() || v->get<double>() < 0 || v->get<double>() > 1e9)
    Fail(where + "." + key, "expected a number >= 0");
  return v->get<double>();
}

bool BoolOr(const json& j, const char* key, const std::string& where, bool fallback) {
  const json* v = Member(j, key);
  if (v == nullptr) return fallback;
  if (!v->is_boolean()) Fail(where + "." + key, "expected true or false");
  return v->get<bool>();
}

std::string TextOr(const json& j, const char* key, const std::string& where, std::string fallback) {
  const json* v = Member(j, key);
  if (v == nullptr) return fallback;
  if (!v->is_string()) Fail(where + "." + key, "expected a text");
  return v->get<std::string>();
}

std::string RequiredText(const json& j, const char* key, const std::string& where) {
  if (Member(j, key) == nullptr) Fail(where, std::string("\"") + key + "\" is missing");
  std::string s = TextOr(j, key, where, "");
  if (s.empty()) Fail(where + "." + key, "must not be empty");
  return s;
}

const json& Array(const json& j, const char* key, const std::string& where) {
  static const json kEmpty = json::array();
  const json* v = Member(j, key);
  if (v == nullptr) return kEmpty;
  if (!v->is_array()) Fail(where + "." + key, "expected an array");
  return *v;
}

std::string Resolve(const std::string& base, const std::string& path) {
  if (path.empty() || path.front() == '/' || base.empty()) return path;
  return base + "/" + path;
}

PayloadPattern Pattern(const json& j, const std::string& where) {
  PayloadPattern p;
  std::string error;
  if (!PayloadPattern::Parse(TextOr(j, "payload", where, ""), p, error))
    Fail(where + ".payload", error);
  return p;
}

uint8_t FrameKind(const std::string& kind, const std::string& where) {
  static const std::map<std::string, uint8_t> kKinds = {{"data", driver::kFrameCanData},
                                                        {"remote", driver::kFrameCanRemote},
                                                        {"error", driver::kFrameCanBusError},
                                                        {"fd", driver::kFrameCanFdData},
                                                        {"fd_brs", driver::kFrameCanFdBrsData}};
  auto it = kKinds.find(kind);
  if (it == kKinds.end())
    Fail(where + ".kind", "\"" + kind + "\" is not one of data, remote, error, fd, fd_brs");
  return it->second;
}

PeriodicFrame Traffic(const json& j, const std::string& where) {
  if (!j.is_object()) Fail(where, "expected an object");
  PeriodicFrame f;
  f.extended = BoolOr(j, "extended", where, false);
  f.identifier = static_cast<uint32_t>(UnsignedOr(
      j, "id", where, f.extended ? driver::kExtendedIdMask : driver::kStandardIdMask, 0));
  f.type = FrameKind(TextOr(j, "kind", where, "data"), where);
  const bool fd = f.type == driver::kFrameCanFdData || f.type == driver::kFrameCanFdBrsData;
  const bool noData = f.type == driver::kFrameCanBusError || f.type == driver::kFrameCanRemote;
  f.length = static_cast<uint32_t>(
      UnsignedOr(j, "length", where, fd ? driver::kMaxCanFdPayload : 8, noData ? 0 : 8));
  if (fd) f.length = CanFdLength(f.length);
  f.periodMs = NumberOr(j, "periodMs", where, 100);
  f.offsetMs = NumberOr(j, "offsetMs", where, 0);
  f.payload = Pattern(j, where);
  return f;
}

ReplayConfig Replay(const json& j, const std::string& where, const std::string& base) {
  if (!j.is_object()) Fail(where, "expected an object");
  ReplayConfig r;
  r.file = Resolve(base, RequiredText(j, "file", where));
  r.loop = BoolOr(j, "loop", where, false);
  r.logInterface = TextOr(j, "logInterface", where, "");
  r.offsetMs = NumberOr(j, "offsetMs", where, 0);
  return r;
}

LinSlot Lin(const json& j, const std::string& where) {
  if (!j.is_object()) Fail(where, "expected an object");
  LinSlot s;
  s.identifier = static_cast<uint8_t>(UnsignedOr(j, "id", where, 0x3F, 0));
  s.response = BoolOr(j, "response", where, true);
  s.length = static_cast<uint32_t>(UnsignedOr(j, "length", where, 8, s.response ? 8 : 0));
  s.payload = Pattern(j, where);
  return s;
}

NullCycles Nulls(const std::string& text, const std::string& where) {
  static const std::map<std::string, NullCycles> kRules = {{"none", NullCycles::None},
                                                           {"odd", NullCycles::Odd},
                                                           {"even", NullCycles::Even},
                                                           {"all", NullCycles::All}};
  auto it = kRules.find(text);
  if (it == kRules.end())
    Fail(where + ".nullFrames", "\"" + text + "\" is not one of none, odd, even, all");
  return it->second;
}

FlexRaySlot Slot(const json& j, const std::string& where) {
  if (!j.is_object()) Fail(where, "expected an object");
  FlexRaySlot s;
  s.slot = static_cast<uint16_t>(UnsignedOr(j, "slot", where, 2047, 1));
  if (s.slot == 0) Fail(where + ".slot", "slots count from 1");
  const std::string channels = TextOr(j, "channels", where, "A");
  if (channels != "A" && channels != "B" && channels != "AB")
    Fail(where + ".channels", "expected A, B or AB");
  s.channelA = channels.find('A') != std::string::npos;
  s.channelB = channels.find('B') != std::string::npos;
  s.startup = BoolOr(j, "startup", where, false);
  s.sync = BoolOr(j, "sync", where, false);
  s.preamble = BoolOr(j, "preamble", where, false);
  s.length = static_cast<uint32_t>(UnsignedOr(j, "length", where, driver::kMaxCanFdPayload, 8));
  s.nullCycles = Nulls(TextOr(j, "nullFrames", where, "none"), where);
  s.payload = Pattern(j, where);
  return s;
}

driver::BusKind Protocol(const std::string& text, const std::string& where) {
  if (text == "CAN") return driver::BusKind::kCan;
  if (text == "LIN") return driver::BusKind::kLin;
  if (text == "FlexRay") return driver::BusKind::kFlexRay;
  Fail(where + ".protocol", "\"" + text + "\" is not one of CAN, LIN, FlexRay");
}

BusConfig Bus(const json& j, const std::string& where, const std::string& base) {
  if (!j.is_object()) Fail(where, "expected an object");
  BusConfig b;
  b.name = RequiredText(j, "name", where);
  b.protocol = Protocol(TextOr(j, "protocol", where, "CAN"), where);
  const uint64_t defaultRate = b.protocol == driver::BusKind::kLin       ? 19200
                               : b.protocol == driver::BusKind::kFlexRay ? 10000000
                                                                         : 500000;
  b.bitRate = UnsignedOr(j, "bitRate", where, 12000000, defaultRate);
  if (b.bitRate == 0) Fail(where + ".bitRate", "must not be 0");
  b.dataBitRate = UnsignedOr(j, "dataBitRate", where, 12000000, 0);
  b.canIoMode = static_cast<uint32_t>(
      UnsignedOr(j, "canIoMode", where, 2, b.dataBitRate ? driver::kCanIoModeFdBrs : 0));
  const std::string capture = TextOr(j, "capture", where, "");
  b.capture = capture.empty() ? "" : Resolve(base, capture);
  for (size_t i = 0; const json& t : Array(j, "traffic", where))
    b.traffic.push_back(Traffic(t, where + ".traffic[" + std::to_string(i++) + "]"));
  for (size_t i = 0; const json& r : Array(j, "replay", where))
    b.replays.push_back(Replay(r, where + ".replay[" + std::to_string(i++) + "]", base));
  for (size_t i = 0; const json& a : Array(j, "claimedAddresses", where)) {
    b.claimedAddresses.push_back(static_cast<uint8_t>(
        Unsigned(a, where + ".claimedAddresses[" + std::to_string(i++) + "]", 0xFD)));
  }
  b.linSlotMs = NumberOr(j, "slotMs", where, 10);
  for (size_t i = 0; const json& s : Array(j, "schedule", where))
    b.linSchedule.push_back(Lin(s, where + ".schedule[" + std::to_string(i++) + "]"));
  b.flexRayCycleMs = NumberOr(j, "cycleMs", where, 5);
  b.flexRaySlotUs = NumberOr(j, "slotUs", where, 50);
  for (size_t i = 0; const json& s : Array(j, "slots", where))
    b.flexRaySlots.push_back(Slot(s, where + ".slots[" + std::to_string(i++) + "]"));
  if ((b.protocol == driver::BusKind::kLin && b.linSlotMs <= 0) ||
      (b.protocol == driver::BusKind::kFlexRay &&
       (b.flexRayCycleMs <= 0 || b.flexRaySlotUs <= 0))) {
    Fail(where, "slot and cycle times must be above 0");
  }
  if (b.protocol != driver::BusKind::kCan &&
      (!b.traffic.empty() || !b.replays.empty() || !b.capture.empty())) {
    Fail(where, "traffic, replay and capture need a CAN bus");
  }
  return b;
}

uint32_t InterfaceProtocol(const std::string& busName, const std::vector<BusConfig>& buses,
                           const std::string& where) {
  for (const BusConfig& b : buses) {
    if (b.name != busName) continue;
    return driver::ProtocolOfBus(b.protocol);
  }
  Fail(where + ".bus", "unknown bus \"" + busName + "\"");
}

// An interface bound to a SocketCAN device: a CAN interface on no simulated bus.
void BindDevice(const json& i, const std::string& where, InterfaceConfig& c) {
  std::string why;
  if (!ValidDeviceName(c.device, why)) Fail(where + ".device", why);
  if (Member(i, "bus") != nullptr) Fail(where, "an interface has a bus or a device, not both");
  c.protocol = driver::kProtocolCan;
}

DeviceConfig Device(const json& j, const std::string& where, const std::vector<BusConfig>& buses) {
  if (!j.is_object()) Fail(where, "expected an object");
  DeviceConfig d;
  d.name = RequiredText(j, "name", where);
  for (size_t n = 0; const json& i : Array(j, "interfaces", where)) {
    const std::string w = where + ".interfaces[" + std::to_string(n++) + "]";
    if (!i.is_object()) Fail(w, "expected an object");
    InterfaceConfig c;
    c.name = RequiredText(i, "name", w);
    if (c.name.size() > 15 || c.name.find('@') != std::string::npos)
      Fail(w + ".name", "at most 15 characters, no '@'");
    c.device = TextOr(i, "device", w, "");
    if (c.device.empty()) {
      c.bus = RequiredText(i, "bus", w);
      c.protocol = InterfaceProtocol(c.bus, buses, w);
    } else {
      BindDevice(i, w, c);
    }
    c.port = static_cast<uint32_t>(UnsignedOr(i, "port", w, 0xFFFFFFFF, n));
    c.canFd = BoolOr(i, "canFd", w, false) ? 1 : 0;
    c.transceiver = static_cast<uint32_t>(UnsignedOr(i, "transceiver", w, 4, 0));
    d.interfaces.push_back(c);
  }
  if (d.interfaces.size() > 16) Fail(where + ".interfaces", "at most 16 interfaces per device");
  return d;
}

FaultConfig Fault(const json& j, const std::string& where) {
  if (!j.is_object()) Fail(where, "expected an object");
  FaultConfig f;
  f.operation = RequiredText(j, "operation", where);
  f.interfaceName = TextOr(j, "interface", where, "");
  const json* status = Member(j, "status");
  if (status == nullptr) Fail(where, "\"status\" is missing");
  if (status->is_number_integer() && status->get<int64_t>() < 0) {
    if (status->get<int64_t>() < INT32_MIN) Fail(where + ".status", "below the 32-bit range");
    f.status = static_cast<int32_t>(status->get<int64_t>());
  } else {
    f.status = static_cast<int32_t>(
        static_cast<uint32_t>(Unsigned(*status, where + ".status", 0xFFFFFFFF)));
  }
  f.always = BoolOr(j, "always", where, false);
  return f;
}

VersionValues Versions(const json& j) {
  VersionValues v;
  const std::string w = "versions";
  if (!j.is_object()) Fail(w, "expected an object");
  v.major = static_cast<uint32_t>(UnsignedOr(j, "major", w, 0xFFFFFFFF, v.major));
  v.minor = static_cast<uint32_t>(UnsignedOr(j, "minor", w, 0xFFFFFFFF, v.minor));
  v.update = static_cast<uint32_t>(UnsignedOr(j, "update", w, 0xFFFFFFFF, v.update));
  v.phase = static_cast<uint32_t>(UnsignedOr(j, "phase", w, 0xFFFFFFFF, v.phase));
  v.packed = static_cast<uint32_t>(UnsignedOr(j, "packed", w, 0xFFFFFFFF, v.packed));
  return v;
}

void Parse(const json& root, const std::string& base, HardwareConfig& out) {
  if (!root.is_object()) Fail("configuration", "expected a JSON object");
  HardwareConfig defaults = DefaultHardware();
  out = HardwareConfig{};
  if (const json* v = Member(root, "versions")) out.versions = Versions(*v);
  out.receiveQueueFrames = static_cast<uint32_t>(
      UnsignedOr(root, "receiveQueueFrames", "configuration", 1u << 22, out.receiveQueueFrames));
  out.transmitQueueFrames = static_cast<uint32_t>(
      UnsignedOr(root, "transmitQueueFrames", "configuration", 1u << 20, out.transmitQueueFrames));
  if (out.receiveQueueFrames == 0 || out.transmitQueueFrames == 0)
    Fail("configuration", "queue sizes must be at least 1");
  // Without "buses" and "devices" the default hardware stands.
  const bool own = Member(root, "buses") || Member(root, "devices");
  if (!own) {
    out.buses = defaults.buses;
    out.devices = defaults.devices;
  }
  for (size_t i = 0; const json& b : Array(root, "buses", "configuration"))
    out.buses.push_back(Bus(b, "buses[" + std::to_string(i++) + "]", base));
  for (size_t i = 0; const json& d : Array(root, "devices", "configuration"))
    out.devices.push_back(Device(d, "devices[" + std::to_string(i++) + "]", out.buses));
  if (out.devices.size() > 64) Fail("devices", "at most 64 devices");
  for (size_t i = 0; const json& f : Array(root, "faults", "configuration"))
    out.faults.push_back(Fault(f, "faults[" + std::to_string(i++) + "]"));
}

}  // namespace

bool ParseHardwareConfig(std::string_view text, const std::string& baseDirectory,
                         HardwareConfig& out, std::string& error) {
  try {
    const json root = json::parse(text.begin(), text.end());
    Parse(root, baseDirectory, out);
    return true;
  } catch (const ConfigError& e) {
    error = e.text;
  } catch (const json::exception& e) {
    error = std::string("not valid JSON: ") + e.what();
  } catch (const std::exception& e) {
    error = e.what();
  }
  return false;
}

bool LoadHardwareConfigFile(const std::string& path, HardwareConfig& out, std::string& error) {
  std::ifstream in(path, std::ios::binary);
  if (!in) {
    error = "cannot read the file";
    return false;
  }
  std::ostringstream text;
  text << in.rdbuf();
  const size_t slash = path.find_last_of('/');
  const std::string base = slash == std::string::npos ? "." : path.substr(0, slash);
  return ParseHardwareConfig(text.str(), base, out, error);
}

}  // namespace tarvix
