// Storage of the last payload of each CAN and FlexRay identifier entry.
#include "bus/PayloadCopies.h"

#include <cstring>
#include <new>

namespace nKV_DLL300 {

namespace {
constexpr uint32_t kAlignment = 8;
}

PayloadCopies::PayloadCopies(std::pmr::memory_resource* resource)
    : resource_(resource), slots_(resource) {}

PayloadCopies::~PayloadCopies() {
  for (Slot& slot : slots_) release(slot);
}

void PayloadCopies::allocateSlots(uint32_t slots) { slots_.assign(slots, Slot{nullptr, 0}); }

bool PayloadCopies::store(uint32_t index, const uint8_t* data, uint32_t length) {
  Slot& slot = slots_[index];
  if (length > slot.capacity) {
    const uint32_t capacity = (length + kAlignment - 1) & ~(kAlignment - 1);
    void* storage = nullptr;
    try {
      storage = resource_->allocate(capacity, kAlignment);
    } catch (const std::bad_alloc&) {
      return false;
    }
    release(slot);
    slot = Slot{static_cast<uint8_t*>(storage), capacity};
  }
  if (length > 0) std::memcpy(slot.data, data, length);
  return true;
}

void PayloadCopies::release(Slot& slot) {
  if (slot.data != nullptr) resource_->deallocate(slot.data, slot.capacity, kAlignment);
  slot = Slot{nullptr, 0};
}

}  // namespace nKV_DLL300
