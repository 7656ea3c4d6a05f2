// Where trace text goes: the interface every trace destination implements.
#pragma once

#include <cstdint>

namespace nQVAPAL000 {

class iTraceDestination {
 public:
  virtual ~iTraceDestination() = default;
  virtual void writeTextN(const char* text, uint32_t length) = 0;  // at most length characters
  virtual void writeText(const char* text) = 0;
  virtual void setOption(uint32_t option, uint32_t value) = 0;
  // Copies the destination's command-line arguments into buffer (truncated to size, always
  // NUL-terminated when size > 0) and stores the full size with NUL in *needed.
  virtual void getDestinationArguments(char* buffer, uint32_t size, uint32_t* needed) = 0;
  virtual bool isReady() = 0;
  virtual void flush() = 0;
  virtual const char* getDestinationName() = 0;
};

}  // namespace nQVAPAL000
