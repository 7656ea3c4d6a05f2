// The poll thread body of a CAN session.
#pragma once

#include "bus/CPollDataThread.h"

namespace nKV_DLL300 {

class CPollCANDataThread : public CPollDataThread {
 public:
  using CPollDataThread::CPollDataThread;
};

}  // namespace nKV_DLL300
