// The poll thread body of a FlexRay session.
#pragma once

#include "bus/CPollDataThread.h"

namespace nKV_DLL300 {

class CPollFlexRayDataThread : public CPollDataThread {
 public:
  using CPollDataThread::CPollDataThread;
};

}  // namespace nKV_DLL300
