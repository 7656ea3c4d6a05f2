// The session's log stream and the failure report.
#include "logging/SessionLog.h"

#include <cstdio>
#include <utility>

#include "hostlink/LinkedSession.h"
#include "hostlink/MessageHeader.h"
#include "hostlink/SendReply.h"
#include "logging/LogNameRegistry.h"
#include "platform/Drive.h"

namespace nKV_DLL300 {

namespace {

void SendLogError(const LinkedSession& session, int32_t code) {
  char text[sizeof kLogErrorFormat + 16];
  std::snprintf(text, sizeof text, kLogErrorFormat, code);
  // Logging never waits for a host: a report the host cannot take now is dropped (the code stays
  // in lastStatus, which every later header carries).
  SendTextWithoutWaiting(*session.connection, text, &session, kMessageErrorText);
}

}  // namespace

SessionLog::~SessionLog() {
  if (logFile_ != nullptr) std::fclose(logFile_);
  releaseFile();
}

bool SessionLog::claimFile(const std::string& runtimePath) {
  releaseFile();
  std::string file = platform::ResolvedNativePath(runtimePath);
  if (file.empty()) return true;
  if (!TheLogNameRegistry().claim(file)) return false;
  claimedFile_ = std::move(file);
  return true;
}

void SessionLog::releaseFile() {
  if (claimedFile_.empty()) return;
  TheLogNameRegistry().release(claimedFile_);
  claimedFile_.clear();
}

bool SessionLog::openStream(const std::string& runtimePath, const char* mode) {
  if (logFile_ != nullptr) (void)closeStream();
  logFile_ = platform::OpenFile(runtimePath, mode);
  if (logFile_ == nullptr) return false;
  std::setvbuf(logFile_, nullptr, _IONBF, 0);  // the batch buffer is the only one
  batchUsed_ = 0;
  unflushed_ = false;
  flushWatch_.Restart();
  return true;
}

bool SessionLog::write(const void* bytes, size_t size) {
  unflushed_ = true;
  return std::fwrite(bytes, 1, size, logFile_) == size;
}

void SessionLog::flushIfDue() {
  if (!unflushed_ || logFile_ == nullptr) return;
  if (flushWatch_.ElapsedMilliseconds() < kFlushPeriodMs) return;
  unflushed_ = false;
  flushWatch_.Restart();
  if (std::fflush(logFile_) != 0) fail(kLogWriteIncomplete);
}

bool SessionLog::closeStream() {
  if (logFile_ == nullptr) return true;
  const bool whole = batchUsed_ == 0 || write(batch_, batchUsed_);
  batchUsed_ = 0;
  const bool flushed = std::fflush(logFile_) == 0;
  std::fclose(logFile_);
  logFile_ = nullptr;
  return whole && flushed;
}

char* SessionLog::batchSpace(size_t size) {
  if (size > kBatchBufferSize - batchUsed_) endBatch();
  return batch_ + batchUsed_;
}

void SessionLog::endBatch() {
  if (batchUsed_ == 0) return;
  const bool whole = logFile_ != nullptr && write(batch_, batchUsed_);
  batchUsed_ = 0;
  if (!whole) fail(kLogWriteIncomplete);
}

void SessionLog::fail(int32_t code) {
  session_.lastStatus.store(code);
  // The report names the code of this failure even if the other thread overwrote lastStatus
  // in between; the header shows lastStatus as it then is.
  SendLogError(session_, code);
}

void ReportLogError(const LinkedSession& session) {
  SendLogError(session, session.lastStatus.load());
}

}  // namespace nKV_DLL300
