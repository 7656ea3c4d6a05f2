// The poll loop that the three bus sessions share: read, pace, fold into the identifier table,
// send.
#pragma once

#include <algorithm>
#include <cstdint>
#include <memory>

#include "bus/CBusSystem.h"
#include "bus/IdentifierTable.h"
#include "driver/RawFrame.h"
#include "driver/tarvix.h"
#include "hostlink/HostConnection.h"
#include "hostlink/MessageHeader.h"
#include "hostlink/SendReply.h"
#include "logging/LogWriters.h"
#include "timing/Stopwatch.h"

namespace nKV_DLL300 {

// How a poll loop paces its reads while frames flow. Either way a read that finds nothing is
// followed by one that waits in the driver for the next frame or the loop's next duty.
enum class ReadPacing {
  // A nearly full read (>= 99 % of the buffer) is followed by the next read at once, up to ten in
  // a row; after every other read the thread pauses (CAN, FlexRay).
  kNearlyFullRule,
  // The thread pauses after every read (LIN).
  kAlwaysSleep,
};

// A bus session with an identifier table of `Rules`, a statistics block of `Statistics` (sent as
// it is held) and a read buffer of kReadBufferSize bytes. It defines pollLoop; the bus class adds
// its open operation, startPollThread, reportBusState and the bus-specific steps below. Every
// member here is the poll thread's, except where CBusSystem says otherwise.
template <class Rules, class Statistics, uint32_t kReadBufferSize>
class CTableSession : public CBusSystem {
 public:
  using Table = IdentifierTable<Rules>;

  ~CTableSession() override { endForDestruction(); }

  // Slot 5: the poll loop. Allocates the table (none: -22 in lastStatus, and the loop does not
  // run; the next pollOnce tries again, with the capacity then set), reads while pollActive, and
  // sends the records and statistics at their periods. While frames flow it reads a batch, then
  // pauses (kBusyPauseMs, or less up to the next duty); once a read finds nothing, the next one
  // waits in the driver until a frame comes or the next duty is due (at most kQuietWaitMs). A
  // stop ends both waits at once. Returns the last read's status (0 if none was made, when a stop
  // ended the read, and for "nothing to read yet", which is no failure: a paused session must not
  // report it as its last error).
  int32_t pollLoop() override {
    if (!beginLoop()) {
      recordStatus(kStatusTableNotAllocated);
      return kStatusTableNotAllocated;
    }
    int32_t status = 0;
    while (pollActive.load()) status = pollPass();
    table.reset();
    return status == kReadNothingYet ? 0 : status;
  }

 protected:
  CTableSession(HostConnection* owner, driver::BusKind kind, ReadPacing pacing)
      : CBusSystem(owner, kind), pacing_(pacing) {}

  // Bus-specific steps of the loop (called in the poll thread).
  virtual const char* logHeaderLine() const = 0;
  // Step 3 of the loop, after the table and before the first read.
  virtual void prepareLoop() {}
  // Frames in a batch of `bytes` bytes, as the log writer is told.
  virtual uint32_t batchFrameCount(uint32_t bytes) const = 0;
  // Hands a batch to the bus's log writer while logFileEnabled is set.
  virtual void logBatch(const uint8_t* batch, uint32_t bytes, uint32_t frames) {
    switch (busType) {
      case driver::BusKind::kLin:
        WriteLinLog(sessionLog, batch, bytes, frames);
        break;
      case driver::BusKind::kFlexRay:
        WriteFlexRayLog(sessionLog, batch, bytes, frames);
        break;
      default:
        WriteCanLog(sessionLog, batch, bytes, frames);
        break;
    }
  }
  // A frame that passed the table's filters (listed or not: a full table still counts it), while
  // txTimeStatistic > 0.
  virtual void countFrame(const driver::RawFrameView& frame, bool inWindow) = 0;

  // reportBusState, step 1: a new statistics period starts now.
  void beginReport() { stateWatch.Restart(); }
  // The statistics block as one message of type 6, if the host can take it now; otherwise it is
  // skipped, and the next report carries the state of then.
  void sendStatistics() {
    SnapshotSend snapshot(*connection);
    if (!snapshot.hasRoom()) return snapshot.skip();
    snapshot.send(&statistics, this, kMessageStatistics, sizeof(Statistics));
  }
  // reportBusState, last step: true when the counting window has passed, and a new one begins.
  // The new window starts where the report's own period started (beginReport), so each report
  // closes exactly the period it covered; restarting it after the send instead would make the
  // next window end a little after the next report and be counted twice.
  bool closeWindowIfDue() {
    if (windowWatch.ElapsedMilliseconds() <= connection->settings.txTimeStatistic.load()) {
      return false;
    }
    windowWatch = stateWatch;
    return true;
  }

  uint8_t readBuffer[kReadBufferSize];  // filled by kxReadFrame
  Statistics statistics{};              // zeroed when a loop begins and at a reset
  std::unique_ptr<Table> table;         // while a loop runs

 private:
  static constexpr uint32_t kNearlyFullBytes = kReadBufferSize - kReadBufferSize / 100;
  static constexpr uint32_t kMaxBurst = 9;
  // The pause between reads while frames flow. The driver's receive queue holds 16384 frames by
  // default, 0.75 s of a saturated 1 Mbit/s bus, and a nearly full read is followed by the next
  // at once, so no queue overflows for it.
  static constexpr uint64_t kBusyPauseMs = 20;
  // The longest wait of a read on a quiet bus, so that a changed period takes effect soon and a
  // CMD_SESSION_STOP ends the loop soon (stop() ends the wait at once).
  static constexpr uint64_t kQuietWaitMs = 250;
  static constexpr uint64_t kOwedRetryMs = 10;

  bool beginLoop() {
    table = Table::create(connection->settings.dataLogIdsMax.load(), tableResource);
    if (!table) return false;
    idCount.store(0);
    statistics = Statistics{};
    dataWatch.Restart();
    // The driver buffers frames from the moment the session was created; the first statistics
    // period and counting window start then too, so that the frames of a slow start (a J1939
    // address claim) are not counted as one second's worth.
    stateWatch = createdWatch;
    windowWatch = createdWatch;
    burst_ = 0;
    recordsOwed_ = false;
    quiet_ = false;
    if (connection->settings.logFileEnabled.load() != 0) OpenLogFile(sessionLog, logHeaderLine());
    prepareLoop();
    return true;
  }

  // One read and what follows it; returns the read's status.
  int32_t pollPass() {
    uint32_t bytes = 0;
    const double timeout = quiet_ ? static_cast<double>(quietWaitMs()) / 1000.0 : 0.0;
    const int32_t status = kxReadFrame(driverSession, readBuffer, kReadBufferSize, timeout, &bytes);
    if (!pollActive.load()) return 0;  // a stop ended the wait (a cleared session reads nothing)
    bytes = std::min(bytes, kReadBufferSize);  // never trust a count beyond the buffer
    if (status != 0 && status != kReadNothingYet) recordStatus(status);
    if (bytes > 0 && status >= 0) takeBatch(bytes);
    sessionLog.flushIfDue();
    SessionSettings& settings = connection->settings;
    if (dataWatch.ElapsedMilliseconds() > settings.txTimeData.load()) {
      sendIdentifierRecords();
    } else if (recordsOwed_) {
      sendOwedRecords();
    }
    const uint32_t statisticPeriod = settings.txTimeStatistic.load();
    if (statisticPeriod > 0) {
      const uint64_t elapsed = stateWatch.ElapsedMilliseconds();
      if (elapsed > statisticPeriod) reportBusState(elapsed);
    }
    pace(bytes);
    return status;
  }

  // Milliseconds until the next identifier-record or statistics message is due (0: now); records
  // owed to a slow host are tried again every kOwedRetryMs.
  uint64_t msUntilNextDuty() const {
    const SessionSettings& settings = connection->settings;
    uint64_t next = MsUntil(dataWatch, settings.txTimeData.load());
    if (recordsOwed_) next = std::min(next, kOwedRetryMs);
    const uint32_t statisticPeriod = settings.txTimeStatistic.load();
    if (statisticPeriod > 0) next = std::min(next, MsUntil(stateWatch, statisticPeriod));
    return next;
  }
  // A message of `period` is due once more than `period` ms have passed on `watch`.
  static uint64_t MsUntil(const Stopwatch& watch, uint64_t period) {
    const uint64_t elapsed = watch.ElapsedMilliseconds();
    return elapsed > period ? 0 : period + 1 - elapsed;
  }
  uint64_t quietWaitMs() const { return std::min(msUntilNextDuty(), kQuietWaitMs); }

  // After a read of `bytes`: a nearly full one is followed by the next read at once (the burst
  // rule), one that found frames by a pause, and one that found nothing by a waiting read.
  void pace(uint32_t bytes) {
    quiet_ = bytes == 0;
    if (pacing_ == ReadPacing::kNearlyFullRule && bytes >= kNearlyFullBytes &&
        burst_ <= kMaxBurst) {
      ++burst_;
      return;
    }
    if (burst_ > kMaxBurst) burst_ = 0;
    if (!quiet_) pausePollThread(std::min(msUntilNextDuty(), kBusyPauseMs));
  }

  void takeBatch(uint32_t bytes) {
    SessionSettings& settings = connection->settings;
    if (settings.logFileEnabled.load() != 0) logBatch(readBuffer, bytes, batchFrameCount(bytes));
    const TableSettings rules{settings.logTransmittedFrames.load(),
                              settings.logBusErrorFrames.load()};
    const uint32_t statisticPeriod = settings.txTimeStatistic.load();
    // A batch is read at one moment, so the window is looked at once per batch.
    const bool inWindow = windowWatch.ElapsedMilliseconds() < statisticPeriod;
    const int32_t status = table->updateIdentifierTable(readBuffer, bytes, rules,
                                                        [&](const driver::RawFrameView& frame) {
                                                          if (statisticPeriod > 0)
                                                            countFrame(frame, inWindow);
                                                        });
    recordStatus(status);
    idCount.store(table->idCount());
  }

  // The periodic identifier records. A host that cannot take them now misses this report; it
  // gets the table as soon as it has room again (sendOwedRecords), not a period later.
  void sendIdentifierRecords() {
    if (resetRequested.exchange(false)) {
      statistics = Statistics{};
      table->reset();
      idCount.store(0);
    }
    dataWatch.Restart();
    recordsOwed_ = false;
    if (table->idCount() == 0) return;  // nothing is sent while the table is empty
    SnapshotSend snapshot(*connection);
    if (!snapshot.hasRoom()) {
      snapshot.skip();
      recordsOwed_ = true;
      return;
    }
    sendTable(snapshot);
  }

  // A report was skipped: the current table goes out once the host has room, and the period
  // starts again from there.
  void sendOwedRecords() {
    SnapshotSend snapshot(*connection);
    if (!snapshot.hasRoom()) return;  // the next period counts another skipped report
    dataWatch.Restart();
    recordsOwed_ = false;
    sendTable(snapshot);
  }

  // Every message of the table, in one snapshot: all of them go out or none.
  void sendTable(SnapshotSend& snapshot) {
    (void)table->sendIdentifierRecords(
        false, [&](uint8_t type, const void* payload, uint32_t length, uint16_t records) {
          snapshot.send(payload, this, type, length, records);
          return 0;  // a broken link is in lastTcpError; the loop reads on
        });
  }

  const ReadPacing pacing_;
  uint32_t burst_ = 0;        // nearly full reads in a row
  bool recordsOwed_ = false;  // the last identifier report was skipped for want of room
  bool quiet_ = false;        // the last read found nothing: the next one waits
};

}  // namespace nKV_DLL300
