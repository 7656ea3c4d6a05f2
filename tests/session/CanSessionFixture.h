// CAN sessions over TCP: the shared bus-session fixture under the name the log tests build on.
#pragma once

#include "tests/support/BusSessionFixture.h"

namespace kvtest {

using CanSessionTest = BusSessionTest;

}  // namespace kvtest
