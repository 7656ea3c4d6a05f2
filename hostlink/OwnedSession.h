// The bus session a host connection owns, held without knowledge of the bus classes.
#pragma once

#include <cstdint>
#include <memory>

namespace nKV_DLL300 {

class CBusSystem;

// Stops and deletes a connection's session for the host link, which sees CBusSystem only as a
// declaration: the two steps come from the code that hands the session over and knows its class.
// A std::unique_ptr of any bus class converts to OwnedSession and brings them along.
class SessionDeleter {
 public:
  SessionDeleter() = default;
  template <class Session>
  SessionDeleter(std::default_delete<Session>) noexcept  // implicit, so that the pointer converts
      : stop_([](CBusSystem* session) { return static_cast<Session*>(session)->stop(); }),
        delete_([](CBusSystem* session) { delete static_cast<Session*>(session); }) {}

  // CBusSystem::stop of `session`; its status.
  int32_t stop(CBusSystem* session) const { return stop_(session); }
  void operator()(CBusSystem* session) const { delete_(session); }

 private:
  int32_t (*stop_)(CBusSystem*) = nullptr;
  void (*delete_)(CBusSystem*) = nullptr;
};

using OwnedSession = std::unique_ptr<CBusSystem, SessionDeleter>;

}  // namespace nKV_DLL300
