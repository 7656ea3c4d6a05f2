// kvmon's conversation with the controller: connect and greeting, one command at a time with its
// reply, the heartbeat, and the session's messages in between.
#pragma once

#include <chrono>
#include <csignal>
#include <functional>
#include <optional>
#include <string>

#include "host/HostClient.h"

namespace kvmon {

// Set by the signal handlers of the tool; the link gives up waiting when it is set.
extern volatile std::sig_atomic_t gStopRequested;

// Messages of the session (records, statistics) that arrive while a reply is awaited.
using MessageSink = std::function<void(const kvhost::HostMessage&)>;

// One connection. The controller reads each TCP segment as one command, so the link sends a
// command only after the previous one was answered, or after a pause when it has no answer (the
// heartbeat). Used by one thread.
class ControllerLink {
 public:
  static constexpr std::chrono::milliseconds kReplyDeadline{10000};
  static constexpr std::chrono::milliseconds kHeartbeatInterval{3000};

  // Connects, retrying until `waitSeconds` passed (the controller listens 10 s after its start),
  // and receives the greeting. nullopt with `error` in plain words.
  // A name that does not resolve is reported at once, not blamed on the controller.
  static std::optional<ControllerLink> Open(const std::string& host, uint16_t port,
                                            double waitSeconds, std::string& error);

  enum class Reply : uint8_t { kText, kHardwareTable };

  // Sends `command` and returns its reply: a text (message type 3 or 5), or for kHardwareTable the
  // table (type 7) or an error text. Other messages that arrive first go to `sink`; so do the
  // log writers' error texts, which are no reply. nullopt with error() set when no reply came in
  // time or the connection ended.
  std::optional<kvhost::HostMessage> Request(const std::string& command, const MessageSink& sink,
                                             Reply reply = Reply::kText);

  // Sends CMD_HEARTBEAT when the last one is kHeartbeatInterval old.
  bool HeartbeatIfDue();

  // The next message within `timeout`; nullopt on time-out or when the connection ended.
  std::optional<kvhost::HostMessage> Receive(std::chrono::milliseconds timeout);

  // Waits up to `timeout` for the controller to close the connection, discarding what it sends.
  bool waitForClose(std::chrono::milliseconds timeout) { return client_.WaitForClose(timeout); }

  bool closed() const { return client_.closed(); }
  int fd() const { return client_.fd(); }
  const std::string& error() const { return error_; }

  // Messages the controller numbered but this host never received since the last call: the
  // controller drops a report that a slow host cannot take at once, and its sequence number
  // shows the gap.
  uint32_t TakeSkipped();

 private:
  explicit ControllerLink(kvhost::HostClient client);
  bool SendAfterPause(const std::string& text, const MessageSink& sink);
  // Every receive of the link: counts the gaps in the sequence numbers.
  std::optional<kvhost::HostMessage> ReceiveCounted(std::chrono::milliseconds timeout);

  kvhost::HostClient client_;
  std::chrono::steady_clock::time_point lastHeartbeat_;
  // A command without a reply was sent at this time; the next one waits kCommandPause after it.
  std::optional<std::chrono::steady_clock::time_point> unansweredSince_;
  std::string error_;
  uint32_t nextSequence_ = 1;  // the greeting was 0
  uint32_t skipped_ = 0;
};

}  // namespace kvmon
