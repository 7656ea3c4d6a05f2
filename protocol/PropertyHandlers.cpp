// The table of property handlers, indexed by property identifier.
#include "protocol/PropertyHandlers.h"

#include <array>

#include "hostlink/MessageTable.h"
#include "protocol/CheckedProperties.h"
#include "protocol/NameProperties.h"
#include "protocol/PlainProperties.h"
#include "protocol/SessionLockedProperties.h"
#include "protocol/TransmitProperties.h"

namespace nKV_DLL300 {

namespace {

// A recognised property without a handler: the message is taken, nothing sent.
void Unanswered(HostConnection&, std::string_view) {}

PropertyHandlerTable MakeHandlers() {
  PropertyHandlerTable handlers{};
  handlers.fill(&Unanswered);
  AddNamePropertyHandlers(handlers);
  AddPlainPropertyHandlers(handlers);
  AddCheckedPropertyHandlers(handlers);
  AddSessionLockedPropertyHandlers(handlers);
  AddTransmitPropertyHandlers(handlers);
  return handlers;
}

// Built on first use, not by a static initialiser: the module's service thread starts before the
// module's other static objects are constructed.
const PropertyHandlerTable& Handlers() {
  static const PropertyHandlerTable handlers = MakeHandlers();
  return handlers;
}

}  // namespace

PropertyHandler PropertyHandlerFor(int32_t id) {
  if (id <= kPropertyUnknown || id >= kPropertyCount) return &Unanswered;
  return Handlers()[static_cast<size_t>(id)];
}

}  // namespace nKV_DLL300
