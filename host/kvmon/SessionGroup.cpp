// Several sessions in one thread: poll over their sockets (and the keys), then drain each.
#include "host/kvmon/SessionGroup.h"

#include <poll.h>

#include <chrono>
#include <cstdlib>
#include <string_view>

#include "host/kvmon/PlainWords.h"
#include "host/kvmon/SessionSetup.h"

namespace kvmon {
namespace {

using Clock = std::chrono::steady_clock;
constexpr int kLoopSliceMs = 200;
constexpr uint32_t kDefaultTableCapacity = 1000;  // the controller's SET_PROP_DATA_LOG_IDS_MAX
constexpr std::string_view kTableSize = "SET_PROP_DATA_LOG_IDS_MAX=";

std::string TableFullText(uint32_t capacity) {
  return "identifier table full (" + std::to_string(capacity) +
         "): new identifiers are counted in the statistics but not listed; --table-size raises "
         "it (up to 65535)";
}

}  // namespace

uint32_t AskedTableCapacity(const Options& options) {
  uint32_t capacity = kDefaultTableCapacity;
  for (const auto& property : options.properties) {
    if (property.starts_with(kTableSize))
      capacity =
          static_cast<uint32_t>(std::strtoul(property.c_str() + kTableSize.size(), nullptr, 10));
  }
  return capacity;
}

WatchedSession::WatchedSession(std::string name, ControllerLink connection, double overdueFactor)
    : interfaceName(std::move(name)),
      link(std::move(connection)),
      model(interfaceName, BusOfInterface(interfaceName).value_or(Bus::kCan), overdueFactor) {}

bool SessionGroup::connect(std::string& error) {
  for (const auto& name : options_.interfaces) {
    auto link = ControllerLink::Open(options_.controller.host, options_.controller.port,
                                     options_.waitSeconds, error);
    if (!link) return false;
    sessions_.push_back(
        std::make_unique<WatchedSession>(name, std::move(*link), options_.view.overdueFactor));
    sessions_.back()->model.setChecksums(AsksForChecksums(options_, name));
  }
  return true;
}

std::vector<const SourceModel*> SessionGroup::models() const {
  std::vector<const SourceModel*> models;
  for (const auto& session : sessions_) models.push_back(&session->model);
  return models;
}

const SourceModel* SessionGroup::modelOf(const std::string& interfaceName) const {
  for (const auto& session : sessions_) {
    if (session->interfaceName == interfaceName) return &session->model;
  }
  return nullptr;
}

MessageSink SessionGroup::sinkOf(WatchedSession& session) {
  return [this, &session](const kvhost::HostMessage& message) { handle(session, message); };
}

void SessionGroup::handleRecords(WatchedSession& session, const kvhost::HostMessage& message) {
  const Bus bus = *BusOfRecordType(message.header.type);
  const auto count = message.header.idCount;
  const auto records = bus == Bus::kCan   ? kvhost::DecodeCanRecords(message.payload, count)
                       : bus == Bus::kLin ? kvhost::DecodeLinRecords(message.payload, count)
                                          : kvhost::DecodeFlexRayRecords(message.payload, count);
  if (!records) {
    display_->showNotice(session.interfaceName +
                         ": a malformed identifier report of the controller was skipped");
    return;
  }
  const size_t first = session.model.takeRecords(*records, message.payload.size(), HostNow());
  display_->showRecords(session.model, first);
}

void SessionGroup::notice(const WatchedSession& session, const std::string& words) {
  display_->showNotice(sessions_.size() > 1 ? session.interfaceName + ": " + words : words);
}

// Statistics carry the table's size; a record message reaches the capacity only when it holds the
// whole table. Said once each time the table fills.
void SessionGroup::watchTableSize(WatchedSession& session,
                                  const kvhost::MessageHeaderView& header) {
  const bool full = header.idCount >= tableCapacity_;
  if (full && !session.tableFull) notice(session, TableFullText(tableCapacity_));
  session.tableFull = full;
}

void SessionGroup::handle(WatchedSession& session, const kvhost::HostMessage& message) {
  if (BusOfRecordType(message.header.type)) {
    watchTableSize(session, message.header);
    return handleRecords(session, message);
  }
  if (message.header.type == kvhost::kStatistics) {
    watchTableSize(session, message.header);
    if (const auto report = DecodeBusReport(message.payload)) {
      session.model.takeStatistics(*report);
      display_->showStatistics(session.model);
    } else {
      display_->showNotice(session.interfaceName +
                           ": a malformed statistics report of the controller was skipped");
    }
  } else if (message.header.type == kvhost::kErrorText) {
    session.lastError = ExplainError(message.text(), session.interfaceName);
    notice(session, session.lastError);
  }
}

bool SessionGroup::setUp(std::string& error) {
  const TransmitFrame* transmit = options_.transmit ? &*options_.transmit : nullptr;
  for (auto& session : sessions_) {
    const auto properties = SessionProperties(options_, session->interfaceName);
    if (!SetUpSession(session->link, properties, session->interfaceName, transmit, sinkOf(*session),
                      error)) {
      if (sessions_.size() > 1) error = session->interfaceName + ": " + error;
      return false;
    }
  }
  return true;
}

bool SessionGroup::limitReached(Clock::time_point start) const {
  if (options_.reports) {
    bool all = true;
    for (const auto& session : sessions_)
      all = all && session->model.reports() >= *options_.reports;
    if (all) return true;
  }
  return options_.durationSeconds &&
         Clock::now() - start >= std::chrono::duration<double>(*options_.durationSeconds);
}

void SessionGroup::waitForInput(const TerminalKeys* keys) const {
  std::vector<pollfd> fds;
  for (const auto& session : sessions_) fds.push_back({session->link.fd(), POLLIN, 0});
  if (keys != nullptr) fds.push_back({keys->fd(), POLLIN, 0});
  poll(fds.data(), fds.size(), kLoopSliceMs);  // a signal or a time-out ends it as well
}

bool SessionGroup::receiveAll(std::string& error) {
  for (auto& session : sessions_) {
    if (!session->link.HeartbeatIfDue()) {
      error = session->interfaceName + ": " + session->link.error();
      return false;
    }
    while (auto message = session->link.Receive(std::chrono::milliseconds(0)))
      handle(*session, *message);
    if (const uint32_t skipped = session->link.TakeSkipped())
      notice(*session, "host too slow: " + std::to_string(skipped) + " reports skipped");
    if (session->link.closed()) {
      error =
          session->lastError.empty() ? "the controller ended the connection" : session->lastError;
      if (sessions_.size() > 1) error = session->interfaceName + ": " + error;
      return false;
    }
  }
  return true;
}

bool SessionGroup::clearAll(std::string& error) {
  for (auto& session : sessions_) {
    const auto reply = session->link.Request("CMD_SESSION_RESET", sinkOf(*session));
    if (!reply) {
      error = session->interfaceName + ": " + session->link.error();
      return false;
    }
    session->model.clear();
  }
  return true;
}

bool SessionGroup::handleKeys(TerminalView& view, TerminalKeys& keys, std::string& error) {
  for (const Key key : keys.read()) {
    const KeyAction action = view.handleKey(key);
    if (action == KeyAction::kQuit) quit_ = true;
    if (action == KeyAction::kClear && !clearAll(error)) return false;
  }
  return true;
}

bool SessionGroup::monitor(TerminalView* view, TerminalKeys* keys, std::string& error) {
  const auto start = Clock::now();
  while (!gStopRequested && !quit_ && !limitReached(start) && !display_->failed()) {
    waitForInput(view != nullptr ? keys : nullptr);
    if (!receiveAll(error)) return false;
    if (view != nullptr && keys != nullptr && !handleKeys(*view, *keys, error)) return false;
  }
  return true;
}

bool SessionGroup::terminate(std::string& error) {
  bool ok = true;
  for (auto& session : sessions_) {
    if (session->link.closed()) continue;  // ended already (and reported)
    std::string failure;
    if (TerminateSession(session->link, sinkOf(*session), failure)) continue;
    if (ok) error = sessions_.size() > 1 ? session->interfaceName + ": " + failure : failure;
    ok = false;
  }
  return ok;
}

}  // namespace kvmon
