// Built-in, named and in-memory databases.
#include "tarvix/DatabaseStore.h"

#include <cmath>
#include <cstring>
#include <sstream>

#include "driver/FrameTypes.h"
#include "driver/Properties.h"
#include "driver/Sessions.h"
#include "driver/Status.h"
#include "tarvix/ObjectRef.h"

namespace tarvix {
namespace {

constexpr size_t kMaxNameLength = 255;
constexpr uint32_t kMaxTimingType = driver::kTimingCyclicAndEvent;

struct Builtin {
  const char* name;
  bool subordinate;
  bool fromBus;
  ClusterSettings cluster;
};

const Builtin kBuiltins[] = {
    {driver::kDatabaseCan,
     false,
     false,
     {driver::kProtocolCan, 500000, 0, driver::kCanIoModeClassic, false}},
    {driver::kDatabaseCanFd,
     false,
     false,
     {driver::kProtocolCan, 500000, 2000000, driver::kCanIoModeFd, false}},
    {driver::kDatabaseCanFdBrs,
     false,
     false,
     {driver::kProtocolCan, 500000, 2000000, driver::kCanIoModeFdBrs, false}},
    {driver::kDatabaseCanJ1939,
     false,
     false,
     {driver::kProtocolCan, 250000, 0, driver::kCanIoModeClassic, true}},
    {driver::kDatabaseMemory, false, true, {}},
    {driver::kDatabaseSubordinate, true, true, {}},
    {driver::kDatabaseSubordinateJ1939, true, true, {driver::kProtocolCan, 0, 0, 0, true}},
};

struct NamedCluster {
  const char* name;
  ClusterSettings settings;
};

const NamedCluster kSimDb[] = {
    {"Body", {driver::kProtocolCan, 500000, 0, driver::kCanIoModeClassic, false}},
    {"FD", {driver::kProtocolCan, 500000, 2000000, driver::kCanIoModeFdBrs, false}},
    {"LIN", {driver::kProtocolLin, 19200, 0, 0, false}},
    {"FlexRay", {driver::kProtocolFlexRay, 10000000, 0, 0, false}},
};

bool ValidName(const char* name) {
  return name != nullptr && name[0] != '\0' && std::strlen(name) <= kMaxNameLength;
}

template <typename T>
T Load(const void* p) {
  T v;
  std::memcpy(&v, p, sizeof v);
  return v;
}

std::vector<std::string> SplitList(const std::string& list) {
  std::vector<std::string> names;
  std::stringstream in(list);
  std::string name;
  while (std::getline(in, name, ',')) {
    if (!name.empty()) names.push_back(name);
  }
  return names;
}

}  // namespace

uint32_t DatabaseStore::nextRef(uint32_t kind) { return MakeRef(kind, ++serial_); }

int32_t DatabaseStore::open(const char* name, uint32_t& ref) {
  if (!ValidName(name)) return driver::kInvalidName;
  // Opening a name that is open already gives the same database (it stays until its last close).
  for (auto& [r, db] : databases_) {
    if (db.name == name) {
      ++db.opens;
      ref = r;
      return driver::kSuccess;
    }
  }
  ref = nextRef(kRefDatabase);
  databases_[ref] = Database{name, 1, {}};
  return driver::kSuccess;
}

int32_t DatabaseStore::createObject(uint32_t parent, uint32_t objectClass, const char* name,
                                    uint32_t& ref) {
  if (!ValidName(name)) return driver::kInvalidName;
  if (objectClass == driver::kClassCluster) {
    auto db = databases_.find(parent);
    if (db == databases_.end())
      return clusters_.count(parent) ? driver::kWrongObjectKind : driver::kInvalidReference;
    for (uint32_t c : db->second.clusters) {
      if (clusters_[c].name == name) return ref = c, driver::kSuccess;  // the existing cluster
    }
    ref = nextRef(kRefCluster);
    clusters_[ref] = Cluster{name, parent, {}, {}};
    db->second.clusters.push_back(ref);
    return driver::kSuccess;
  }
  if (objectClass == driver::kClassFrame) {
    auto cluster = clusters_.find(parent);
    if (cluster == clusters_.end())
      return databases_.count(parent) ? driver::kWrongObjectKind : driver::kInvalidReference;
    for (const auto& [r, n] : cluster->second.frames) {
      if (n == name) return ref = r, driver::kSuccess;  // the existing frame
    }
    ref = nextRef(kRefFrame);
    Frame f;
    f.definition.name = name;
    frames_[ref] = f;
    cluster->second.frames.emplace_back(ref, name);
    return driver::kSuccess;
  }
  return driver::kInvalidPropertyValue;
}

int32_t DatabaseStore::setProperty(uint32_t ref, uint32_t id, uint32_t size, const void* value) {
  if (value == nullptr) return driver::kBufferMissing;
  if (auto c = clusters_.find(ref); c != clusters_.end())
    return setClusterProperty(c->second, id, size, value);
  if (auto f = frames_.find(ref); f != frames_.end())
    return setFrameProperty(f->second, id, size, value);
  return databases_.count(ref) ? driver::kUnknownProperty : driver::kInvalidReference;
}

int32_t DatabaseStore::setClusterProperty(Cluster& c, uint32_t id, uint32_t size,
                                          const void* value) {
  ClusterSettings& s = c.settings;
  switch (id) {
    case driver::kPropClusterApplicationProtocol: {
      if (size != 4) return driver::kWrongPropertySize;
      const uint32_t v = Load<uint32_t>(value);
      if (v > driver::kApplicationProtocolJ1939) return driver::kInvalidPropertyValue;
      s.j1939 = v == driver::kApplicationProtocolJ1939;
      return driver::kSuccess;
    }
    case driver::kPropClusterBaudRate:
      if (size != 8) return driver::kWrongPropertySize;
      if (Load<uint64_t>(value) == 0) return driver::kInvalidPropertyValue;
      s.baudRate = Load<uint64_t>(value);
      return driver::kSuccess;
    case driver::kPropClusterCanIoMode:
      if (size != 4) return driver::kWrongPropertySize;
      if (Load<uint32_t>(value) > driver::kCanIoModeFdBrs) return driver::kInvalidPropertyValue;
      s.canIoMode = Load<uint32_t>(value);
      return driver::kSuccess;
    case driver::kPropClusterCanFdBaudRate:
      if (size != 8) return driver::kWrongPropertySize;
      s.dataBaudRate = Load<uint64_t>(value);
      return driver::kSuccess;
    default:
      return driver::kUnknownProperty;
  }
}

int32_t DatabaseStore::setFrameProperty(Frame& f, uint32_t id, uint32_t size, const void* value) {
  FrameDefinition& d = f.definition;
  const auto expect = [size](uint32_t n) { return size == n; };
  switch (id) {
    case driver::kPropFrameExtendedId:
      if (!expect(1)) return driver::kWrongPropertySize;
      d.extended = Load<uint8_t>(value) != 0;
      return driver::kSuccess;
    case driver::kPropFrameIdentifier:
      if (!expect(4)) return driver::kWrongPropertySize;
      if (Load<uint32_t>(value) > driver::kExtendedIdMask) return driver::kInvalidPropertyValue;
      d.identifier = Load<uint32_t>(value);
      return driver::kSuccess;
    case driver::kPropFramePayloadLength:
      if (!expect(4)) return driver::kWrongPropertySize;
      if (Load<uint32_t>(value) > driver::kMaxCanFdPayload) return driver::kInvalidPropertyValue;
      d.payloadLength = Load<uint32_t>(value);
      return driver::kSuccess;
    case driver::kPropFrameTimingType:
      if (!expect(4)) return driver::kWrongPropertySize;
      if (Load<uint32_t>(value) > kMaxTimingType) return driver::kInvalidPropertyValue;
      d.timingType = Load<uint32_t>(value);
      return driver::kSuccess;
    case driver::kPropFrameCyclicRate: {
      if (!expect(8)) return driver::kWrongPropertySize;
      const double rate = Load<double>(value);
      if (!std::isfinite(rate) || rate < 0.0) return driver::kInvalidPropertyValue;
      d.cyclicRateS = rate;
      return driver::kSuccess;
    }
    case driver::kPropFrameCanIoMode:
      if (!expect(4)) return driver::kWrongPropertySize;
      if (Load<uint32_t>(value) > driver::kFrameCanIoModeFdBrs)
        return driver::kInvalidPropertyValue;
      d.canIoMode = Load<uint32_t>(value);
      f.ioModeSet = true;
      return driver::kSuccess;
    default:
      return driver::kUnknownProperty;
  }
}

int32_t DatabaseStore::close(uint32_t ref, uint32_t closeAll) {
  auto db = databases_.find(ref);
  if (db == databases_.end()) return driver::kInvalidReference;
  if (closeAll == 0 && --db->second.opens > 0) return driver::kSuccess;
  for (uint32_t c : db->second.clusters) {
    for (const auto& frame : clusters_[c].frames) frames_.erase(frame.first);
    clusters_.erase(c);
  }
  databases_.erase(db);
  return driver::kSuccess;
}

void DatabaseStore::clear() {
  databases_.clear();
  clusters_.clear();
  frames_.clear();
}

bool DatabaseStore::owns(uint32_t ref) const {
  return databases_.count(ref) || clusters_.count(ref) || frames_.count(ref);
}

int32_t DatabaseStore::resolve(const std::string& database, const std::string& cluster,
                               const std::string& frameList, ResolvedDatabase& out) const {
  for (const Builtin& b : kBuiltins) {
    if (database == b.name) {
      out = ResolvedDatabase{b.subordinate, b.fromBus, b.cluster, {}};
      return driver::kSuccess;
    }
  }
  if (database == kNamedAlias) {
    for (const NamedCluster& c : kSimDb) {
      if (cluster == c.name) {
        out = ResolvedDatabase{false, false, c.settings, {}};
        return frameList.empty() ? driver::kSuccess : driver::kFrameNotFound;
      }
    }
    return driver::kClusterNotFound;
  }
  for (const auto& [ref, db] : databases_) {
    if (db.name == database) return resolveMemory(db, cluster, frameList, out);
  }
  return driver::kDatabaseNotFound;
}

int32_t DatabaseStore::resolveMemory(const Database& db, const std::string& cluster,
                                     const std::string& frameList, ResolvedDatabase& out) const {
  for (uint32_t c : db.clusters) {
    const Cluster& cl = clusters_.at(c);
    if (cl.name != cluster) continue;
    out = ResolvedDatabase{false, false, cl.settings, {}};
    for (const std::string& name : SplitList(frameList)) {
      const Frame* found = nullptr;
      for (const auto& [fr, fname] : cl.frames) {
        if (fname == name) found = &frames_.at(fr);
      }
      if (found == nullptr) return driver::kFrameNotFound;
      out.frames.push_back(found->definition);
      // A frame without its own I/O mode uses its cluster's.
      if (!found->ioModeSet) out.frames.back().canIoMode = cl.settings.canIoMode;
    }
    return driver::kSuccess;
  }
  return driver::kClusterNotFound;
}

}  // namespace tarvix
