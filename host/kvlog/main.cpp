// kvlog: converts the controller's logs to text logs and candump logs.
#include "host/kvlog/KvlogTool.h"

int main(int argc, char** argv) { return kvlog::RunKvlog(argc, argv); }
