// vora-dump: option parsing, the listing and the per-channel decoding.
#include "host/voradump/VoraDumpTool.h"

#include <getopt.h>

#include <cstring>
#include <vector>

#include "host/voradump/VoraReader.h"

namespace voradump {
namespace {

constexpr const char* kProtocolProperty = "QV_network_protocol";

const char kUsage[] =
    "Usage: vora-dump [OPTIONS] FILE\n"
    "\n"
    "Examples:\n"
    "  vora-dump run.vora                       list groups, channels and their properties\n"
    "  vora-dump --decode run.vora              every channel's frames as text log lines\n"
    "  vora-dump -d -g Bus -c CAN1 run.vora     only channel CAN1 of group Bus\n"
    "  vora-dump -d --lin-checksum lin.vora     LIN lines with the checksum column\n"
    "\n"
    "Lists a measurement-data file (.vora) written by the controller and decodes the frames of "
    "its\n"
    "channels into the lines of the controller's text log of their bus (the channel property\n"
    "QV_network_protocol: 0 CAN, 1 FlexRay, 2 LIN).\n"
    "\n"
    "Options:\n"
    "  -d, --decode            print the channels' frames as text log lines\n"
    "  -g, --group NAME        only channels of this group\n"
    "  -c, --channel NAME      only channels of this name\n"
    "      --lin-checksum      LIN: write the checksum column\n"
    "      --can-records MODE  CAN record sizes: auto (default), fixed (24 bytes, classic\n"
    "                          sessions) or variable (FD and J1939 sessions)\n"
    "  -h, --help              show this text\n";

bool Selected(const DumpSelection& s, const Channel& c) {
  return (!s.hasGroup || c.group == s.group) && (!s.hasChannel || c.name == s.channel);
}

void ListProperties(const std::vector<Property>& properties, const char* indent, std::FILE* out) {
  for (const Property& p : properties) {
    std::fprintf(out, "%s%s = %s\n", indent, Quoted(p.name).c_str(), p.text.c_str());
  }
}

void ListChannel(const Channel& c, std::FILE* out) {
  const auto protocol = c.IntegerProperty(kProtocolProperty);
  const auto bus = protocol ? BusOfProtocol(*protocol) : std::nullopt;
  std::fprintf(out, "  channel %s: %llu bytes, %s frames\n", Quoted(c.name).c_str(),
               static_cast<unsigned long long>(c.bytes), bus ? NameOfBus(*bus) : "unknown");
  ListProperties(c.properties, "    ", out);
}

// "TOOL: FILE: group "G" channel "C": " before a problem with one channel.
std::string Where(const DumpSelection& s, const std::string& path, const Channel& c) {
  return std::string(s.tool) + ": " + path + ": group " + Quoted(c.group) + " channel " +
         Quoted(c.name) + ": ";
}

// Decodes one channel; false when it cannot be read, its bus is unknown or the output fails.
bool DecodeChannel(const VoraReader& reader, const std::string& path, const Channel& c,
                   const DumpSelection& s, std::FILE* out, std::FILE* err) {
  const std::string where = Where(s, path, c);
  const auto protocol = c.IntegerProperty(kProtocolProperty);
  const auto bus = protocol ? BusOfProtocol(*protocol) : std::nullopt;
  if (!bus) {
    std::fprintf(err, "%sno known %s property, frames not decoded\n", where.c_str(),
                 kProtocolProperty);
    return false;
  }
  std::vector<uint8_t> bytes;
  if (const std::string problem = reader.ReadBytes(c, bytes); !problem.empty()) {
    std::fprintf(err, "%s%s\n", where.c_str(), problem.c_str());
    return false;
  }
  const DecodeResult result = WriteTextLog(bytes.data(), bytes.size(), *bus, s.options, out);
  if (result.trailingBytes > 0) {
    std::fprintf(err, "%s%llu bytes after the last whole frame record ignored\n", where.c_str(),
                 static_cast<unsigned long long>(result.trailingBytes));
  }
  return !result.writeFailed;
}

bool ParseCanRecords(const char* text, CanRecords& out) {
  if (std::strcmp(text, "auto") == 0)
    out = CanRecords::kAuto;
  else if (std::strcmp(text, "fixed") == 0)
    out = CanRecords::kFixed;
  else if (std::strcmp(text, "variable") == 0)
    out = CanRecords::kVariable;
  else
    return false;
  return true;
}

}  // namespace

std::string Quoted(const std::string& name) {
  std::string quoted = "\"";
  for (const char ch : name) {
    const auto c = static_cast<unsigned char>(ch);
    if (c < 0x20 || c == 0x7F || c == '"' || c == '\\') {
      char escaped[8];
      std::snprintf(escaped, sizeof escaped, "\\x%02x", c);
      quoted += escaped;
    } else {
      quoted += ch;
    }
  }
  return quoted + "\"";
}

bool ReportUnreadable(const Group& group, const DumpSelection& selection, const std::string& path,
                      std::FILE* err) {
  if (selection.hasGroup && group.name != selection.group) return true;
  const std::string where =
      std::string(selection.tool) + ": " + path + ": group " + Quoted(group.name);
  if (!group.readable) {
    std::fprintf(err, "%s: cannot be read: the file is damaged\n", where.c_str());
    return false;
  }
  bool none = true;
  for (const std::string& name : group.unreadable) {
    if (selection.hasChannel && name != selection.channel) continue;
    std::fprintf(err, "%s object %s: cannot be read: the file is damaged\n", where.c_str(),
                 Quoted(name).c_str());
    none = false;
  }
  return none;
}

namespace {

// Lists one group (unless decoding) and adds its selected channels to `chosen`; false when
// something of it is damaged.
bool WalkGroup(const Group& g, const DumpSelection& selection, const std::string& path,
               std::vector<const Channel*>& chosen, std::FILE* out, std::FILE* err) {
  bool ok = ReportUnreadable(g, selection, path, err);
  if (!g.readable) return ok;
  if (!selection.decode && (!selection.hasGroup || g.name == selection.group)) {
    std::fprintf(out, "group %s\n", Quoted(g.name).c_str());
    ListProperties(g.properties, "  ", out);
  }
  for (const Channel& c : g.channels) {
    if (!Selected(selection, c)) continue;
    chosen.push_back(&c);
    if (selection.decode) continue;
    ListChannel(c, out);
    if (!c.damage.empty()) {
      std::fprintf(err, "%s%s\n", Where(selection, path, c).c_str(), c.damage.c_str());
      ok = false;
    }
  }
  return ok;
}

}  // namespace

int DumpVoraFile(const std::string& path, const DumpSelection& selection, std::FILE* out,
                 std::FILE* err) {
  std::string error;
  const auto reader = VoraReader::Open(path, error);
  if (!reader) {
    std::fprintf(err, "%s: %s\n", selection.tool, error.c_str());
    return 1;
  }
  std::vector<const Channel*> chosen;
  bool ok = true;
  const std::vector<Group> groups = reader->Groups();
  for (const Group& g : groups) ok = WalkGroup(g, selection, path, chosen, out, err) && ok;
  if (!selection.decode) return ok && std::fflush(out) == 0 ? 0 : 1;
  if (chosen.empty()) {
    std::fprintf(err, "%s: %s: no channel to decode\n", selection.tool, path.c_str());
    return 1;
  }
  for (const Channel* c : chosen) {
    if (chosen.size() > 1)
      std::fprintf(out, "== group %s channel %s ==\n", Quoted(c->group).c_str(),
                   Quoted(c->name).c_str());
    ok = DecodeChannel(*reader, path, *c, selection, out, err) && ok;
  }
  return ok && std::fflush(out) == 0 ? 0 : 1;
}

int RunVoraDump(int argc, char** argv) {
  enum { kLinChecksum = 256, kCanRecords };
  static const option kOptions[] = {{"decode", no_argument, nullptr, 'd'},
                                    {"group", required_argument, nullptr, 'g'},
                                    {"channel", required_argument, nullptr, 'c'},
                                    {"lin-checksum", no_argument, nullptr, kLinChecksum},
                                    {"can-records", required_argument, nullptr, kCanRecords},
                                    {"help", no_argument, nullptr, 'h'},
                                    {nullptr, 0, nullptr, 0}};
  DumpSelection selection;
  optind = 1;
  for (int opt; (opt = getopt_long(argc, argv, "dg:c:h", kOptions, nullptr)) != -1;) {
    switch (opt) {
      case 'd':
        selection.decode = true;
        break;
      case 'g':
        selection.group = optarg;
        selection.hasGroup = true;
        break;
      case 'c':
        selection.channel = optarg;
        selection.hasChannel = true;
        break;
      case kLinChecksum:
        selection.options.linChecksum = 1;
        break;
      case kCanRecords:
        if (!ParseCanRecords(optarg, selection.options.canRecords)) {
          std::fprintf(stderr, "vora-dump: --can-records takes auto, fixed or variable\n");
          return 2;
        }
        break;
      case 'h':
        std::fputs(kUsage, stdout);
        return 0;
      default:
        std::fputs(kUsage, stderr);
        return 2;
    }
  }
  if (optind + 1 != argc) {
    std::fputs(kUsage, stderr);
    return 2;
  }
  return DumpVoraFile(argv[optind], selection, stdout, stderr);
}

}  // namespace voradump
