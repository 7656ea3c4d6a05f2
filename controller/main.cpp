// kelvanert-controller: loads the runtime module, waits, unloads it in order on SIGINT/SIGTERM.
#include <signal.h>
#include <unistd.h>

#include <cstdio>
#include <filesystem>
#include <string>

#include "controller/ControllerOptions.h"
#include "platform/Drive.h"
#include "platform/Library.h"

namespace {

// The module beside this executable.
std::string DefaultModulePath() {
  std::error_code error;
  std::filesystem::path self = std::filesystem::read_symlink("/proc/self/exe", error);
  return (self.parent_path() / "libkelvanert.so").string();
}

// Blocks SIGINT and SIGTERM in every thread (the module's threads inherit the mask), so only
// the wait below receives them.
sigset_t BlockStopSignals() {
  sigset_t signals;
  sigemptyset(&signals);
  sigaddset(&signals, SIGINT);
  sigaddset(&signals, SIGTERM);
  pthread_sigmask(SIG_BLOCK, &signals, nullptr);
  return signals;
}

}  // namespace

int main(int argc, char** argv) {
  std::string error;
  auto options = kvcontroller::ParseOptions(argc, argv, error);
  if (!options || options->help) {
    if (!options) std::fprintf(stderr, "kelvanert-controller: %s\n", error.c_str());
    std::fputs(kvcontroller::UsageText(), options ? stdout : stderr);
    return options ? 0 : 2;
  }
  std::string modulePath = options->modulePath.empty() ? DefaultModulePath() : options->modulePath;
  sigset_t stopSignals = BlockStopSignals();

  platform::HMODULE module = platform::LoadLibraryA(modulePath.c_str());
  if (module == nullptr) {
    std::fprintf(stderr, "kelvanert-controller: cannot load %s\n", modulePath.c_str());
    return 1;
  }
  std::printf("kelvanert-controller: module %s loaded (pid %d); drive C: is %s\n",
              modulePath.c_str(), static_cast<int>(getpid()), platform::DriveDirectory().c_str());
  std::printf("kelvanert-controller: the service listens after 10 s; Ctrl-C stops it\n");
  std::fflush(stdout);

  int received = 0;
  sigwait(&stopSignals, &received);
  std::printf("kelvanert-controller: %s received, unloading the module\n",
              received == SIGINT ? "SIGINT" : "SIGTERM");
  std::fflush(stdout);
  platform::FreeLibrary(module);
  std::printf("kelvanert-controller: stopped\n");
  return 0;
}
