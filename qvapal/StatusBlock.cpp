// setStatus: precedence of codes and the shortened source path.
#include "qvapal/StatusBlock.h"

#include <cstring>
#include <string_view>

namespace nQVAPAL000 {

namespace {

constexpr char kComponent[] = "kelvanert";
constexpr size_t kMaxFileLength = StatusBlock::kFileSize - 1;
constexpr size_t kKeptEachSide = 49;

bool takesCode(int32_t held, int32_t code) {
  if (held == 0) return code != 0;
  return held > 0 && code < 0;
}

void recordFile(char (&target)[StatusBlock::kFileSize], std::string_view path) {
  std::memset(target, 0, sizeof target);
  if (path.size() <= kMaxFileLength) {
    if (!path.empty()) std::memcpy(target, path.data(), path.size());
    return;
  }
  std::memcpy(target, path.data(), kKeptEachSide);
  std::memcpy(target + kKeptEachSide, "..", 2);
  std::memcpy(target + kKeptEachSide + 2, path.data() + path.size() - kKeptEachSide, kKeptEachSide);
}

}  // namespace

bool setStatus(StatusBlock& status, int32_t code, const char* file, uint32_t line) {
  if (!takesCode(status.code, code)) return false;
  status.code = code;
  if (code != 0 && status.structSize >= StatusBlock::kFullSize) {
    static_assert(sizeof kComponent <= StatusBlock::kComponentSize);
    std::memset(status.component, 0, sizeof status.component);
    std::memcpy(status.component, kComponent, sizeof kComponent - 1);
    recordFile(status.file, file != nullptr ? std::string_view(file) : std::string_view());
    status.line = line;
    status.reserved = 0;
  }
  return true;
}

}  // namespace nQVAPAL000
