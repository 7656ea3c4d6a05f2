// kvmon's run: options, connection, hardware listing or session set-up, the monitoring loop with
// its heartbeat, and the clean end on Ctrl-C.
#include "host/kvmon/KvmonTool.h"

#include <sys/ioctl.h>
#include <unistd.h>

#include <chrono>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <memory>
#include <string_view>

#include "host/kvmon/ControllerLink.h"
#include "host/kvmon/HardwareListing.h"
#include "host/kvmon/JsonLines.h"
#include "host/kvmon/KvmonOptions.h"
#include "host/kvmon/PlainLines.h"
#include "host/kvmon/PlainWords.h"
#include "host/kvmon/SessionSetup.h"
#include "host/kvmon/TerminalView.h"

namespace kvmon {
namespace {

using Clock = std::chrono::steady_clock;
constexpr std::chrono::milliseconds kLoopSlice{200};
constexpr uint32_t kDefaultTableCapacity = 1000;  // the controller's SET_PROP_DATA_LOG_IDS_MAX

void OnStopSignal(int) { gStopRequested = 1; }

// Ctrl-C and SIGTERM end the session; a second Ctrl-C ends kvmon at once (SA_RESETHAND).
void InstallSignals() {
  struct sigaction action {};
  action.sa_handler = OnStopSignal;
  action.sa_flags = SA_RESETHAND;  // no SA_RESTART: a waiting receive returns at once
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

std::string ControllerText(const Options& options) {
  return options.controllerHost + ":" + std::to_string(options.controllerPort);
}

std::unique_ptr<Display> MakeDisplay(const Options& options) {
  OutputMode mode = options.output;
  if (mode == OutputMode::kAuto)
    mode = isatty(STDOUT_FILENO) ? OutputMode::kTerminal : OutputMode::kPlain;
  if (mode == OutputMode::kJson)
    return std::make_unique<JsonLines>(options.interfaceName, stdout, stderr);
  if (mode == OutputMode::kPlain)
    return std::make_unique<PlainLines>(options.interfaceName, stdout, stderr);
  const Bus bus = BusOfInterface(options.interfaceName).value_or(Bus::kCan);
  return std::make_unique<TerminalView>(
      bus, options.interfaceName + " on " + ControllerText(options), stdout, QueryTerminalSize);
}

int ListHardware(ControllerLink& link, const Options& options) {
  const auto reply =
      link.Request("CMD_GET_HARDWARE_INFO", nullptr, ControllerLink::Reply::kHardwareTable);
  if (!reply) {
    std::fprintf(stderr, "kvmon: %s\n", link.error().c_str());
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
    PrintHardwareTable(*entries, reply->header, ControllerText(options), stdout);
  }
  return std::fflush(stdout) == 0 ? 0 : 1;
}

// The capacity of the identifier table that kvmon asked for (--table-size), else the
// controller's default.
uint32_t AskedTableCapacity(const Options& options) {
  constexpr std::string_view kTableSize = "SET_PROP_DATA_LOG_IDS_MAX=";
  uint32_t capacity = kDefaultTableCapacity;
  for (const auto& property : options.properties) {
    if (property.starts_with(kTableSize))
      capacity =
          static_cast<uint32_t>(std::strtoul(property.c_str() + kTableSize.size(), nullptr, 10));
  }
  return capacity;
}

std::string TableFullText(uint32_t capacity) {
  return "identifier table full (" + std::to_string(capacity) +
         "): new identifiers are counted in the statistics but not listed; --table-size raises "
         "it (up to 65535)";
}

// Hands the session's messages to the display and keeps what the loop needs to know.
class SessionMessages {
 public:
  SessionMessages(Display& display, std::string interfaceName, uint32_t tableCapacity)
      : display_(display),
        interfaceName_(std::move(interfaceName)),
        tableCapacity_(tableCapacity) {}

  void operator()(const kvhost::HostMessage& message) {
    if (const auto bus = BusOfRecordType(message.header.type)) {
      WatchTableSize(message.header);
      return ShowRecords(*bus, message);
    }
    if (message.header.type == kvhost::kStatistics) {
      WatchTableSize(message.header);
      return ShowStatistics(message);
    }
    if (message.header.type == kvhost::kErrorText) {
      lastError_ = ExplainError(message.text(), interfaceName_);
      display_.ShowNotice(lastError_);
    }
  }

  uint64_t recordMessages() const { return recordMessages_; }
  const std::string& lastError() const { return lastError_; }

 private:
  void ShowRecords(Bus bus, const kvhost::HostMessage& message) {
    ++recordMessages_;
    const auto count = message.header.idCount;
    const auto records = bus == Bus::kCan   ? kvhost::DecodeCanRecords(message.payload, count)
                         : bus == Bus::kLin ? kvhost::DecodeLinRecords(message.payload, count)
                                            : kvhost::DecodeFlexRayRecords(message.payload, count);
    if (records) {
      display_.ShowRecords(bus, *records, message.payload.size());
    } else {
      display_.ShowNotice("a malformed identifier report of the controller was skipped");
    }
  }

  void ShowStatistics(const kvhost::HostMessage& message) {
    if (const auto report = DecodeBusReport(message.payload)) {
      display_.ShowStatistics(*report);
    } else {
      display_.ShowNotice("a malformed statistics report of the controller was skipped");
    }
  }

  // Statistics carry the table's size; a record message reaches the capacity only when it holds
  // the whole table. Said once each time the table fills.
  void WatchTableSize(const kvhost::MessageHeaderView& header) {
    const bool full = header.idCount >= tableCapacity_;
    if (full && !tableFull_) display_.ShowNotice(TableFullText(tableCapacity_));
    tableFull_ = full;
  }

  Display& display_;
  std::string interfaceName_;
  const uint32_t tableCapacity_;
  bool tableFull_ = false;
  uint64_t recordMessages_ = 0;
  std::string lastError_;
};

bool LimitReached(const Options& options, const SessionMessages& messages,
                  Clock::time_point start) {
  if (options.recordMessages && messages.recordMessages() >= *options.recordMessages) return true;
  return options.durationSeconds &&
         Clock::now() - start >= std::chrono::duration<double>(*options.durationSeconds);
}

// Runs until Ctrl-C, a limit, a failed output or the end of the connection; false on the last.
bool Monitor(ControllerLink& link, const Options& options, Display& display,
             SessionMessages& messages, std::string& error) {
  const auto start = Clock::now();
  while (!gStopRequested && !LimitReached(options, messages, start) && !display.failed()) {
    if (!link.HeartbeatIfDue()) {
      error = link.error();
      return false;
    }
    if (auto message = link.Receive(kLoopSlice)) messages(*message);
    if (const uint32_t skipped = link.TakeSkipped())
      display.ShowNotice("host too slow: " + std::to_string(skipped) + " reports skipped");
    if (link.closed()) {
      error = messages.lastError().empty() ? "the controller ended the connection"
                                           : messages.lastError();
      return false;
    }
  }
  return true;
}

int RunSession(ControllerLink& link, const Options& options) {
  auto display = MakeDisplay(options);
  SessionMessages messages(*display, options.interfaceName, AskedTableCapacity(options));
  const MessageSink sink = [&messages](const kvhost::HostMessage& message) { messages(message); };
  std::string error;
  const bool ok = SetUpSession(link, options, sink, error) &&
                  Monitor(link, options, *display, messages, error) &&
                  TerminateSession(link, sink, error);
  display->Close();
  if (!ok) std::fprintf(stderr, "kvmon: %s\n", error.c_str());
  return ok ? 0 : 1;
}

}  // namespace

int RunKvmon(int argc, char** argv) {
  Options options;
  switch (ParseOptions(argc, argv, options, stderr)) {
    case ParseResult::kHelp:
      PrintUsage(stdout);
      return 0;
    case ParseResult::kUsageError:
      return 2;
    case ParseResult::kRun:
      break;
  }
  InstallSignals();
  std::string error;
  auto link = ControllerLink::Open(options.controllerHost, options.controllerPort,
                                   options.waitSeconds, error);
  if (!link) {
    std::fprintf(stderr, "kvmon: %s\n", error.c_str());
    return 1;
  }
  return options.hardware ? ListHardware(*link, options) : RunSession(*link, options);
}

}  // namespace kvmon
