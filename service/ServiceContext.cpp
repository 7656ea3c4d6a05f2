// Start-up of the service thread, its body, and the orderly shutdown.
#include "service/ServiceContext.h"

#include "platform/Console.h"
#include "platform/net/SocketError.h"
#include "protocol/HardwareInfo.h"
#include "service/CPollTCPThread.h"
#include "service/Configuration.h"
#include "service/ConnectionLoop.h"
#include "service/Listener.h"
#include "timing/Time.h"

namespace nKV_DLL300 {

namespace net = platform::net;

namespace {

constexpr uint64_t kPassPauseMs = 10;
constexpr uint64_t kDelaySliceMs = 20;
constexpr uint64_t kListenRetryMs = 1000;

// The start delay, cut into slices so an unload need not wait for it to pass.
void SleepWhileRunning(const ServiceContext& context, uint64_t milliseconds) {
  uint64_t end = NowIn(kMilliseconds) + milliseconds;
  for (uint64_t now = NowIn(kMilliseconds); now < end && context.running.load();
       now = NowIn(kMilliseconds)) {
    SleepFor(end - now < kDelaySliceMs ? end - now : kDelaySliceMs);
  }
}

void WriteConsoleLine(const std::string& line) {
  platform::EtsDisplayMessage("kelvanert: %s\n", line.c_str());
}

std::string ChoosePort(const ServiceContext& context) {
  if (context.options.portText) return *context.options.portText;
  PortChoice choice = ReadConfiguration();
  if (!choice.problem.empty()) {
    WriteConsoleLine(choice.problem + "; listening on the default port " + choice.portText);
  }
  return choice.portText;
}

// Opens the listener; the first failure of a run of failures is told on the console, and so is
// the port once it listens (the port a host connects to, whatever the configuration said).
void TryListen(ServiceContext& context, const std::string& portText, bool& failureTold) {
  net::SocketHandle listener = net::kInvalidSocket;
  if (OpenListener(portText, listener) < 0 || listener == net::kInvalidSocket) {
    if (!failureTold) WriteConsoleLine(ListenerProblem(portText, net::LastSocketError()));
    failureTold = true;
    return;
  }
  context.boundPort.store(net::LocalPort(listener));
  context.listenSocket.store(listener);
  WriteConsoleLine("listening on port " + std::to_string(context.boundPort.load()));
}

// The passes; without a listener (its port was taken) the service tries again every second.
void Serve(ServiceContext& context, const std::string& portText, bool& failureTold) {
  while (context.running.load()) {
    if (context.listenSocket.load() == net::kInvalidSocket) {
      SleepWhileRunning(context, kListenRetryMs);
      if (context.running.load()) TryListen(context, portText, failureTold);
      continue;
    }
    (void)ConnectionPass(context);
    SleepFor(kPassPauseMs);
  }
}

}  // namespace

void RunService(ServiceContext& context) {
  SleepWhileRunning(context, context.options.startDelayMs);
  if (!context.running.load()) return;
  const std::string portText = ChoosePort(context);
  bool failureTold = false;
  TryListen(context, portText, failureTold);
  (void)readDriverVersion(*context.options.driver, context.driverVersion);
  context.setUpComplete.store(true);
  Serve(context, portText, failureTold);
}

ServiceContext::ServiceContext(ServiceOptions serviceOptions) : options(std::move(serviceOptions)) {
  serviceThread = std::make_unique<CPollTCPThread>(this);
  threadController = std::make_unique<nQVAPAL000::tThreadController>();
  nQVAPAL000::StatusBlock status;
  threadController->start(serviceThread.get(), status);  // the status is not examined
}

ServiceContext::~ServiceContext() { shutdown(); }

void ServiceContext::shutdown() {
  if (shutDown_.exchange(true)) return;
  running.store(false);
  // A pass waits on the listener; shutting it down wakes the wait at once.
  net::SocketHandle listener = listenSocket.load();
  if (listener != net::kInvalidSocket) net::ShutdownBoth(listener);
  if (threadController) threadController->join();
  for (ConnectionSlot& slot : connections) FreeSlot(*this, slot);
  listener = listenSocket.exchange(net::kInvalidSocket);
  if (listener != net::kInvalidSocket) net::Close(listener);
  boundPort.store(-1);
}

}  // namespace nKV_DLL300
