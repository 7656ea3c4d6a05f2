// The abstract path value of the path library.
#pragma once

#include <cstdint>
#include <string>

namespace kxpath {

class cPathInterface {
 public:
  virtual ~cPathInterface() = default;
  virtual cPathInterface& append(const std::string& utf8Component) = 0;
  virtual cPathInterface& appendLocal(const std::string& localComponent) = 0;
  virtual void copyUtf8(char* buffer, uint32_t size) const = 0;
  virtual std::string getUtf8() const = 0;
  virtual void copyLocal(char* buffer, uint32_t size) const = 0;
  virtual std::string getLocal() const = 0;
};

}  // namespace kxpath
