// Keys typed in kvmon's live table: the terminal switched to reading single keys without echo,
// and the bytes it sends turned into keys.
#pragma once

#include <optional>
#include <string>
#include <vector>

namespace kvmon {

enum class Key : uint8_t {
  kQuit,      // q
  kPause,     // space or p: the table stops updating (the session goes on)
  kClear,     // c: the controller's table and statistics start again
  kSort,      // s: the next sort order
  kTiming,    // t: timing columns instead of the payload, and back
  kUp,        // arrow up or k
  kDown,      // arrow down or j
  kPageUp,    // Page Up or b
  kPageDown,  // Page Down or f
  kHome,      // Home or g
  kEnd,       // End or G
};

// The keys in `bytes` as a terminal sends them; other bytes are skipped.
std::vector<Key> DecodeKeys(const std::string& bytes);

// Standard input in single-key mode while the object lives: no line buffering, no echo; Ctrl-C
// still interrupts. Moving transfers the duty to restore the terminal.
class TerminalKeys {
 public:
  // nullopt when standard input is no terminal.
  static std::optional<TerminalKeys> open();
  TerminalKeys(TerminalKeys&& other) noexcept;
  TerminalKeys& operator=(TerminalKeys&&) = delete;
  ~TerminalKeys();

  // The keys typed since the last call, without waiting.
  std::vector<Key> read();
  int fd() const { return fd_; }

  // Puts the terminal back as it was; safe in a signal handler (the second Ctrl-C).
  static void restoreFromSignal();

 private:
  explicit TerminalKeys(int fd) : fd_(fd) {}
  int fd_ = -1;
};

}  // namespace kvmon
