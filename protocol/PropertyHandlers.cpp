// The table of property handlers, indexed by property identifier.
#include "protocol/PropertyHandlers.h"

#include <array>

#include "protocol/MessageTable.h"

namespace nKV_DLL300 {

namespace {

// A recognised property whose handler is not in place yet: the message is taken, nothing sent.
void Unanswered(HostConnection&, std::string_view) {}

std::array<PropertyHandler, kPropertyCount> MakeHandlers() {
  std::array<PropertyHandler, kPropertyCount> handlers{};
  handlers.fill(&Unanswered);
  return handlers;
}

const std::array<PropertyHandler, kPropertyCount> kHandlers = MakeHandlers();

}  // namespace

PropertyHandler PropertyHandlerFor(int32_t id) {
  if (id <= kPropertyUnknown || id >= kPropertyCount) return &Unanswered;
  return kHandlers[static_cast<size_t>(id)];
}

}  // namespace nKV_DLL300
