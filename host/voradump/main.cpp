// vora-dump: lists and decodes measurement-data files.
#include "host/voradump/VoraDumpTool.h"

int main(int argc, char** argv) { return voradump::RunVoraDump(argc, argv); }
