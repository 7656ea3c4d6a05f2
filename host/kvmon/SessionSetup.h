// Starting and ending kvmon's sessions: each interface's property messages with their replies,
// the start, the transmit frame, and the terminate that waits for the controller to close.
#pragma once

#include <chrono>
#include <string>
#include <vector>

#include "host/kvmon/ControllerLink.h"
#include "host/kvmon/KvmonOptions.h"

namespace kvmon {

// The property messages of the session on `interfaceName`, in the order they are sent: the port
// name and run mode first, then the shared properties. With several interfaces each log name gets
// "-INTERFACE" so that the sessions do not write one file. On LIN the driver is asked for the
// checksums unless a text log is written without --log-checksum (asking adds a column to it).
std::vector<std::string> SessionProperties(const Options& options,
                                           const std::string& interfaceName);
// Whether SessionProperties asks for LIN checksums on `interfaceName`.
bool AsksForChecksums(const Options& options, const std::string& interfaceName);

// Sends `properties` one by one, starts the session and then defines and starts the transmit
// frame, each after the reply to the one before. False at the first refusal, with `error` in plain
// words.
bool SetUpSession(ControllerLink& link, const std::vector<std::string>& properties,
                  const std::string& interfaceName, const TransmitFrame* transmit,
                  const MessageSink& sink, std::string& error);

// How long kvmon waits for the controller to close the connection after acknowledging the end.
inline constexpr std::chrono::milliseconds kCloseDeadline{15000};

// Ends the session with CMD_SESSION_TERMINATE and waits, up to kCloseDeadline, for the controller
// to close the connection: it closes the session's log file before, so the log is complete when
// this returns true. False with `error` when it did not acknowledge or did not close in time.
bool TerminateSession(ControllerLink& link, const MessageSink& sink, std::string& error);

}  // namespace kvmon
