// kvmon: watch a bus interface of the controller live.
#include "host/kvmon/KvmonTool.h"

int main(int argc, char** argv) { return kvmon::RunKvmon(argc, argv); }
