// The body of a bus session's poll thread; the three bus classes share its run.
#pragma once

#include "bus/CBusSystem.h"
#include "qvapal/iThread.h"

namespace nKV_DLL300 {

// Holds its session without owning it; the session owns the body and joins its thread before
// either is destroyed.
class CPollDataThread : public nQVAPAL000::iThread {
 public:
  explicit CPollDataThread(CBusSystem* session) : session_(session) {}
  ~CPollDataThread() override = default;
  void run() override { session_->run(); }

 private:
  CBusSystem* const session_;
};

}  // namespace nKV_DLL300
