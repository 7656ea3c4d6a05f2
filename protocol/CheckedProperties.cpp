// Range-checked properties: one row per property, one handler template for all of them.
#include "protocol/CheckedProperties.h"

#include <atomic>
#include <type_traits>

#include "hostlink/HostConnection.h"
#include "protocol/ValueReaders.h"

namespace nKV_DLL300 {

namespace {

struct CheckedRule {
  std::string_view acknowledgement;  // "%d" prints the stored field
  std::string_view rangeError;
  uint32_t lowest;  // accepted values, compared unsigned
  uint32_t highest;
  ReplySession session;
};

constexpr uint32_t kNoLimit = 0xFFFFFFFFu;

constexpr CheckedRule kLogFile{"<ACK: SET_PROP_LOGFILE %d> \n",
                               "<ERROR: SET_PROP_LOGFILE: Value range error>\n", 0, 1,
                               ReplySession::kNone};
constexpr CheckedRule kLogFileType{"<ACK: SET_PROP_LOGFILE_TYPE %d> \n",
                                   "<ERROR: SET_PROP_LOGFILE_TYPE: Value range error>\n", 0, 2,
                                   ReplySession::kNone};
constexpr CheckedRule kTxTimeStatistic{"<ACK: SET_PROP_TX_TIME_STATISTIC %d> \n",
                                       "<ERROR: SET_PROP_TX_TIME_STATISTIC: Value range error>\n",
                                       1000, kNoLimit, ReplySession::kNone};
constexpr CheckedRule kTransceiverType{
    "<ACK: SET_PROP_SESSION_TRANSCEIVER_TYPE %d> \n",
    "<ERROR: SET_PROP_SESSION_TRANSCEIVER_TYPE: Value range error>\n", 0, 4, ReplySession::kWith};
constexpr CheckedRule kShowNullFrames{
    "<ACK: SET_PROP_SESSION_SHOW_NULL_FRAMES %d> \n",
    "<ERROR: SET_PROP_SESSION_SHOW_NULL_FRAMES: Value range error>\n", 0, 1, ReplySession::kWith};
constexpr CheckedRule kNoResponseFrames{
    "<ACK: SET_PROP_SESSION_NO_RESPONSE_FRAMES %d> \n",
    "<ERROR: SET_PROP_SESSION_NO_RESPONSE_FRAMES: Value range error>\n", 0, 1, ReplySession::kWith};
constexpr CheckedRule kLogChecksum{"<ACK: SET_PROP_SESSION_LOG_CHECKSUM %d> \n",
                                   "<ERROR: SET_PROP_SESSION_LOG_CHECKSUM: Value range error>\n", 0,
                                   1, ReplySession::kWith};

// Reads with `Read`, stores into settings.*Field, then answers by `Rule`.
template <auto Field, auto Read, const CheckedRule& Rule>
void Checked(HostConnection& connection, std::string_view value) {
  auto& field = connection.settings.*Field;
  using Stored = typename std::remove_reference_t<decltype(field)>::value_type;
  field.store(static_cast<Stored>(Read(value)));
  uint32_t stored = field.load();
  if (stored < Rule.lowest || stored > Rule.highest) {
    SendPropertyReply(connection, std::string(Rule.rangeError), Rule.session);
    return;
  }
  SendPropertyReply(connection, FillReply(Rule.acknowledgement, SignedText(stored)), Rule.session);
}

}  // namespace

void AddCheckedPropertyHandlers(PropertyHandlerTable& table) {
  table[kPropertyLogFile] = &Checked<&SessionSettings::logFileEnabled, &ReadByte, kLogFile>;
  table[kPropertyLogFileType] = &Checked<&SessionSettings::logFileType, &ReadByte, kLogFileType>;
  table[kPropertyTxTimeStatistic] =
      &Checked<&SessionSettings::txTimeStatistic, &ReadInteger, kTxTimeStatistic>;
  table[kPropertySessionTransceiverType] =
      &Checked<&SessionSettings::transceiverType, &ReadInteger, kTransceiverType>;
  table[kPropertySessionShowNullFrames] =
      &Checked<&SessionSettings::showNullFrames, &ReadByte, kShowNullFrames>;
  table[kPropertySessionNoResponseFrames] =
      &Checked<&SessionSettings::noResponseFrames, &ReadByte, kNoResponseFrames>;
  table[kPropertySessionLogChecksum] =
      &Checked<&SessionSettings::logChecksum, &ReadByte, kLogChecksum>;
}

}  // namespace nKV_DLL300
