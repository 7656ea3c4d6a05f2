// The transmit side of an output session: queued frames (mode 10) or the single-point frame with
// the driver's cyclic repetition (mode 11). It is a source of frames on its CAN bus.
#pragma once

#include <deque>

#include "tarvix/CanSource.h"
#include "tarvix/SessionSetup.h"

namespace tarvix {

// Thread safety: used with the owning bus's mutex held.
class OutputQueue final : public CanSource {
 public:
  OutputQueue(uint32_t mode, uint32_t capacity);

  bool full() const;
  // Takes a frame written at nowNs, sent with the timing of its database frame.
  void write(const SimFrame& frame, const FrameDefinition& definition, int64_t nowNs);
  // True when every written frame has been on the bus (kxWait 0x8001).
  bool complete() const;
  // Ends transmission: queued frames are dropped, the cyclic repetition stops.
  void halt();
  // While blocked (not started, wrong bit rate) nothing goes out.
  void setBlocked(bool blocked) { blocked_ = blocked; }

  const Pending* peek() override;
  void sent(int64_t startNs, int64_t endNs) override;
  void skipTo(int64_t nowNs) override;

 private:
  const uint32_t mode_;
  const uint32_t capacity_;
  bool blocked_ = true;
  std::deque<Pending> queue_;   // mode 10
  Pending latest_;              // mode 11
  bool due_ = false;            // mode 11: latest_ waits for the bus
  bool sentSinceWrite_ = true;  // mode 11
  int64_t periodNs_ = 0;        // mode 11: cyclic repetition, 0 none
};

}  // namespace tarvix
