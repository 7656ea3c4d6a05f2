// Option parsing with getopt_long (the controller stands outside the module).
#include "controller/ControllerOptions.h"

#include <getopt.h>

namespace kvcontroller {

const char* UsageText() {
  return "Examples:\n"
         "  kelvanert-controller                      load libkelvanert.so beside this program\n"
         "  kelvanert-controller --module ./libkelvanert.so\n"
         "\n"
         "Usage: kelvanert-controller [--module PATH] [--help]\n"
         "  Stands in for the real-time controller: loads the runtime module, whose service\n"
         "  listens for hosts after 10 s, and unloads it in order on Ctrl-C (SIGINT) or SIGTERM.\n"
         "  --module PATH  the module to load\n"
         "  --help         this text\n"
         "Environment: KELVANERT_DRIVE_C (the drive C: directory), TARVIX_SIM_CONFIG (hardware).\n";
}

std::optional<ControllerOptions> ParseOptions(int argc, char** argv, std::string& error) {
  static const option kOptions[] = {
      {"module", required_argument, nullptr, 'm'},
      {"help", no_argument, nullptr, 'h'},
      {nullptr, 0, nullptr, 0},
  };
  ControllerOptions options;
  optind = 1;
  opterr = 0;
  for (int code; (code = getopt_long(argc, argv, "m:h", kOptions, nullptr)) != -1;) {
    switch (code) {
      case 'm':
        options.modulePath = optarg;
        break;
      case 'h':
        options.help = true;
        break;
      default:
        error = "unknown option or missing value";
        return std::nullopt;
    }
  }
  if (optind < argc) {
    error = std::string("unexpected argument: ") + argv[optind];
    return std::nullopt;
  }
  return options;
}

}  // namespace kvcontroller
