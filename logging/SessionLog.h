// The log state of one bus session: its open text or binary stream, the measurement-data handles,
// the writers' batch buffer, and how a logging failure reaches the host.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <string>

#include "logging/BinaryLogFormat.h"
#include "logging/TextLogFormat.h"
#include "timing/Stopwatch.h"

namespace nKV_DLL300 {

class LinkedSession;

// Logging error codes, stored in the session's lastStatus and reported to the host.
inline constexpr int32_t kLogOpenFailed = -20;       // not named, no directory, or not opened
inline constexpr int32_t kLogWriteIncomplete = -21;  // a header, record or line not written whole
inline constexpr int32_t kLogLibraryFailed = -24;    // the measurement-data library failed

// The text a logging failure sends (message type 5), "%d" being the code.
inline constexpr char kLogErrorFormat[] = "<ERROR:LOG FILE: %d> \n";

// Owned by its session (a member) and bound to it for life.
//
// Threads: the session's poll thread uses it between OpenLogFile and the end of its poll loop;
// the thread that stops the session uses it in CloseLogFile, after the poll thread was joined.
// The two never overlap, so nothing here is locked.
class SessionLog {
 public:
  explicit SessionLog(LinkedSession& session) : session_(session) {}
  // A stream still open (a session destroyed without stop) is closed without a report, and the
  // file it claimed is released.
  ~SessionLog();
  SessionLog(const SessionLog&) = delete;
  SessionLog& operator=(const SessionLog&) = delete;

  LinkedSession& session() const { return session_; }

  // The log type this run opened with; the writers and the close follow it, not a type the
  // host sets while the session runs (that one takes effect at the next run). -1: none yet.
  int32_t openedType() const { return openedType_; }
  void setOpenedType(int32_t type) { openedType_ = type; }
  // The record layout of a binary CAN log, fixed when the log is opened so that one file never
  // mixes the two layouts.
  BinaryRecordLayout canLayout() const { return canLayout_; }
  void setCanLayout(BinaryRecordLayout layout) { canLayout_ = layout; }
  // Whether LIN text lines carry the checksum column, fixed when the log is opened so that every
  // line follows the header.
  uint8_t linChecksum() const { return linChecksum_; }
  void setLinChecksum(uint8_t logChecksum) { linChecksum_ = logChecksum; }

  // The text or binary stream (logFile): open while a run logs to one. It is unbuffered: every
  // write below is one hand-over to the file.
  bool isOpen() const { return logFile_ != nullptr; }
  // Opens `runtimePath` (creating or truncating it) in `mode`; false when it cannot be opened.
  // A stream still open is closed first.
  bool openStream(const std::string& runtimePath, const char* mode);
  // Hands `size` bytes to the stream in one call; false when it took fewer.
  bool write(const void* bytes, size_t size);
  // Hands over what the batch still holds, then closes the stream; false when either failed.
  bool closeStream();
  // The stream is unbuffered (the batches are handed over whole), so this finds nothing left; it
  // stays as the guard of the rule. Hands what the stream buffers to the file when something was
  // written since the last flush and
  // that flush is kFlushPeriodMs old, so that a frame reaches the file within about a second
  // while the session runs (a host may follow the log). A failed flush stores -21 and reports it.
  // Called by the poll loop after every pass; costs a flag test when nothing was written.
  void flushIfDue();
  static constexpr uint64_t kFlushPeriodMs = 1000;

  // Claims the file `runtimePath` reaches for this session (LogNameRegistry); false when another
  // session's log holds it. A path that cannot be resolved claims nothing and returns true: its
  // open fails by itself. A file claimed before is released first.
  [[nodiscard]] bool claimFile(const std::string& runtimePath);
  // Releases the claimed file, if any.
  void releaseFile();

  // Stores `code` in the session's lastStatus and sends it to the host at once, if the host can
  // take it now (SendTextWithoutWaiting).
  void fail(int32_t code);

  // The writers collect the lines or records of a batch here and hand them to the file in one
  // write. batchSpace returns room for `size` bytes (at most kBatchLineRoom), handing over what
  // the buffer holds first when it lacks that room; batchAppended adds the `size` bytes written
  // there; endBatch hands over the rest. A hand-over that the file does not take whole reports
  // -21 once and is dropped; the next one is tried as usual.
  char* batchSpace(size_t size);
  void batchAppended(size_t size) { batchUsed_ += size; }
  void endBatch();
  // Room for the longest text line and the largest binary record.
  static constexpr size_t kBatchLineRoom = kTextLineCapacity;

  // Handles of the measurement-data branch (voraFile, voraChannel); -1 when none is open.
  int32_t voraFile = -1;
  int32_t voraChannel = -1;

 private:
  LinkedSession& session_;
  std::FILE* logFile_ = nullptr;
  bool unflushed_ = false;  // bytes were written since the last flush
  Stopwatch flushWatch_;    // since the last flush (or the open)
  int32_t openedType_ = -1;
  std::string claimedFile_;  // the resolved path claimed in the registry; "" when none
  BinaryRecordLayout canLayout_ = BinaryRecordLayout::kFixed24;
  uint8_t linChecksum_ = 0;
  // What a batch collects before it is handed over (usually a whole batch: about 20 ms of a
  // saturated bus take a quarter of it).
  static constexpr size_t kBatchBufferSize = 64 * 1024;
  static_assert(kBatchBufferSize > 2 * kBatchLineRoom);
  size_t batchUsed_ = 0;
  char batch_[kBatchBufferSize];
};

// Sends the session's lastStatus as "<ERROR:LOG FILE: %d> \n" (message type 5), with the session
// attached so that the header carries lastStatus too, without waiting for the host. Any thread
// of the session.
void ReportLogError(const LinkedSession& session);

}  // namespace nKV_DLL300
