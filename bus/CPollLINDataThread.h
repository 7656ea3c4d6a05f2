// The poll thread body of a LIN session.
#pragma once

#include "bus/CPollDataThread.h"

namespace nKV_DLL300 {

class CPollLINDataThread : public CPollDataThread {
 public:
  using CPollDataThread::CPollDataThread;
};

}  // namespace nKV_DLL300
