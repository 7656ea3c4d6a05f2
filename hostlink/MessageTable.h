// The command and property names a host may send, and their identifiers.
#pragma once

#include <cstdint>
#include <functional>
#include <map>
#include <string>
#include <string_view>

namespace nKV_DLL300 {

enum CommandId : int32_t {
  kCommandUnknown = 0,
  kCommandSessionStart = 1,
  kCommandSessionStop = 2,
  kCommandSessionTerminate = 3,
  kCommandSessionReadLastError = 4,
  kCommandSessionReset = 5,
  kCommandHeartbeat = 6,
  kCommandGetHardwareInfo = 7,
  kCommandTxStart = 8,
  kCommandTxStop = 9,
};
constexpr int32_t kCommandCount = 10;  // identifiers 0 to 9

enum PropertyId : int32_t {
  kPropertyUnknown = 0,
  kPropertySessionPortName = 1,
  kPropertySessionBaudRate = 2,
  kPropertyTxTimeData = 3,
  kPropertyDataLogIdsMax = 4,
  kPropertyLogFile = 5,
  kPropertyLogFileName = 6,
  kPropertyLogFileType = 7,
  kPropertyLogFileVoraGroupName = 8,
  kPropertyLogFileVoraChannelName = 9,
  kPropertySessionLogTransmittedFrames = 10,
  kPropertySessionTermination = 11,
  kPropertySessionRunMode = 12,
  kPropertySessionListenOnly = 13,
  kPropertySessionLogBusErrorFrames = 14,
  kPropertySessionAlias = 15,
  kPropertySessionCluster = 16,
  kPropertyTxTimeStatistic = 17,
  kPropertySessionTransceiverType = 18,
  kPropertySessionShowNullFrames = 19,
  kPropertySessionKeySlot = 20,
  kPropertySessionCanFdBaudRate = 21,
  kPropertySessionCanIoMode = 22,
  kPropertySessionApplicationProtocol = 23,
  kPropertyTxPayloadLength = 24,
  kPropertyTxExtendedId = 25,
  kPropertyTxFrameType = 26,
  kPropertyTxTimingType = 27,
  kPropertyTxCyclicRate = 28,
  kPropertyTxPayload = 29,
  kPropertyTxIdentifier = 30,
  kPropertySessionIsoFdMode = 31,
  kPropertySessionNoResponseFrames = 32,
  kPropertySessionLogChecksum = 33,
  kPropertySessionNodeAddress = 34,
  kPropertySessionNodeName = 35,
};
constexpr int32_t kPropertyCount = 36;  // identifiers 0 to 35

// Name -> identifier, matched exactly (case-sensitive, whole text). Built once per connection
// and read only afterwards; a lookup never changes the table.
class MessageTable {
 public:
  struct Entry {
    const char* name;
    int32_t id;
  };
  template <size_t N>
  explicit MessageTable(const Entry (&entries)[N]) {
    for (const Entry& entry : entries) names_.emplace(entry.name, entry.id);
  }

  // The identifier of `name`, 0 when the table does not hold it.
  int32_t find(std::string_view name) const {
    auto found = names_.find(name);
    return found == names_.end() ? 0 : found->second;
  }
  size_t size() const { return names_.size(); }

 private:
  std::map<std::string, int32_t, std::less<>> names_;
};

// The two tables of a new connection.
MessageTable MakeCommandTable();
MessageTable MakePropertyTable();

}  // namespace nKV_DLL300
