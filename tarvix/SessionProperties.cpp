// The session properties: a table of ids with their size, where they apply and how they are stored.
#include "tarvix/SessionProperties.h"

#include <cstring>

#include "driver/Properties.h"
#include "driver/Status.h"

namespace tarvix {
namespace {

// Where a property exists.
enum Applies : uint8_t { kCan = 1, kLin = 2, kFr = 4, kJ1939 = 8, kOutput = 16 };

constexpr uint64_t kMinCanRate = 5000;
constexpr uint64_t kMaxCanRate = 1000000;
constexpr uint64_t kMaxCanDataRate = 12000000;
constexpr uint64_t kMinLinRate = 1000;
constexpr uint64_t kMaxLinRate = 20000;
constexpr uint32_t kMaxTransceiverType = 4;
constexpr uint32_t kMaxKeySlot = 2047;

template <typename T>
T Load(const void* p) {
  T v;
  std::memcpy(&v, p, sizeof v);
  return v;
}

template <typename T>
void Put(void* p, T v) {
  std::memcpy(p, &v, sizeof v);
}

using Setter = int32_t (*)(const SessionSetup&, SessionSettings&, const void*);
using Getter = void (*)(const SessionSettings&, void*);

struct Rule {
  uint32_t id;
  uint32_t size;
  uint8_t applies;
  bool interfaceSetting;  // a setting of the interface: not while running, not on a subordinate
  Setter set;             // null: read only
  Getter get;
};

bool ValidBaudRate(uint32_t protocol, uint64_t rate) {
  if (protocol == driver::kProtocolLin) return rate >= kMinLinRate && rate <= kMaxLinRate;
  if (protocol == driver::kProtocolFlexRay)
    return rate == 10000000 || rate == 5000000 || rate == 2500000;
  return rate >= kMinCanRate && rate <= kMaxCanRate;
}

int32_t SetBool(bool& field, const void* v) {
  field = Load<uint8_t>(v) != 0;
  return driver::kSuccess;
}

int32_t SetRange(uint32_t& field, const void* v, uint32_t max) {
  const uint32_t value = Load<uint32_t>(v);
  if (value > max) return driver::kInvalidPropertyValue;
  field = value;
  return driver::kSuccess;
}

int32_t SetBaudRate(const SessionSetup& setup, SessionSettings& st, const void* v) {
  const uint64_t rate = Load<uint64_t>(v);
  if (!ValidBaudRate(setup.cluster.protocol, rate)) return driver::kInvalidPropertyValue;
  st.baudRate = rate;
  return driver::kSuccess;
}

int32_t SetDataBaudRate(const SessionSetup&, SessionSettings& st, const void* v) {
  const uint64_t rate = Load<uint64_t>(v);
  // 0 runs the data phase at the nominal rate.
  if (rate != 0 && (rate < kMinCanRate || rate > kMaxCanDataRate))
    return driver::kInvalidPropertyValue;
  st.dataBaudRate = rate;
  return driver::kSuccess;
}

const Rule kRules[] = {
    {driver::kPropBaudRate, 8, kCan | kLin | kFr | kOutput, true, SetBaudRate,
     [](const SessionSettings& s, void* v) { Put<uint64_t>(v, s.baudRate); }},
    {driver::kPropCanFdBaudRate, 8, kCan | kOutput, true, SetDataBaudRate,
     [](const SessionSettings& s, void* v) { Put<uint64_t>(v, s.dataBaudRate); }},
    {driver::kPropTermination, 4, kCan | kOutput, true,
     [](const SessionSetup&, SessionSettings& s, const void* v) {
       return SetRange(s.termination, v, 1);
     },
     [](const SessionSettings& s, void* v) { Put<uint32_t>(v, s.termination); }},
    {driver::kPropTransceiverType, 4, kCan | kOutput, true,
     [](const SessionSetup&, SessionSettings& s, const void* v) {
       return SetRange(s.transceiver, v, kMaxTransceiverType);
     },
     [](const SessionSettings& s, void* v) { Put<uint32_t>(v, s.transceiver); }},
    {driver::kPropIsoFdMode, 4, kCan | kOutput, true,
     [](const SessionSetup&, SessionSettings& s, const void* v) {
       return SetRange(s.isoFdMode, v, 1);
     },
     [](const SessionSettings& s, void* v) { Put<uint32_t>(v, s.isoFdMode); }},
    {driver::kPropListenOnly, 1, kCan | kLin | kOutput, true,
     [](const SessionSetup&, SessionSettings& s, const void* v) {
       return SetBool(s.listenOnly, v);
     },
     [](const SessionSettings& s, void* v) { Put<uint8_t>(v, s.listenOnly); }},
    {driver::kPropEcho, 1, kCan | kLin | kFr, false,
     [](const SessionSetup&, SessionSettings& s, const void* v) { return SetBool(s.echo, v); },
     [](const SessionSettings& s, void* v) { Put<uint8_t>(v, s.echo); }},
    {driver::kPropBusErrorFrames, 2, kCan | kLin, false,
     [](const SessionSetup&, SessionSettings& s, const void* v) {
       s.busErrorFrames = static_cast<const uint8_t*>(v)[0] != 0;
       s.busErrorListenOnly = static_cast<const uint8_t*>(v)[1] != 0;
       return driver::kSuccess;
     },
     [](const SessionSettings& s, void* v) {
       static_cast<uint8_t*>(v)[0] = s.busErrorFrames;
       static_cast<uint8_t*>(v)[1] = s.busErrorListenOnly;
     }},
    {driver::kPropLinNoResponseFrames, 1, kLin, false,
     [](const SessionSetup&, SessionSettings& s, const void* v) {
       return SetBool(s.linNoResponse, v);
     },
     [](const SessionSettings& s, void* v) { Put<uint8_t>(v, s.linNoResponse); }},
    {driver::kPropLinChecksumFlag, 1, kLin, false,
     [](const SessionSetup&, SessionSettings& s, const void* v) {
       return SetBool(s.linChecksum, v);
     },
     [](const SessionSettings& s, void* v) { Put<uint8_t>(v, s.linChecksum); }},
    {driver::kPropFlexRayTermination, 4, kFr, true,
     [](const SessionSetup&, SessionSettings& s, const void* v) {
       return SetRange(s.flexRayTermination, v, 1);
     },
     [](const SessionSettings& s, void* v) { Put<uint32_t>(v, s.flexRayTermination); }},
    {driver::kPropFlexRayNullFrames, 1, kFr, false,
     [](const SessionSetup&, SessionSettings& s, const void* v) {
       return SetBool(s.nullFrames, v);
     },
     [](const SessionSettings& s, void* v) { Put<uint8_t>(v, s.nullFrames); }},
    {driver::kPropKeySlot, 4, kFr, true,
     [](const SessionSetup&, SessionSettings& s, const void* v) {
       return SetRange(s.keySlot, v, kMaxKeySlot);
     },
     [](const SessionSettings& s, void* v) { Put<uint32_t>(v, s.keySlot); }},
    {driver::kPropJ1939NodeName, 8, kCan | kJ1939, false,
     [](const SessionSetup&, SessionSettings& s, const void* v) {
       s.nodeName = Load<uint64_t>(v);
       return driver::kSuccess;
     },
     [](const SessionSettings& s, void* v) { Put<uint64_t>(v, s.nodeName); }},
    {driver::kPropJ1939NodeAddress, 4, kCan | kJ1939, false,
     [](const SessionSetup&, SessionSettings& s, const void* v) {
       return SetRange(s.nodeAddress, v, driver::kJ1939NullAddress);
     },
     nullptr},  // read back as the session holds it (Load)
    {driver::kPropCanIoMode, 4, kCan | kOutput, false, nullptr, nullptr},  // from the database
};

const Rule* Find(uint32_t id) {
  for (const Rule& r : kRules) {
    if (r.id == id) return &r;
  }
  return nullptr;
}

bool AppliesTo(const Rule& r, const PropertyTarget& t) {
  const SessionSetup& setup = t.setup;
  if ((r.applies & kJ1939) && !setup.cluster.j1939) return false;
  if (t.output) return (r.applies & kOutput) != 0;
  const uint8_t bit = setup.cluster.protocol == driver::kProtocolLin       ? kLin
                      : setup.cluster.protocol == driver::kProtocolFlexRay ? kFr
                                                                           : kCan;
  return (r.applies & bit) != 0;
}

// Id, applicability and size checks shared by reads and writes.
int32_t Check(const Rule* r, const PropertyTarget& t, uint32_t size, const void* value) {
  if (r == nullptr || !AppliesTo(*r, t)) return driver::kUnknownProperty;
  if (size != r->size) return driver::kWrongPropertySize;
  if (value == nullptr) return driver::kBufferMissing;
  return driver::kSuccess;
}

}  // namespace

int32_t SessionProperties::Store(const PropertyTarget& t, uint32_t id, uint32_t size,
                                 const void* value) {
  const Rule* r = Find(id);
  if (const int32_t st = Check(r, t, size, value); st != driver::kSuccess) return st;
  if (r->set == nullptr) return driver::kPropertyReadOnly;
  if (r->interfaceSetting && t.setup.subordinate) return driver::kSubordinateReadOnly;
  if (r->interfaceSetting && t.started) return driver::kPropertyWhileRunning;
  return r->set(t.setup, t.settings, value);
}

int32_t SessionProperties::Load(const PropertyTarget& t, uint32_t id, uint32_t size, void* value) {
  const Rule* r = Find(id);
  if (const int32_t st = Check(r, t, size, value); st != driver::kSuccess) return st;
  if (id == driver::kPropJ1939NodeAddress) {
    Put<uint32_t>(value, t.settings.nodeAddress);
  } else if (id == driver::kPropCanIoMode) {
    Put<uint32_t>(value, t.setup.cluster.canIoMode);
  } else {
    r->get(t.settings, value);
  }
  return driver::kSuccess;
}

}  // namespace tarvix
