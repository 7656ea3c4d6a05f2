// termios for single keys, and the escape sequences of the keys kvmon knows.
#include "host/kvmon/TerminalKeys.h"

#include <termios.h>
#include <unistd.h>

#include <algorithm>
#include <cstring>

namespace kvmon {
namespace {

// The terminal's settings before kvmon changed them; read by the signal handler.
struct termios gSaved;
volatile bool gChanged = false;

struct Sequence {
  const char* bytes;
  Key key;
};
// Longest first, so that a sequence is not taken for its beginning.
constexpr Sequence kSequences[] = {
    {"\x1b[5~", Key::kPageUp}, {"\x1b[6~", Key::kPageDown},
    {"\x1b[1~", Key::kHome},   {"\x1b[4~", Key::kEnd},
    {"\x1b[A", Key::kUp},      {"\x1b[B", Key::kDown},
    {"\x1b[H", Key::kHome},    {"\x1b[F", Key::kEnd},
    {"\x1bOH", Key::kHome},    {"\x1bOF", Key::kEnd},
    {"q", Key::kQuit},         {"Q", Key::kQuit},
    {" ", Key::kPause},        {"p", Key::kPause},
    {"c", Key::kClear},        {"s", Key::kSort},
    {"t", Key::kTiming},       {"k", Key::kUp},
    {"j", Key::kDown},         {"b", Key::kPageUp},
    {"f", Key::kPageDown},     {"g", Key::kHome},
    {"G", Key::kEnd},
};

}  // namespace

std::vector<Key> DecodeKeys(const std::string& bytes) {
  std::vector<Key> keys;
  size_t at = 0;
  while (at < bytes.size()) {
    size_t used = 1;
    for (const auto& sequence : kSequences) {
      const size_t n = std::strlen(sequence.bytes);
      if (bytes.compare(at, n, sequence.bytes) == 0) {
        keys.push_back(sequence.key);
        used = n;
        break;
      }
    }
    // An unknown escape sequence is skipped whole: ESC, '[' or 'O', then up to its final byte.
    if (used == 1 && bytes[at] == '\x1b' && at + 1 < bytes.size() &&
        (bytes[at + 1] == '[' || bytes[at + 1] == 'O')) {
      used = 2;
      while (at + used < bytes.size() && (bytes[at + used] < 0x40 || bytes[at + used] > 0x7E))
        ++used;
      used = std::min(used + 1, bytes.size() - at);
    }
    at += used;
  }
  return keys;
}

std::optional<TerminalKeys> TerminalKeys::open() {
  if (!isatty(STDIN_FILENO) || tcgetattr(STDIN_FILENO, &gSaved) != 0) return std::nullopt;
  struct termios keys = gSaved;
  keys.c_lflag &= ~static_cast<tcflag_t>(ICANON | ECHO);
  keys.c_cc[VMIN] = 0;
  keys.c_cc[VTIME] = 0;
  if (tcsetattr(STDIN_FILENO, TCSANOW, &keys) != 0) return std::nullopt;
  gChanged = true;
  return TerminalKeys(STDIN_FILENO);
}

TerminalKeys::TerminalKeys(TerminalKeys&& other) noexcept : fd_(other.fd_) { other.fd_ = -1; }

TerminalKeys::~TerminalKeys() {
  if (fd_ < 0) return;
  tcsetattr(fd_, TCSANOW, &gSaved);
  gChanged = false;
}

void TerminalKeys::restoreFromSignal() {
  if (gChanged) tcsetattr(STDIN_FILENO, TCSANOW, &gSaved);
}

std::vector<Key> TerminalKeys::read() {
  std::string bytes;
  char chunk[64];
  ssize_t n = 0;
  while ((n = ::read(fd_, chunk, sizeof chunk)) > 0) bytes.append(chunk, static_cast<size_t>(n));
  return DecodeKeys(bytes);
}

}  // namespace kvmon
