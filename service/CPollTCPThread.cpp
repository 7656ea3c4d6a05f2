// The service thread's body runs the service of its context.
#include "service/CPollTCPThread.h"

#include "service/ServiceContext.h"

namespace nKV_DLL300 {

void CPollTCPThread::run() { RunService(*context_); }

}  // namespace nKV_DLL300
