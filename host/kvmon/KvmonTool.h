// kvmon: a live monitor of one bus interface of the controller, for people and for scripts.
#pragma once

namespace kvmon {

// The command line of kvmon. Returns the exit code: 0 the session ended normally, 1 the
// controller refused or the connection failed, 2 a usage error.
int RunKvmon(int argc, char** argv);

}  // namespace kvmon
