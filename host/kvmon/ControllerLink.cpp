// Connecting with retries, request and reply, and the heartbeat of kvmon.
#include "host/kvmon/ControllerLink.h"

#include <cstdio>
#include <string_view>
#include <thread>
#include <utility>

#include "host/kvmon/ControllerAddress.h"

namespace kvmon {

volatile std::sig_atomic_t gStopRequested = 0;

namespace {

using Clock = std::chrono::steady_clock;
using namespace std::chrono_literals;

constexpr auto kConnectRetry = 200ms;
// Time the controller needs to read a command on its own before the next one may follow.
constexpr auto kCommandPause = 300ms;
constexpr auto kReceiveSlice = 100ms;
constexpr char kGreeting[] = "<Connected to Kelvane>\n";

constexpr std::string_view kLogErrorPrefix = "<ERROR:LOG FILE";

bool IsReply(const kvhost::HostMessage& message, ControllerLink::Reply reply) {
  const uint8_t type = message.header.type;
  if (type == kvhost::kErrorText) {
    const auto& p = message.payload;
    return !(p.size() >= kLogErrorPrefix.size() &&
             std::string_view(reinterpret_cast<const char*>(p.data()), kLogErrorPrefix.size()) ==
                 kLogErrorPrefix);
  }
  return reply == ControllerLink::Reply::kText ? type == kvhost::kText
                                               : type == kvhost::kHardwareTable;
}

std::string Where(const std::string& host, uint16_t port) {
  return ControllerAddress{host, port}.text();
}

}  // namespace

ControllerLink::ControllerLink(kvhost::HostClient client)
    : client_(std::move(client)), lastHeartbeat_(Clock::now()) {}

std::optional<ControllerLink> ControllerLink::Open(const std::string& host, uint16_t port,
                                                   double waitSeconds, std::string& error) {
  kvhost::HostClient client;
  const auto deadline = Clock::now() + std::chrono::duration_cast<Clock::duration>(
                                           std::chrono::duration<double>(waitSeconds));
  bool announced = false;
  while (!client.Connect(host, port)) {
    if (client.unresolved()) {
      error = client.error() + " (the controller's host name, from -c or KVMON_CONTROLLER)";
      return std::nullopt;
    }
    if (Clock::now() >= deadline || gStopRequested) {
      error = "cannot connect to the controller at " + Where(host, port) + ": " + client.error() +
              " (is it running? it listens 10 s after its start)";
      return std::nullopt;
    }
    if (!announced)
      std::fprintf(stderr, "kvmon: waiting for the controller at %s to listen ...\n",
                   Where(host, port).c_str());
    announced = true;
    std::this_thread::sleep_for(kConnectRetry);
  }
  auto greeting = client.Receive(kReplyDeadline);
  if (!greeting || greeting->text() != kGreeting) {
    error =
        "the controller at " + Where(host, port) +
        " sent no greeting (it serves at most eight hosts at once, or this is not a controller)";
    return std::nullopt;
  }
  return ControllerLink(std::move(client));
}

bool ControllerLink::SendAfterPause(const std::string& text, const MessageSink& sink) {
  if (unansweredSince_) {
    const auto until = *unansweredSince_ + kCommandPause;
    while (Clock::now() < until) {
      if (auto message = ReceiveCounted(
              std::chrono::duration_cast<std::chrono::milliseconds>(until - Clock::now()))) {
        if (sink) sink(*message);
      } else if (client_.closed()) {
        break;
      }
    }
    unansweredSince_.reset();
  }
  if (!client_.Send(text)) {
    error_ = "sending to the controller failed: " + client_.error();
    return false;
  }
  return true;
}

std::optional<kvhost::HostMessage> ControllerLink::Request(const std::string& command,
                                                           const MessageSink& sink, Reply reply) {
  if (!SendAfterPause(command, sink)) return std::nullopt;
  const auto deadline = Clock::now() + kReplyDeadline;
  while (Clock::now() < deadline) {
    auto message = ReceiveCounted(kReceiveSlice);
    if (message && IsReply(*message, reply)) return message;
    if (message && sink) sink(*message);
    if (client_.closed()) {
      error_ = "the controller ended the connection";
      return std::nullopt;
    }
  }
  error_ = "the controller did not answer " + command + " within " +
           std::to_string(kReplyDeadline.count() / 1000) + " s";
  return std::nullopt;
}

bool ControllerLink::HeartbeatIfDue() {
  if (Clock::now() - lastHeartbeat_ < kHeartbeatInterval) return true;
  if (!SendAfterPause("CMD_HEARTBEAT", nullptr)) return false;
  lastHeartbeat_ = Clock::now();
  unansweredSince_ = lastHeartbeat_;
  return true;
}

std::optional<kvhost::HostMessage> ControllerLink::Receive(std::chrono::milliseconds timeout) {
  return ReceiveCounted(timeout);
}

std::optional<kvhost::HostMessage> ControllerLink::ReceiveCounted(
    std::chrono::milliseconds timeout) {
  auto message = client_.Receive(timeout);
  if (message) {
    skipped_ += message->header.sequence - nextSequence_;  // modulo 2^32, like the numbers
    nextSequence_ = message->header.sequence + 1;
  }
  return message;
}

uint32_t ControllerLink::TakeSkipped() { return std::exchange(skipped_, 0); }

}  // namespace kvmon
