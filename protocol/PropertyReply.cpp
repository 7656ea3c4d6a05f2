// Reply texts of the property handlers, formatted in full and sent with their message type.
#include "protocol/PropertyReply.h"

#include "bus/CBusSystem.h"
#include "hostlink/HostConnection.h"
#include "hostlink/MessageHeader.h"
#include "hostlink/SendReply.h"

namespace nKV_DLL300 {

namespace {

constexpr std::string_view kPlaceholders[] = {"%llu", "%d", "%s"};
constexpr std::string_view kErrorPrefix = "<ERROR";

}  // namespace

std::string FillReply(std::string_view pattern, std::string_view value) {
  for (std::string_view placeholder : kPlaceholders) {
    size_t at = pattern.find(placeholder);
    if (at == std::string_view::npos) continue;
    std::string text;
    text.reserve(pattern.size() + value.size());
    text.append(pattern.substr(0, at))
        .append(value)
        .append(pattern.substr(at + placeholder.size()));
    return text;
  }
  return std::string(pattern);
}

std::string SignedText(uint32_t field) { return std::to_string(static_cast<int32_t>(field)); }

std::string Unsigned64Text(uint64_t field) { return std::to_string(field); }

void SendPropertyReply(HostConnection& connection, const std::string& text, ReplySession session) {
  uint8_t type = text.starts_with(kErrorPrefix) ? kMessageErrorText : kMessageText;
  const CBusSystem* shown = session == ReplySession::kWith ? connection.session.get() : nullptr;
  SendText(connection, text.c_str(), shown, type);
}

}  // namespace nKV_DLL300
