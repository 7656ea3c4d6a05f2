// The abstract bus session that a host connection owns while a CAN, LIN or FlexRay session runs.
#pragma once

#include <atomic>
#include <cstdint>

namespace nKV_DLL300 {

class HostConnection;

// Created and destroyed by the service thread; its poll thread runs between startPollThread and
// stop. The virtual operations keep this slot order in every bus class.
class CBusSystem {
 public:
  explicit CBusSystem(HostConnection* owner) : connection(owner) {}
  CBusSystem(const CBusSystem&) = delete;
  CBusSystem& operator=(const CBusSystem&) = delete;

  virtual ~CBusSystem() = default;
  // Runs pollLoop while polling is active; returns its status, or 0 at once when paused.
  virtual int32_t pollOnce() = 0;
  // Stops polling, joins the poll thread, clears the driver session, closes the log file.
  virtual int32_t stop() = 0;
  virtual void startPollThread() = 0;
  virtual int32_t clearDriverSession() = 0;
  virtual int32_t pollLoop() = 0;
  virtual void reportBusState(uint64_t elapsedMilliseconds) = 0;

  // Used entries of the identifier table: written by the poll thread, read by SendReply anywhere.
  std::atomic<uint16_t> idCount{0};
  // Last non-zero driver status or program error code: written by both threads.
  std::atomic<int32_t> lastStatus{0};
  // The connection whose settings the session reads and to which it sends; it outlives the
  // session. Not owned.
  HostConnection* connection;
};

}  // namespace nKV_DLL300
