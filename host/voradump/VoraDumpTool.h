// vora-dump: lists a measurement-data file and decodes its channels to text log lines.
#pragma once

#include <cstdio>
#include <string>

#include "host/voradump/RecordDecoder.h"
#include "host/voradump/VoraReader.h"

namespace voradump {

struct DumpSelection {
  bool decode = false;
  std::string group;    // empty: every group
  std::string channel;  // empty: every channel
  bool hasGroup = false;
  bool hasChannel = false;
  DecodeOptions options;
  const char* tool = "vora-dump";  // names the tool in the messages on `err`
};

// Lists the file's groups, channels and properties, or (with `decode`) writes the text log of every
// selected channel to `out`; problems go to `err`, naming the file and the channel. A damaged
// channel does not stop the others. Returns the process exit code: 0 done, 1 the file or a channel
// could not be read or written.
int DumpVoraFile(const std::string& path, const DumpSelection& selection, std::FILE* out,
                 std::FILE* err);

// Names on `err` what of `group` cannot be read and is selected: the group itself, or objects
// below it ("TOOL: FILE: group "G" object "X": cannot be read: the file is damaged"). Returns false
// when there was something to name.
bool ReportUnreadable(const Group& group, const DumpSelection& selection, const std::string& path,
                      std::FILE* err);

// The command line of vora-dump. Returns the exit code (2 for a usage error).
int RunVoraDump(int argc, char** argv);

// A name in double quotes, bytes that are not printable written as \xNN.
std::string Quoted(const std::string& name);

}  // namespace voradump
