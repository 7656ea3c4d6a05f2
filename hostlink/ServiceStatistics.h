// Counters of the host link that any thread may read, for monitoring and tests.
#pragma once

#include <atomic>
#include <cstdint>

namespace nKV_DLL300 {

// Every field is an atomic: the service thread and the poll threads count, anyone reads.
struct ServiceStatistics {
  std::atomic<uint32_t> connectionsAccepted{0};
  std::atomic<uint32_t> connectionsEnded{0};  // slots freed, for whatever reason
  std::atomic<uint32_t> connectionsOpen{0};   // occupied slots
  std::atomic<uint32_t> messagesReceived{0};  // counted before the message is handled
  std::atomic<uint32_t> heartbeatTimeouts{0};
  std::atomic<uint32_t> failedSends{0};  // sends whose result was not 0
  // Identifier-record, statistics and log-report messages of the poll threads dropped whole
  // because their host could not take them at once (a slow host); see SnapshotSend.
  std::atomic<uint32_t> snapshotsSkipped{0};
};

}  // namespace nKV_DLL300
