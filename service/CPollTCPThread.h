// The service thread's body.
#pragma once

#include "qvapal/iThread.h"

namespace nKV_DLL300 {

class ServiceContext;

class CPollTCPThread : public nQVAPAL000::iThread {
 public:
  explicit CPollTCPThread(ServiceContext* context) : context_(context) {}
  ~CPollTCPThread() override = default;
  void run() override;

 private:
  ServiceContext* context_;  // not owned; the context owns this body
};

}  // namespace nKV_DLL300
