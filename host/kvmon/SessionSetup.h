// Starting and ending kvmon's session: the property messages with their replies, the start, the
// transmit frame, and the terminate at the end.
#pragma once

#include <string>

#include "host/kvmon/ControllerLink.h"
#include "host/kvmon/KvmonOptions.h"

namespace kvmon {

// Sends the options' properties one by one, starts the session and then defines and starts the
// transmit frame, each after the reply to the one before. False at the first refusal, with
// `error` in plain words.
bool SetUpSession(ControllerLink& link, const Options& options, const MessageSink& sink,
                  std::string& error);

// Ends the session and the connection with CMD_SESSION_TERMINATE. False with `error` when the
// controller did not acknowledge it.
bool TerminateSession(ControllerLink& link, const MessageSink& sink, std::string& error);

}  // namespace kvmon
