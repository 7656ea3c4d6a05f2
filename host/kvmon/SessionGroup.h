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

// The capacity of the identifier table that kvmon asks for (--table-size), else the controller's
// default.
uint32_t AskedTableCapacity(const Options& options);

// One interface's connection, session and model.
struct WatchedSession {
  WatchedSession(std::string interfaceName, ControllerLink link, double overdueFactor);

  std::string interfaceName;
  ControllerLink link;
  SourceModel model;
  std::string lastError;   // the last error text of the controller, in plain words
  bool tableFull = false;  // the identifier table reached the capacity kvmon asked for
};

// Used by the tool's one thread.
class SessionGroup {
 public:
  explicit SessionGroup(const Options& options) : options_(options) {}

  // Connects once per interface (waiting for the controller to listen). False with `error`.
  bool connect(std::string& error);
  // The models, for the display; valid once Connect succeeded, for the group's life.
  std::vector<const SourceModel*> models() const;
  // Where the sessions' messages are shown from SetUp on; it must outlive the group's use.
  void attach(Display& display) { display_ = &display; }
  const SourceModel* modelOf(const std::string& interfaceName) const;
  // Sets up and starts every session. False at the first refusal, with `error`.
  bool setUp(std::string& error);
  // Runs until Ctrl-C, q, a limit, a failed output or the end of a connection (false, `error`).
  // `view` and `keys` are the live table's, when there is one.
  bool monitor(TerminalView* view, TerminalKeys* keys, std::string& error);
  // Ends every session and waits for each connection to close. False with `error` when one did not.
  bool terminate(std::string& error);

 private:
  void handle(WatchedSession& session, const kvhost::HostMessage& message);
  void handleRecords(WatchedSession& session, const kvhost::HostMessage& message);
  void watchTableSize(WatchedSession& session, const kvhost::MessageHeaderView& header);
  void notice(const WatchedSession& session, const std::string& words);
  MessageSink sinkOf(WatchedSession& session);
  bool limitReached(std::chrono::steady_clock::time_point start) const;
  bool receiveAll(std::string& error);
  bool handleKeys(TerminalView& view, TerminalKeys& keys, std::string& error);
  bool clearAll(std::string& error);
  void waitForInput(const TerminalKeys* keys) const;

  const Options& options_;
  const uint32_t tableCapacity_ = AskedTableCapacity(options_);
  Display* display_ = nullptr;
  std::vector<std::unique_ptr<WatchedSession>> sessions_;
  bool quit_ = false;
};

}  // namespace kvmon
