// The log test programs list this unit; the fixture itself lives in tests/support.
#include "tests/session/CanSessionFixture.h"
