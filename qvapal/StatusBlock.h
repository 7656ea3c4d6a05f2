// The fixed-size status record of the thread support and its precedence rule.
#pragma once

#include <cstddef>
#include <cstdint>

namespace nQVAPAL000 {

// Record layout, 164 bytes in all (the tail is not used by the thread support):
//   0 structSize  u32   size the caller declares; details are filled only when >= 164
//   4 code        i32   0 success, > 0 warning, < 0 error
//   8 component   char[10]  "kelvanert", NUL-terminated
//  18 file        char[101] source path of the code, NUL-terminated, at most 100 characters
// 120 line        u32
// 124 reserved    u32   0
// 128 unused      36 bytes
struct StatusBlock {
  static constexpr uint32_t kFullSize = 164;
  static constexpr size_t kComponentSize = 10;
  static constexpr size_t kFileSize = 101;

  uint32_t structSize = kFullSize;
  int32_t code = 0;
  char component[kComponentSize] = {};
  char file[kFileSize] = {};
  uint32_t line = 0;
  uint32_t reserved = 0;
  uint8_t unused[36] = {};

  bool isError() const { return code < 0; }
};

static_assert(sizeof(StatusBlock) == StatusBlock::kFullSize);
static_assert(offsetof(StatusBlock, code) == 4);
static_assert(offsetof(StatusBlock, component) == 8);
static_assert(offsetof(StatusBlock, file) == 18);
static_assert(offsetof(StatusBlock, line) == 120);
static_assert(offsetof(StatusBlock, reserved) == 124);

// Takes `code` when the status holds 0 and code is not 0, or when it holds a warning and code
// is an error; returns whether it was taken. A taken non-zero code with structSize >= 164 also
// records component "kelvanert", `file` (a path over 100 characters is kept as its first 49,
// "..", and its last 49) and `line`. `file` may be null (recorded as empty).
bool setStatus(StatusBlock& status, int32_t code, const char* file, uint32_t line);

}  // namespace nQVAPAL000
