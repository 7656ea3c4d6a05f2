// Storage of the last payload of each CAN and FlexRay identifier entry.
#pragma once

#include <cstdint>
#include <memory_resource>
#include <vector>

namespace nKV_DLL300 {

// One slot per table entry. A slot's storage only grows: a shorter payload reuses it, so an
// identifier whose length stays the same costs no allocation after its first frame. Storage is
// taken from the memory resource given at construction and returned by the destructor.
// Owned by one identifier table; poll thread only.
class PayloadCopies {
 public:
  explicit PayloadCopies(std::pmr::memory_resource* resource);
  ~PayloadCopies();
  PayloadCopies(const PayloadCopies&) = delete;
  PayloadCopies& operator=(const PayloadCopies&) = delete;

  // Makes room for `slots` slots, none holding storage; throws std::bad_alloc when refused.
  void allocateSlots(uint32_t slots);

  // Copies length bytes into the slot. False when storage for them could not be obtained; the slot
  // then keeps its former storage and contents.
  [[nodiscard]] bool store(uint32_t slot, const uint8_t* data, uint32_t length);

  const uint8_t* data(uint32_t slot) const { return slots_[slot].data; }

 private:
  struct Slot {
    uint8_t* data;
    uint32_t capacity;
  };
  void release(Slot& slot);

  std::pmr::memory_resource* resource_;
  std::pmr::vector<Slot> slots_;
};

}  // namespace nKV_DLL300
