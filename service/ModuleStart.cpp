// Loading the module starts its service; unloading it shuts the service down in order.
#include "protocol/DriverSystem.h"
#include "service/ServiceContext.h"

namespace nKV_DLL300 {

namespace {

// The module's one service, with the start-up of the real controller: 10 000 ms wait, the port
// of kelvanert.ini, the linked driver library.
class ModuleService {
 public:
  ModuleService() : context_(new ServiceContext(ModuleOptions())) {}
  ~ModuleService() {
    context_->Shutdown();
    delete context_;
  }
  ModuleService(const ModuleService&) = delete;
  ModuleService& operator=(const ModuleService&) = delete;

 private:
  static ServiceOptions ModuleOptions() {
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

}  // namespace

}  // namespace nKV_DLL300
