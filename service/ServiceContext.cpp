// Start-up of the service thread, its body, and the orderly shutdown.
#include "service/ServiceContext.h"

#include "platform/Console.h"
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

void SetUp(ServiceContext& context) {
  net::SocketHandle listener = net::kInvalidSocket;
  (void)OpenListener(ChoosePort(context), listener);
  context.listenSocket.store(listener);
  (void)readDriverVersion(*context.options.driver, context.driverVersion);
  if (listener != net::kInvalidSocket) context.boundPort.store(net::LocalPort(listener));
  context.setUpComplete.store(true);
}

}  // namespace

void RunService(ServiceContext& context) {
  SleepWhileRunning(context, context.options.startDelayMs);
  if (!context.running.load()) return;
  SetUp(context);
  while (context.running.load()) {
    (void)ConnectionPass(context);
    SleepFor(kPassPauseMs);
  }
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
