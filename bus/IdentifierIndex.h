// Hash index from an identifier key to its entry in the identifier table.
#pragma once

#include <cstdint>
#include <memory_resource>
#include <vector>

namespace nKV_DLL300 {

// Open addressing with linear probing over at least twice as many slots as entries, so a probe
// always ends at a free slot and costs the same whatever the number of entries. A slot is one
// 64-bit word, key << 16 | (entry + 1), 0 when free: keys have at most 48 bits and entries are
// fewer than 65536 (an idCount is 16 bits), which keeps the whole index small enough for the cache.
// Entries are never removed one by one: only clear() empties the index. Owned by one identifier
// table; poll thread only.
class IdentifierIndex {
 public:
  static constexpr uint32_t kNoEntry = UINT32_MAX;
  static constexpr uint32_t kMaxEntries = 65535;
  static constexpr int kKeyBits = 48;

  explicit IdentifierIndex(std::pmr::memory_resource* resource);

  // Sizes the index for up to maxEntries (at most kMaxEntries) entries; throws std::bad_alloc when
  // storage is refused.
  void allocate(uint32_t maxEntries);

  // The slot where key lives, or the free slot where it would be inserted.
  uint32_t probe(uint64_t key) const;
  uint32_t entryAt(uint32_t slot) const {
    return static_cast<uint32_t>(slots_[slot] & 0xFFFF) - 1;  // a free slot gives kNoEntry
  }
  void set(uint32_t slot, uint64_t key, uint32_t entry) {
    slots_[slot] = (key << 16) | (entry + 1);
  }
  void clear();

 private:
  std::pmr::vector<uint64_t> slots_;
  uint32_t mask_ = 0;
  uint32_t shift_ = 63;
};

}  // namespace nKV_DLL300
