// kvmon's sessions, one connection and one session per interface, watched together: set-up, the
// monitoring loop with heartbeats, keys and limits, and the end that waits for every close.
#pragma once

#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "host/kvmon/ControllerLink.h"
#include "host/kvmon/Display.h"
#include "host/kvmon/KvmonOptions.h"
#include "host/kvmon/SourceModel.h"
#include "host/kvmon/TerminalKeys.h"
#include "host/kvmon/TerminalView.h"

namespace kvmon {

// One interface's connection, session and model.
struct WatchedSession {
  WatchedSession(std::string interfaceName, ControllerLink link, double overdueFactor);

  std::string interfaceName;
  ControllerLink link;
  SourceModel model;
  std::string lastError;  // the last error text of the controller, in plain words
};

// Used by the tool's one thread.
class SessionGroup {
 public:
  explicit SessionGroup(const Options& options) : options_(options) {}

  // Connects once per interface (waiting for the controller to listen). False with `error`.
  bool Connect(std::string& error);
  // The models, for the display; valid once Connect succeeded, for the group's life.
  std::vector<const SourceModel*> Models() const;
  // Where the sessions' messages are shown from SetUp on; it must outlive the group's use.
  void Attach(Display& display) { display_ = &display; }
  const SourceModel* ModelOf(const std::string& interfaceName) const;
  // Sets up and starts every session. False at the first refusal, with `error`.
  bool SetUp(std::string& error);
  // Runs until Ctrl-C, q, a limit, a failed output or the end of a connection (false, `error`).
  // `view` and `keys` are the live table's, when there is one.
  bool Monitor(TerminalView* view, TerminalKeys* keys, std::string& error);
  // Ends every session and waits for each connection to close. False with `error` when one did not.
  bool Terminate(std::string& error);

 private:
  void Handle(WatchedSession& session, const kvhost::HostMessage& message);
  void HandleRecords(WatchedSession& session, const kvhost::HostMessage& message);
  MessageSink SinkOf(WatchedSession& session);
  bool LimitReached(std::chrono::steady_clock::time_point start) const;
  bool ReceiveAll(std::string& error);
  bool HandleKeys(TerminalView& view, TerminalKeys& keys, std::string& error);
  bool ClearAll(std::string& error);
  void WaitForInput(const TerminalKeys* keys) const;

  const Options& options_;
  Display* display_ = nullptr;
  std::vector<std::unique_ptr<WatchedSession>> sessions_;
  bool quit_ = false;
};

}  // namespace kvmon
