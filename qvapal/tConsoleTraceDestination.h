// The trace destination that prints to the controller's console through tracePrintf.
#pragma once

#include "qvapal/iTraceDestination.h"

namespace nQVAPAL000 {

// Stateless; any thread may use it.
class tConsoleTraceDestination final : public iTraceDestination {
 public:
  void writeTextN(const char* text, uint32_t length) override;
  void writeText(const char* text) override;
  void setOption(uint32_t, uint32_t) override {}
  void getDestinationArguments(char* buffer, uint32_t size, uint32_t* needed) override;
  bool isReady() override { return true; }
  void flush() override {}
  const char* getDestinationName() override { return "qvsdbg_printf"; }
};

}  // namespace nQVAPAL000
