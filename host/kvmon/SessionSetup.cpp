// The set-up conversation: every command waits for its reply, and a refusal ends the set-up.
#include "host/kvmon/SessionSetup.h"

#include <algorithm>

#include "host/kvmon/PlainWords.h"

namespace kvmon {
namespace {

constexpr char kUnknownCommand[] = "<ERROR: unknown command>\n";
constexpr char kLogNameProperty[] = "SET_PROP_LOGFILE_NAME=";

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

bool AsksForChecksums(const Options& options, const std::string& interfaceName) {
  return BusOfInterface(interfaceName) == Bus::kLin && (options.logChecksum || !options.textLog);
}

std::vector<std::string> SessionProperties(const Options& options,
                                           const std::string& interfaceName) {
  std::vector<std::string> properties = {"SET_PROP_SESSION_PORTNAME=" + interfaceName};
  if (!options.runMode.empty()) properties.push_back("SET_PROP_SESSION_RUNMODE=" + options.runMode);
  for (const auto& property : options.properties) {
    const bool ownLog = options.interfaces.size() > 1 && property.rfind(kLogNameProperty, 0) == 0;
    properties.push_back(ownLog ? property + "-" + interfaceName : property);
  }
  if (options.echo && BusOfInterface(interfaceName) == Bus::kCan &&
      std::find(properties.begin(), properties.end(),
                "SET_PROP_SESSION_LOG_TRANSMITTED_FRAMES=1") == properties.end()) {
    properties.push_back("SET_PROP_SESSION_LOG_TRANSMITTED_FRAMES=1");
  }
  if (AsksForChecksums(options, interfaceName) && !options.logChecksum)
    properties.push_back("SET_PROP_SESSION_LOG_CHECKSUM=1");
  return properties;
}

bool SetUpSession(ControllerLink& link, const std::vector<std::string>& properties,
                  const std::string& interfaceName, const TransmitFrame* transmit,
                  const MessageSink& sink, std::string& error) {
  for (const auto& property : properties) {
    if (!Exchange(link, property, interfaceName, sink, error)) return false;
  }
  if (!Exchange(link, "CMD_SESSION_START", interfaceName, sink, error)) return false;
  if (transmit == nullptr) return true;
  for (const auto& message : TransmitMessages(*transmit)) {
    if (!Exchange(link, message, interfaceName, sink, error)) {
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
    if (reply->header.type == kvhost::kText) {
      if (link.waitForClose(kCloseDeadline)) return true;
      error =
          "the controller acknowledged the end of the session but did not close the "
          "connection within " +
          std::to_string(kCloseDeadline.count() / 1000) + " s: its log may be incomplete";
      return false;
    }
    if (reply->text() != kUnknownCommand) {
      error = ExplainError(reply->text(), "");
      return false;
    }
  }
  error = "the controller did not take CMD_SESSION_TERMINATE";
  return false;
}

}  // namespace kvmon
