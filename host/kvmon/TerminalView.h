// kvmon's live terminal table: the identifiers of every session updated in place, changed payload
// bytes highlighted, the statistics below, and keys to pause, clear, sort and scroll.
#pragma once

#include <cstdio>
#include <functional>
#include <optional>
#include <string>
#include <vector>

#include "host/kvmon/Display.h"
#include "host/kvmon/RowSelection.h"
#include "host/kvmon/TerminalKeys.h"

namespace kvmon {

struct TerminalSize {
  int columns = 80;
  int rows = 24;
};

// The frame a session transmits, for the title: its row is found by the echo of the frame.
struct TransmitWatch {
  const SourceModel* source = nullptr;
  uint32_t identifier = 0;  // with the CAN extended bit
  uint8_t type = 0;         // the record type the echo carries
  std::string text;         // "123#11223344 every 100 ms"
};

// What the tool must do after a key.
enum class KeyAction : uint8_t { kNone, kQuit, kClear };

// Draws with ANSI escape sequences on `out`, which must be a terminal; `size` is asked before
// every drawing (the window may have changed). With more than one source the rows carry an
// interface column and each source gets its statistics lines.
class TerminalView : public Display {
 public:
  TerminalView(std::vector<const SourceModel*> sources, std::string title, ViewOptions view,
               std::FILE* out, std::function<TerminalSize()> size);

  void showRecords(const SourceModel& source, size_t firstRow) override;
  void showStatistics(const SourceModel& source) override;
  void showNotice(const std::string& words) override;
  void close() override;
  bool failed() const override { return failed_; }

  void setTransmit(TransmitWatch watch) { transmit_ = std::move(watch); }
  // Pause, sort, timing and scrolling are handled here (and redrawn); quit and clear are the
  // tool's.
  KeyAction handleKey(Key key);

  // The screen's lines without escape sequences other than the highlighting, for `size`.
  std::vector<std::string> lines(TerminalSize size) const;

 private:
  // Draws the screen; a paused view only when `evenPaused`.
  void draw(bool evenPaused = false);
  size_t rowRoom(TerminalSize size) const;
  // The largest scroll that still fills the rows' room.
  size_t lastScroll(size_t rows, TerminalSize size) const;
  std::string titleLine(size_t shown) const;
  std::string headerLine(int width) const;
  std::string rowLine(const ShownRow& row, int columns) const;
  std::string payloadText(const LiveRow& row, int room) const;
  std::string timingText(const ShownRow& row) const;
  std::vector<std::string> statisticsLines(int width) const;
  int idWidth() const;

  std::vector<const SourceModel*> sources_;
  std::string title_;
  ViewOptions view_;
  std::optional<TransmitWatch> transmit_;
  std::string notice_;
  std::FILE* out_;
  std::function<TerminalSize()> size_;
  size_t scroll_ = 0;  // rows scrolled off the top
  bool paused_ = false;
  bool started_ = false;
  bool failed_ = false;
};

}  // namespace kvmon
