// The body of a thread started by a tThreadController.
#pragma once

namespace nQVAPAL000 {

// run() executes on the new thread and must end by itself (for example by watching an atomic
// flag) before the controller's join can return. The body must outlive its thread.
class iThread {
 public:
  virtual ~iThread();
  virtual void run() = 0;
};

}  // namespace nQVAPAL000
