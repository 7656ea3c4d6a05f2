// Hash index from an identifier key to its entry in the identifier table.
#include "bus/IdentifierIndex.h"

#include <algorithm>

namespace nKV_DLL300 {

IdentifierIndex::IdentifierIndex(std::pmr::memory_resource* resource) : slots_(resource) {}

void IdentifierIndex::allocate(uint32_t maxEntries) {
  uint32_t bits = 1;
  while ((uint64_t{1} << bits) < uint64_t{std::min(maxEntries, kMaxEntries)} * 2) ++bits;
  slots_.assign(size_t{1} << bits, 0);
  mask_ = (uint32_t{1} << bits) - 1;
  shift_ = 64 - bits;
}

uint32_t IdentifierIndex::probe(uint64_t key) const {
  // Fibonacci hashing spreads runs of neighbouring identifiers over the whole slot range.
  uint32_t slot = static_cast<uint32_t>((key * 0x9E3779B97F4A7C15ull) >> shift_);
  while (slots_[slot] != 0 && (slots_[slot] >> 16) != key) slot = (slot + 1) & mask_;
  return slot;
}

void IdentifierIndex::clear() { std::fill(slots_.begin(), slots_.end(), 0); }

}  // namespace nKV_DLL300
