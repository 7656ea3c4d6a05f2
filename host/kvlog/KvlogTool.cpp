// kvlog: option parsing, input detection and the conversions.
#include "host/kvlog/KvlogTool.h"

#include <getopt.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <fstream>
#include <iterator>

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
    "  -h, --help              show this text\n";

constexpr uint8_t kHdf5Signature[8] = {0x89, 'H', 'D', 'F', '\r', '\n', 0x1A, '\n'};

bool ReadWholeFile(const std::string& path, std::vector<uint8_t>& out) {
  std::ifstream in(path, std::ios::binary);
  if (!in) return false;
  out.assign(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
  return !in.bad();
}

bool IsMeasurementFile(const std::string& path, const std::vector<uint8_t>& head) {
  return (head.size() >= 8 && std::memcmp(head.data(), kHdf5Signature, 8) == 0) ||
         (path.size() >= 5 && path.compare(path.size() - 5, 5, ".vora") == 0);
}

void ReportTrailing(uint64_t bytes, std::FILE* err) {
  if (bytes > 0) {
    std::fprintf(err, "kvlog: %llu bytes after the last whole frame record ignored\n",
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

bool ParseOptions(int argc, char** argv, ConvertOptions& options, std::string& output, bool& help);

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
  return ConvertRecords(file.data() + kBinaryLogFileHeaderSize,
                        file.size() - kBinaryLogFileHeaderSize, *options.bus, options, out, err);
}

int ConvertFile(const std::string& path, const std::vector<uint8_t>& file,
                const ConvertOptions& options, std::FILE* out, std::FILE* err) {
  return IsMeasurementFile(path, file) ? ConvertMeasurementFile(path, options, out, err)
                                       : ConvertBinaryLog(file, options, out, err);
}

namespace {

bool ParseOptions(int argc, char** argv, ConvertOptions& options, std::string& output, bool& help) {
  enum { kCandump = 256, kLinChecksum, kCanRecords };
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
  for (int opt; (opt = getopt_long(argc, argv, "b:f:i:o:g:c:h", kOptions, nullptr)) != -1;) {
    switch (opt) {
      case 'b':
        options.bus = voradump::BusOfName(optarg);
        if (!options.bus) return false;
        break;
      case 'f':
        if (std::strcmp(optarg, "text") == 0)
          options.format = OutputFormat::kText;
        else if (std::strcmp(optarg, "candump") == 0)
          options.format = OutputFormat::kCandump;
        else
          return false;
        break;
      case kCandump:
        options.format = OutputFormat::kCandump;
        break;
      case 'i':
        options.interfaceName = optarg;
        if (!IsValidInterfaceName(options.interfaceName)) return false;
        break;
      case 'o':
        output = optarg;
        break;
      case 'g':
        options.group = optarg;
        options.hasGroup = true;
        break;
      case 'c':
        options.channel = optarg;
        options.hasChannel = true;
        break;
      case kLinChecksum:
        options.decode.linChecksum = 1;
        break;
      case kCanRecords:
        if (std::strcmp(optarg, "auto") == 0)
          options.decode.canRecords = voradump::CanRecords::kAuto;
        else if (std::strcmp(optarg, "fixed") == 0)
          options.decode.canRecords = voradump::CanRecords::kFixed;
        else if (std::strcmp(optarg, "variable") == 0)
          options.decode.canRecords = voradump::CanRecords::kVariable;
        else
          return false;
        break;
      case 'h':
        help = true;
        return true;
      default:
        return false;
    }
  }
  return optind + 1 == argc;
}

}  // namespace

int RunKvlog(int argc, char** argv) {
  ConvertOptions options;
  std::string output;
  bool help = false;
  if (!ParseOptions(argc, argv, options, output, help)) {
    std::fputs(kUsage, stderr);
    return 2;
  }
  if (help) {
    std::fputs(kUsage, stdout);
    return 0;
  }
  const std::string input = argv[optind];
  std::vector<uint8_t> file;
  if (!ReadWholeFile(input, file)) {
    std::fprintf(stderr, "kvlog: cannot read %s: %s\n", input.c_str(), std::strerror(errno));
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

}  // namespace kvlog
