// Loading the module starts its service; unloading it shuts the service down in order.
#include "logging/MeasurementLibrary.h"
#include "protocol/DriverSystem.h"
#include "service/ServiceContext.h"

namespace nKV_DLL300 {

namespace {

// The module's one service, with the start-up of the real controller: 10 000 ms wait, the port
// of kelvanert.ini, the linked driver library.
class ModuleService {
 public:
  ModuleService() : context_(new ServiceContext(moduleOptions())) {}
  ~ModuleService() {
    context_->shutdown();
    delete context_;
    // Every session has stopped and closed its measurement-data file, so the library can go. A
    // failure to free it at process shutdown has nobody to be reported to.
    try {
      UnloadMeasurementLibrary();
    } catch (const vorException&) {
    }
  }
  ModuleService(const ModuleService&) = delete;
  ModuleService& operator=(const ModuleService&) = delete;

 private:
  static ServiceOptions moduleOptions() {
    ServiceOptions options;
    options.startDelayMs = kModuleStartDelayMs;
    options.driver = &TarvixDriverSystem();
    return options;
  }

  ServiceContext* context_;
};

// The first static initialiser of the module: the service thread exists before any other
// static object of the module is constructed.
__attribute__((init_priority(101))) ModuleService theModuleService;

// The next: the measurement-data library loader names vora.dll from the environment and the
// registry file; the first type 2 log loads it. (Its unload is the service's last step above.)
struct MeasurementLibraryLoader {
  MeasurementLibraryLoader() { LocateMeasurementLibrary(); }
};
__attribute__((init_priority(102))) MeasurementLibraryLoader theMeasurementLibraryLoader;

}  // namespace

}  // namespace nKV_DLL300
