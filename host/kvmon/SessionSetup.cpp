// The set-up conversation: every command waits for its reply, and a refusal ends the set-up.
#include "host/kvmon/SessionSetup.h"

#include "host/kvmon/PlainWords.h"

namespace kvmon {
namespace {

constexpr char kUnknownCommand[] = "<ERROR: unknown command>\n";

// Sends `command`; true when the controller accepted it.
bool Exchange(ControllerLink& link, const std::string& command, const std::string& interfaceName,
              const MessageSink& sink, std::string& error) {
  const auto reply = link.Request(command, sink);
  if (!reply) {
    error = link.error();
    return false;
  }
  if (reply->header.type == kvhost::kErrorText) {
    error = ExplainError(reply->text(), interfaceName);
    return false;
  }
  return true;
}

}  // namespace

bool SetUpSession(ControllerLink& link, const Options& options, const MessageSink& sink,
                  std::string& error) {
  for (const auto& property : options.properties) {
    if (!Exchange(link, property, options.interfaceName, sink, error)) return false;
  }
  if (!Exchange(link, "CMD_SESSION_START", options.interfaceName, sink, error)) return false;
  if (!options.transmit) return true;
  for (const auto& message : TransmitMessages(*options.transmit)) {
    if (!Exchange(link, message, options.interfaceName, sink, error)) {
      error = "the transmit frame was refused: " + error;
      return false;
    }
  }
  return true;
}

bool TerminateSession(ControllerLink& link, const MessageSink& sink, std::string& error) {
  // A heartbeat that the controller has not read yet can merge with this command into one unknown
  // text; the command is then sent once more.
  for (int attempt = 0; attempt < 2; ++attempt) {
    const auto reply = link.Request("CMD_SESSION_TERMINATE", sink);
    if (!reply) {
      error = link.error();
      return false;
    }
    if (reply->header.type == kvhost::kText) return true;
    if (reply->text() != kUnknownCommand) {
      error = ExplainError(reply->text(), "");
      return false;
    }
  }
  error = "the controller did not take CMD_SESSION_TERMINATE";
  return false;
}

}  // namespace kvmon
