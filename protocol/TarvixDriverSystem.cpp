// DriverSystem over the linked driver library.
#include "driver/tarvix.h"
#include "protocol/DriverSystem.h"

namespace nKV_DLL300 {

namespace {

class TarvixSystem final : public DriverSystem {
 public:
  int32_t SystemOpen(uint32_t& system) override { return kxSystemOpen(&system); }
  int32_t SystemClose(uint32_t system) override { return kxSystemClose(system); }
  int32_t GetProperty(uint32_t reference, uint32_t propertyId, uint32_t size,
                      void* value) override {
    return kxGetProperty(reference, propertyId, size, value);
  }
};

}  // namespace

DriverSystem& TarvixDriverSystem() {
  static TarvixSystem system;
  return system;
}

}  // namespace nKV_DLL300
