// The vocabulary of the host protocol: every command and property name with its identifier.
#include "hostlink/MessageTable.h"

namespace nKV_DLL300 {

namespace {

constexpr MessageTable::Entry kCommands[] = {
    {"UNKNOWN", kCommandUnknown},
    {"CMD_SESSION_START", kCommandSessionStart},
    {"CMD_SESSION_STOP", kCommandSessionStop},
    {"CMD_SESSION_TERMINATE", kCommandSessionTerminate},
    {"CMD_SESSION_READ_LAST_ERROR", kCommandSessionReadLastError},
    {"CMD_SESSION_RESET", kCommandSessionReset},
    {"CMD_HEARTBEAT", kCommandHeartbeat},
    {"CMD_GET_HARDWARE_INFO", kCommandGetHardwareInfo},
    {"CMD_TX_START", kCommandTxStart},
    {"CMD_TX_STOP", kCommandTxStop},
};

constexpr MessageTable::Entry kProperties[] = {
    {"SET_PROP_SESSION_PORTNAME", kPropertySessionPortName},
    {"SET_PROP_SESSION_BAUDRATE", kPropertySessionBaudRate},
    {"SET_PROP_TX_TIME_DATA", kPropertyTxTimeData},
    {"SET_PROP_DATA_LOG_IDS_MAX", kPropertyDataLogIdsMax},
    {"SET_PROP_LOGFILE", kPropertyLogFile},
    {"SET_PROP_LOGFILE_NAME", kPropertyLogFileName},
    {"SET_PROP_LOGFILE_TYPE", kPropertyLogFileType},
    {"SET_PROP_LOGFILE_VORA_GROUP_NAME", kPropertyLogFileVoraGroupName},
    {"SET_PROP_LOGFILE_VORA_CHANNEL_NAME", kPropertyLogFileVoraChannelName},
    {"SET_PROP_SESSION_LOG_TRANSMITTED_FRAMES", kPropertySessionLogTransmittedFrames},
    {"SET_PROP_SESSION_TERMINATION", kPropertySessionTermination},
    {"SET_PROP_SESSION_RUNMODE", kPropertySessionRunMode},
    {"SET_PROP_SESSION_LISTEN_ONLY", kPropertySessionListenOnly},
    {"SET_PROP_SESSION_LOG_BUS_ERROR_FRAMES", kPropertySessionLogBusErrorFrames},
    {"SET_PROP_SESSION_ALIAS", kPropertySessionAlias},
    {"SET_PROP_SESSION_CLUSTER", kPropertySessionCluster},
    {"SET_PROP_TX_TIME_STATISTIC", kPropertyTxTimeStatistic},
    {"SET_PROP_SESSION_TRANSCEIVER_TYPE", kPropertySessionTransceiverType},
    {"SET_PROP_SESSION_SHOW_NULL_FRAMES", kPropertySessionShowNullFrames},
    {"SET_PROP_SESSION_KEY_SLOT", kPropertySessionKeySlot},
    {"SET_PROP_SESSION_CANFD_BAUDRATE", kPropertySessionCanFdBaudRate},
    {"SET_PROP_SESSION_CAN_IOMODE", kPropertySessionCanIoMode},
    {"SET_PROP_SESSION_APPLICATION_PROTOCOL", kPropertySessionApplicationProtocol},
    {"SET_TX_PROP_PAYLOAD_LENGTH", kPropertyTxPayloadLength},
    {"SET_TX_PROP_EXTENDED_ID", kPropertyTxExtendedId},
    {"SET_TX_PROP_FRAME_TYPE", kPropertyTxFrameType},
    {"SET_TX_PROP_TIMING_TYPE", kPropertyTxTimingType},
    {"SET_TX_PROP_CYCLIC_RATE", kPropertyTxCyclicRate},
    {"SET_TX_PROP_PAYLOAD", kPropertyTxPayload},
    {"SET_TX_PROP_IDENTIFIER", kPropertyTxIdentifier},
    {"SET_PROP_SESSION_ISOFD_MODE", kPropertySessionIsoFdMode},
    {"SET_PROP_SESSION_NO_RESPONSE_FRAMES", kPropertySessionNoResponseFrames},
    {"SET_PROP_SESSION_LOG_CHECKSUM", kPropertySessionLogChecksum},
    {"SET_PROP_SESSION_NODE_ADDRESS", kPropertySessionNodeAddress},
    {"SET_PROP_SESSION_NODE_NAME", kPropertySessionNodeName},
};
static_assert(std::size(kProperties) == kPropertyCount - 1);

}  // namespace

MessageTable MakeCommandTable() { return MessageTable(kCommands); }

MessageTable MakePropertyTable() { return MessageTable(kProperties); }

}  // namespace nKV_DLL300
