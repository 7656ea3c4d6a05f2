// Databases the driver knows: built-in names, the named database SimDB, and in-memory databases
// made with kxdbOpenDatabase (clusters and frames with their properties).
#pragma once

#include <cstdint>
#include <map>
#include <memory>
#include <string>
#include <vector>

#include "tarvix/SessionSetup.h"

namespace tarvix {

struct ResolvedDatabase {
  bool subordinate = false;
  bool fromBus = false;  // built-in database that takes its rates from the interface's bus
  ClusterSettings cluster;
  std::vector<FrameDefinition> frames;
};

// Thread safety: none; the Simulator's mutex guards it.
class DatabaseStore {
 public:
  static constexpr const char* kNamedAlias = "SimDB";

  int32_t open(const char* name, uint32_t& ref);
  int32_t createObject(uint32_t parent, uint32_t objectClass, const char* name, uint32_t& ref);
  int32_t setProperty(uint32_t ref, uint32_t id, uint32_t size, const void* value);
  int32_t close(uint32_t ref, uint32_t closeAll);
  void clear();

  // Looks up a session's database, cluster and frame list ("A,B" names frames of the cluster).
  int32_t resolve(const std::string& database, const std::string& cluster,
                  const std::string& frameList, ResolvedDatabase& out) const;
  bool owns(uint32_t ref) const;

 private:
  struct Frame {
    FrameDefinition definition;
    bool ioModeSet = false;
  };
  struct Cluster {
    std::string name;
    uint32_t database;
    ClusterSettings settings;
    std::vector<std::pair<uint32_t, std::string>>
        frames;  // frame refs and names, in creation order
  };
  struct Database {
    std::string name;
    int opens = 0;
    std::vector<uint32_t> clusters;
  };
  int32_t setClusterProperty(Cluster& c, uint32_t id, uint32_t size, const void* value);
  int32_t setFrameProperty(Frame& f, uint32_t id, uint32_t size, const void* value);
  int32_t resolveMemory(const Database& db, const std::string& cluster,
                        const std::string& frameList, ResolvedDatabase& out) const;
  uint32_t nextRef(uint32_t kind);

  std::map<uint32_t, Database> databases_;
  std::map<uint32_t, Cluster> clusters_;
  std::map<uint32_t, Frame> frames_;
  uint32_t serial_ = 0;
};

}  // namespace tarvix
