// kvlog: option parsing, input detection and the conversions.
#include "host/kvlog/KvlogTool.h"

#include <getopt.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <exception>
#include <filesystem>

#include "host/kvlog/BusCheck.h"
#include "host/kvlog/CandumpFormat.h"
#include "host/voradump/VoraDumpTool.h"
#include "host/voradump/VoraReader.h"
#include "logging/BinaryLogFormat.h"

namespace kvlog {
namespace {

using namespace nKV_DLL300;
using voradump::RecordBus;

const char kUsage[] =
    "Usage: kvlog [OPTIONS] FILE\n"
    "\n"
    "Examples:\n"
    "  kvlog --bus can run.zfl > run.txt            CAN binary log to the controller's text log\n"
    "  kvlog --bus can --candump run.zfl > run.log  CAN binary log to candump -l format\n"
    "  kvlog --bus lin --lin-checksum lin.zfl       LIN binary log with the checksum column\n"
    "  kvlog --bus flexray fr.zfl                   FlexRay binary log\n"
    "  kvlog run.vora                               measurement-data file, every channel\n"
    "  kvlog --candump -c CAN1 -o run.log run.vora  one CAN channel to candump -l format\n"
    "\n"
    "Converts the controller's logs: binary logs (.zfl) and measurement-data files (.vora) to the\n"
    "lines of the controller's text log, and CAN logs to the candump -l format that can-utils\n"
    "(canplayer, log2asc) and python-can (can.LogReader) read. A binary log does not name its "
    "bus:\n"
    "give it with --bus. Measurement-data channels name theirs.\n"
    "\n"
    "Options:\n"
    "  -b, --bus BUS           bus of a binary log: can, lin or flexray\n"
    "  -f, --format FORMAT     text (default) or candump (CAN only)\n"
    "      --candump           same as --format candump\n"
    "  -i, --interface NAME    interface name in candump lines (default can0)\n"
    "  -o, --output FILE       write to FILE instead of standard output\n"
    "  -g, --group NAME        measurement-data files: only channels of this group\n"
    "  -c, --channel NAME      measurement-data files: only channels of this name\n"
    "      --lin-checksum      LIN text: write the checksum column\n"
    "      --can-records MODE  CAN record sizes: auto (default), fixed (24 bytes, classic\n"
    "                          sessions) or variable (FD and J1939 sessions)\n"
    "  -h, --help              show this text\n"
    "\n"
    "Exit status: 0 converted (a cut last record, as in a copy taken while the controller wrote\n"
    "the log, is reported and skipped), 1 a file problem (unreadable, not a log, records of\n"
    "another bus than --bus), 2 a usage error.\n";

constexpr uint8_t kHdf5Signature[8] = {0x89, 'H', 'D', 'F', '\r', '\n', 0x1A, '\n'};

// Reads the whole file at `path`; false with `error` in plain words.
bool ReadWholeFile(const std::string& path, std::vector<uint8_t>& out, std::string& error) {
  std::error_code ignored;
  if (std::filesystem::is_directory(path, ignored)) {
    error = "it is a directory; give a log file in it";
    return false;
  }
  std::FILE* in = std::fopen(path.c_str(), "rb");
  if (in == nullptr) {
    error = std::strerror(errno);
    return false;
  }
  uint8_t chunk[65536];
  size_t n = 0;
  while ((n = std::fread(chunk, 1, sizeof chunk, in)) > 0) out.insert(out.end(), chunk, chunk + n);
  const bool failed = std::ferror(in) != 0;
  if (failed) error = std::strerror(errno);
  std::fclose(in);
  return !failed;
}

bool IsMeasurementFile(const std::string& path, const std::vector<uint8_t>& head) {
  return (head.size() >= 8 && std::memcmp(head.data(), kHdf5Signature, 8) == 0) ||
         (path.size() >= 5 && path.compare(path.size() - 5, 5, ".vora") == 0);
}

void ReportTrailing(uint64_t bytes, std::FILE* err) {
  if (bytes > 0) {
    std::fprintf(err,
                 "kvlog: the log ends in a cut record (a copy taken while the controller wrote "
                 "it?): %llu bytes after the last whole frame record skipped\n",
                 static_cast<unsigned long long>(bytes));
  }
}

int ConvertRecords(const uint8_t* records, size_t size, RecordBus bus,
                   const ConvertOptions& options, std::FILE* out, std::FILE* err) {
  if (options.format == OutputFormat::kText) {
    const auto result = voradump::WriteTextLog(records, size, bus, options.decode, out);
    ReportTrailing(result.trailingBytes, err);
    return result.writeFailed ? 1 : 0;
  }
  if (bus != RecordBus::kCan) {
    std::fprintf(err, "kvlog: the candump format holds CAN frames only\n");
    return 1;
  }
  const auto layout = voradump::RecordLayout(bus, options.decode.canRecords, records, size);
  const auto result = WriteCandumpLog(records, size, layout, options.interfaceName, out);
  ReportTrailing(result.trailingBytes, err);
  if (result.skipped > 0) {
    std::fprintf(
        err,
        "kvlog: %llu frames have no candump form (J1939 payloads over 8 bytes) and were left out\n",
        static_cast<unsigned long long>(result.skipped));
  }
  return result.writeFailed ? 1 : 0;
}

bool ChosenCanChannel(const voradump::Group& group, const voradump::Channel& channel,
                      const ConvertOptions& options) {
  const auto protocol = channel.IntegerProperty("QV_network_protocol");
  return (!options.hasGroup || group.name == options.group) &&
         (!options.hasChannel || channel.name == options.channel) && protocol &&
         voradump::BusOfProtocol(*protocol) == RecordBus::kCan;
}

// One CAN channel to candump lines; a channel that cannot be read is named on `err`.
int ConvertCanChannel(const voradump::VoraReader& reader, const std::string& path,
                      const voradump::Channel& channel, const ConvertOptions& options,
                      std::FILE* out, std::FILE* err) {
  std::vector<uint8_t> bytes;
  if (const std::string problem = reader.ReadBytes(channel, bytes); !problem.empty()) {
    std::fprintf(err, "kvlog: %s: group %s channel %s: %s\n", path.c_str(),
                 voradump::Quoted(channel.group).c_str(), voradump::Quoted(channel.name).c_str(),
                 problem.c_str());
    return 1;
  }
  return ConvertRecords(bytes.data(), bytes.size(), RecordBus::kCan, options, out, err);
}

int ConvertMeasurementFile(const std::string& path, const ConvertOptions& options, std::FILE* out,
                           std::FILE* err) {
  voradump::DumpSelection selection;
  selection.decode = true;
  selection.group = options.group;
  selection.hasGroup = options.hasGroup;
  selection.channel = options.channel;
  selection.hasChannel = options.hasChannel;
  selection.options = options.decode;
  selection.tool = "kvlog";
  if (options.format == OutputFormat::kText)
    return voradump::DumpVoraFile(path, selection, out, err);

  std::string error;
  const auto reader = voradump::VoraReader::Open(path, error);
  if (!reader) {
    std::fprintf(err, "kvlog: %s\n", error.c_str());
    return 1;
  }
  int status = 0;
  uint64_t converted = 0;
  for (const auto& group : reader->Groups()) {
    if (!voradump::ReportUnreadable(group, selection, path, err)) status = 1;
    for (const auto& channel : group.channels) {
      if (!ChosenCanChannel(group, channel, options)) continue;
      status = std::max(status, ConvertCanChannel(*reader, path, channel, options, out, err));
      ++converted;
    }
  }
  if (converted == 0) {
    std::fprintf(err, "kvlog: %s: no CAN channel to convert\n", path.c_str());
    return 1;
  }
  return status;
}

}  // namespace

CandumpResult WriteCandumpLog(const uint8_t* records, size_t size, BinaryRecordLayout layout,
                              const std::string& interfaceName, std::FILE* out) {
  CandumpResult result;
  BinaryRecordReader reader(records, size, layout);
  char line[kCandumpLineCapacity];
  driver::RawFrameView frame;
  while (reader.next(frame)) {
    const size_t n = FormatCandumpLine(line, sizeof line, frame, interfaceName);
    if (n == 0) {
      ++result.skipped;
      continue;
    }
    if (std::fwrite(line, 1, n, out) != n) {
      result.writeFailed = true;
      return result;
    }
    ++result.frames;
  }
  result.trailingBytes = reader.remaining();
  return result;
}

int ConvertBinaryLog(const std::vector<uint8_t>& file, const ConvertOptions& options,
                     std::FILE* out, std::FILE* err) {
  if (file.size() < kBinaryLogFileHeaderSize || !HasBinaryLogMagic(file.data(), file.size())) {
    std::fprintf(
        err, "kvlog: not a binary log: it does not begin with the 12-byte \"QV\" file header\n");
    return 1;
  }
  if (!options.bus) {
    std::fprintf(err,
                 "kvlog: a binary log does not name its bus: give --bus can, lin or flexray\n");
    return 2;
  }
  const uint8_t* records = file.data() + kBinaryLogFileHeaderSize;
  const size_t size = file.size() - kBinaryLogFileHeaderSize;
  const std::string foreign =
      ExplainForeignRecords(records, size, *options.bus, options.decode.canRecords);
  if (!foreign.empty()) {
    std::fprintf(err, "kvlog: %s\n", foreign.c_str());
    return 1;
  }
  return ConvertRecords(records, size, *options.bus, options, out, err);
}

int ConvertFile(const std::string& path, const std::vector<uint8_t>& file,
                const ConvertOptions& options, std::FILE* out, std::FILE* err) {
  return IsMeasurementFile(path, file) ? ConvertMeasurementFile(path, options, out, err)
                                       : ConvertBinaryLog(file, options, out, err);
}

namespace {

// Options without a short form.
enum LongOnly : int { kCandump = 256, kLinChecksum, kCanRecords };

// A usage error in plain words, and where to read more; always false.
bool Usage(std::FILE* err, const std::string& words) {
  std::fprintf(err, "kvlog: %s\nTry 'kvlog --help'.\n", words.c_str());
  return false;
}

bool SetFormat(ConvertOptions& options, const char* text, std::FILE* err) {
  if (std::strcmp(text, "text") == 0) {
    options.format = OutputFormat::kText;
  } else if (std::strcmp(text, "candump") == 0) {
    options.format = OutputFormat::kCandump;
  } else {
    return Usage(err, std::string("--format: '") + text + "' is not text or candump");
  }
  return true;
}

bool SetCanRecords(ConvertOptions& options, const char* text, std::FILE* err) {
  if (std::strcmp(text, "auto") == 0) {
    options.decode.canRecords = voradump::CanRecords::kAuto;
  } else if (std::strcmp(text, "fixed") == 0) {
    options.decode.canRecords = voradump::CanRecords::kFixed;
  } else if (std::strcmp(text, "variable") == 0) {
    options.decode.canRecords = voradump::CanRecords::kVariable;
  } else {
    return Usage(err, std::string("--can-records: '") + text + "' is not auto, fixed or variable");
  }
  return true;
}

// One option; false on a bad value (reported on `err`).
bool ApplyOption(int opt, const char* arg, ConvertOptions& options, std::string& output,
                 std::FILE* err) {
  switch (opt) {
    case 'b':
      options.bus = voradump::BusOfName(arg);
      return options.bus
                 ? true
                 : Usage(err, std::string("--bus: '") + arg + "' is not can, lin or flexray");
    case 'f':
      return SetFormat(options, arg, err);
    case kCandump:
      options.format = OutputFormat::kCandump;
      return true;
    case 'i':
      options.interfaceName = arg;
      return IsValidInterfaceName(options.interfaceName)
                 ? true
                 : Usage(err, "--interface needs 1 to 32 printable characters without blanks");
    case 'o':
      output = arg;
      return true;
    case 'g':
      options.group = arg;
      options.hasGroup = true;
      return true;
    case 'c':
      options.channel = arg;
      options.hasChannel = true;
      return true;
    case kLinChecksum:
      options.decode.linChecksum = 1;
      return true;
    case kCanRecords:
      return SetCanRecords(options, arg, err);
    default:
      return Usage(err, "unknown option or missing value");
  }
}

bool ParseOptions(int argc, char** argv, ConvertOptions& options, std::string& output, bool& help,
                  std::FILE* err) {
  static const option kOptions[] = {{"bus", required_argument, nullptr, 'b'},
                                    {"format", required_argument, nullptr, 'f'},
                                    {"candump", no_argument, nullptr, kCandump},
                                    {"interface", required_argument, nullptr, 'i'},
                                    {"output", required_argument, nullptr, 'o'},
                                    {"group", required_argument, nullptr, 'g'},
                                    {"channel", required_argument, nullptr, 'c'},
                                    {"lin-checksum", no_argument, nullptr, kLinChecksum},
                                    {"can-records", required_argument, nullptr, kCanRecords},
                                    {"help", no_argument, nullptr, 'h'},
                                    {nullptr, 0, nullptr, 0}};
  optind = 1;
  opterr = 0;
  for (int opt; (opt = getopt_long(argc, argv, "b:f:i:o:g:c:h", kOptions, nullptr)) != -1;) {
    if (opt == 'h') {
      help = true;
      return true;
    }
    if (opt == '?' || opt == ':') {
      return Usage(err, std::string("unknown option or missing value: ") + argv[optind - 1]);
    }
    if (!ApplyOption(opt, optarg, options, output, err)) return false;
  }
  if (optind == argc) return Usage(err, "name the log file to convert");
  if (optind + 1 < argc) return Usage(err, "one log file at a time");
  return true;
}

int Convert(const std::string& input, const ConvertOptions& options, const std::string& output) {
  std::vector<uint8_t> file;
  std::string error;
  if (!ReadWholeFile(input, file, error)) {
    std::fprintf(stderr, "kvlog: cannot read %s: %s\n", input.c_str(), error.c_str());
    return 1;
  }
  std::FILE* out = output.empty() ? stdout : std::fopen(output.c_str(), "w");
  if (out == nullptr) {
    std::fprintf(stderr, "kvlog: cannot write %s: %s\n", output.c_str(), std::strerror(errno));
    return 1;
  }
  int status = ConvertFile(input, file, options, out, stderr);
  if ((out == stdout ? std::fflush(out) : std::fclose(out)) != 0) status = 1;
  return status;
}

}  // namespace

int RunKvlog(int argc, char** argv) {
  ConvertOptions options;
  std::string output;
  bool help = false;
  if (!ParseOptions(argc, argv, options, output, help, stderr)) return 2;
  if (help) {
    std::fputs(kUsage, stdout);
    return 0;
  }
  try {
    return Convert(argv[optind], options, output);
  } catch (const std::exception& failure) {  // out of memory for a huge file, for example
    std::fprintf(stderr, "kvlog: %s: %s\n", argv[optind], failure.what());
    return 1;
  }
}

}  // namespace kvlog
