// kvmon's run: options, connections, hardware listing or the sessions with their display, and
// the clean end on Ctrl-C or q.
#include "host/kvmon/KvmonTool.h"

#include <sys/ioctl.h>
#include <unistd.h>

#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <memory>
#include <optional>
#include <utility>

#include "host/kvmon/ControllerLink.h"
#include "host/kvmon/HardwareListing.h"
#include "host/kvmon/JsonLines.h"
#include "host/kvmon/KvmonOptions.h"
#include "host/kvmon/PlainLines.h"
#include "host/kvmon/PlainWords.h"
#include "host/kvmon/SessionGroup.h"
#include "host/kvmon/TerminalView.h"

namespace kvmon {
namespace {

constexpr char kShowCursor[] = "\x1b[?25h\n";

// The first Ctrl-C (or SIGTERM) ends the sessions in order; a second one ends kvmon at once,
// leaving the terminal as it was.
void OnStopSignal(int signal) {
  if (!gStopRequested) {
    gStopRequested = 1;
    return;
  }
  TerminalKeys::restoreFromSignal();
  if (isatty(STDOUT_FILENO)) (void)!write(STDOUT_FILENO, kShowCursor, sizeof kShowCursor - 1);
  std::signal(signal, SIG_DFL);
  std::raise(signal);
}

void InstallSignals() {
  struct sigaction action {};
  action.sa_handler = OnStopSignal;
  action.sa_flags = 0;  // no SA_RESTART: a waiting receive returns at once
  sigemptyset(&action.sa_mask);
  sigaction(SIGINT, &action, nullptr);
  sigaction(SIGTERM, &action, nullptr);
  std::signal(SIGPIPE, SIG_IGN);
}

TerminalSize QueryTerminalSize() {
  winsize size{};
  if (ioctl(STDOUT_FILENO, TIOCGWINSZ, &size) != 0 || size.ws_col == 0 || size.ws_row == 0)
    return {};
  return TerminalSize{size.ws_col, size.ws_row};
}

int ListHardware(const Options& options) {
  std::string error;
  auto link = ControllerLink::Open(options.controller.host, options.controller.port,
                                   options.waitSeconds, error);
  if (!link) {
    std::fprintf(stderr, "kvmon: %s\n", error.c_str());
    return 1;
  }
  const auto reply =
      link->Request("CMD_GET_HARDWARE_INFO", nullptr, ControllerLink::Reply::kHardwareTable);
  if (!reply) {
    std::fprintf(stderr, "kvmon: %s\n", link->error().c_str());
    return 1;
  }
  const auto entries = kvhost::DecodeHardwareTable(reply->payload);
  if (reply->header.type != kvhost::kHardwareTable || !entries) {
    std::fprintf(stderr, "kvmon: the controller sent no usable hardware table: %s\n",
                 ExplainError(reply->text(), "").c_str());
    return 1;
  }
  if (options.output == OutputMode::kJson) {
    PrintHardwareJson(*entries, stdout);
  } else {
    PrintHardwareTable(*entries, reply->header, options.controller.text(), stdout);
  }
  return std::fflush(stdout) == 0 ? 0 : 1;
}

std::string Title(const Options& options) {
  std::string names;
  for (const auto& name : options.interfaces) names += (names.empty() ? "" : ", ") + name;
  return names + " on " + options.controller.text();
}

std::string TransmitText(const TransmitFrame& frame) {
  if (!frame.periodMs) return frame.text + " once";
  char every[48];
  std::snprintf(every, sizeof every, " every %g ms", *frame.periodMs);
  return frame.text + every;
}

// The row key of the --tx frame's echo: identifier with the extended bit, and the record type.
std::pair<uint32_t, uint8_t> EchoKey(const TransmitFrame& frame) {
  return {frame.identifier | (frame.extended ? 0x20000000u : 0u),
          static_cast<uint8_t>(frame.remote ? 0x01 : frame.frameType)};
}

// What a script should know at the end: quiet buses, and whether the --tx frame went out.
void Summarise(const Options& options, const SessionGroup& group) {
  for (const auto& name : options.interfaces) {
    const SourceModel* model = group.modelOf(name);
    if (model != nullptr && !model->seenFrames())
      std::fprintf(stderr, "kvmon: %s reported no identifier (a quiet bus)\n", name.c_str());
  }
  if (!options.transmit) return;
  const auto [identifier, type] = EchoKey(*options.transmit);
  const auto sent = group.modelOf(options.interfaces[0])->echoCount(identifier, type);
  const std::string what = options.interfaces[0] + " " + TransmitText(*options.transmit);
  if (sent) {
    std::fprintf(stderr, "kvmon: %s: %u sent\n", what.c_str(), *sent);
  } else {
    std::fprintf(stderr,
                 "kvmon: %s: no echo seen, it may not have gone out (a subordinate session needs "
                 "--baud; a listen-only or J1939 session shows no echo)\n",
                 what.c_str());
  }
}

bool OnTerminal(const Options& options) {
  return options.output == OutputMode::kTerminal ||
         (options.output == OutputMode::kAuto && isatty(STDOUT_FILENO));
}

std::unique_ptr<TerminalView> MakeTable(const Options& options, const SessionGroup& group) {
  auto table = std::make_unique<TerminalView>(group.models(), Title(options), options.view, stdout,
                                              QueryTerminalSize);
  if (options.transmit) {
    const auto [identifier, type] = EchoKey(*options.transmit);
    table->setTransmit({group.models()[0], identifier, type, TransmitText(*options.transmit)});
  }
  return table;
}

int RunSessions(const Options& options) {
  SessionGroup group(options);
  std::string error;
  if (!group.connect(error)) {
    std::fprintf(stderr, "kvmon: %s\n", error.c_str());
    return 1;
  }
  const bool live = options.output != OutputMode::kJson && OnTerminal(options);
  std::optional<TerminalKeys> keys = live ? TerminalKeys::open() : std::nullopt;
  std::unique_ptr<Display> display;
  TerminalView* table = nullptr;
  if (options.output == OutputMode::kJson) {
    display = std::make_unique<JsonLines>(options.view, stdout, stderr);
  } else if (!live) {
    display = std::make_unique<PlainLines>(options.view, stdout, stderr);
  } else {
    auto made = MakeTable(options, group);
    table = made.get();
    display = std::move(made);
  }
  group.attach(*display);
  const bool ok = group.setUp(error) && group.monitor(table, keys ? &*keys : nullptr, error);
  std::string endError;
  const bool ended = group.terminate(endError);
  keys.reset();
  display->close();
  if (!ok) std::fprintf(stderr, "kvmon: %s\n", error.c_str());
  if (ok && !ended) std::fprintf(stderr, "kvmon: %s\n", endError.c_str());
  if (ok && ended) Summarise(options, group);
  return ok && ended ? 0 : 1;
}

}  // namespace

int RunKvmon(int argc, char** argv) {
  Options options;
  switch (ParseOptions(argc, argv, options, stderr, std::getenv(kControllerVariable))) {
    case ParseResult::kHelp:
      PrintUsage(stdout);
      return 0;
    case ParseResult::kUsageError:
      return 2;
    case ParseResult::kRun:
      break;
  }
  InstallSignals();
  if (options.hardware) return ListHardware(options);
  return RunSessions(options);
}

}  // namespace kvmon
