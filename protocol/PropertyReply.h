// Formatting and sending the replies of property messages.
#pragma once

#include <array>
#include <cstdint>
#include <string>
#include <string_view>

#include "hostlink/MessageTable.h"
#include "protocol/PropertyHandlers.h"

namespace nKV_DLL300 {

class HostConnection;

// The handlers of every property identifier, filled by the Add...PropertyHandlers functions.
using PropertyHandlerTable = std::array<PropertyHandler, kPropertyCount>;

// Which session a reply's header shows: the connection's current one (which may be null), or
// none at all.
enum class ReplySession { kNone, kWith };

// `pattern` with its one placeholder ("%d", "%llu" or "%s") replaced by `value`. The result is as
// long as it needs to be: a host-given text is never cut.
std::string FillReply(std::string_view pattern, std::string_view value);

// The decimal text of a stored field as "%d" prints it (a 32-bit field read as signed).
std::string SignedText(uint32_t field);
// The decimal text of an unsigned 64-bit field as "%llu" prints it.
std::string Unsigned64Text(uint64_t field);

// Sends `text` as type 3 when it begins "<ACK", as type 5 when it begins "<ERROR". Service
// thread only.
void SendPropertyReply(HostConnection& connection, const std::string& text, ReplySession session);

}  // namespace nKV_DLL300
