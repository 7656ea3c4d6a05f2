// Out-of-line destructor so the interface's vtable lives in one place.
#include "qvapal/iThread.h"

namespace nQVAPAL000 {

iThread::~iThread() = default;

}  // namespace nQVAPAL000
