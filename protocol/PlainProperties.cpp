// Handlers that store a number and acknowledge it; CAN I/O mode and application protocol first
// check the number and keep the old value when it is out of range, then acknowledge the kept one.
#include "protocol/PlainProperties.h"

#include <atomic>

#include "hostlink/HostConnection.h"
#include "protocol/ValueReaders.h"

namespace nKV_DLL300 {

namespace {

constexpr ReplySession kNone = ReplySession::kNone;
constexpr ReplySession kWith = ReplySession::kWith;

void Acknowledge(HostConnection& connection, std::string_view pattern, std::string_view value,
                 ReplySession session) {
  SendPropertyReply(connection, FillReply(pattern, value), session);
}

// A 64-bit value that cannot be read leaves the field as it was.
std::string StoreUnsigned64(std::atomic<uint64_t>& field, std::string_view value) {
  field.store(ReadUnsigned64(value, field.load()));
  return Unsigned64Text(field.load());
}

std::string StoreInteger(std::atomic<uint32_t>& field, std::string_view value) {
  field.store(static_cast<uint32_t>(ReadInteger(value)));
  return SignedText(field.load());
}

void BaudRate(HostConnection& connection, std::string_view value) {
  std::string stored = StoreUnsigned64(connection.settings.baudRate, value);
  Acknowledge(connection, "<ACK: SET_PROP_SESSION_BAUDRATE %llu> \n", stored, kNone);
}

void TxTimeData(HostConnection& connection, std::string_view value) {
  std::string stored = StoreInteger(connection.settings.txTimeData, value);
  Acknowledge(connection, "<ACK: SETPROP_TXTIMECAN %d> \n", stored, kNone);
}

void DataLogIdsMax(HostConnection& connection, std::string_view value) {
  std::string stored = StoreInteger(connection.settings.dataLogIdsMax, value);
  Acknowledge(connection, "<ACK: SET_PROP_MEM_SIZE_ID %d> \n", stored, kNone);
}

void KeySlot(HostConnection& connection, std::string_view value) {
  connection.settings.keySlot.store(ReadKey(value));
  std::string stored = SignedText(connection.settings.keySlot.load());
  Acknowledge(connection, "<ACK: SET_PROP_SESSION_KEY_SLOT %d> \n", stored, kWith);
}

void CanFdBaudRate(HostConnection& connection, std::string_view value) {
  std::string stored = StoreUnsigned64(connection.settings.canFdBaudRate, value);
  Acknowledge(connection, "<ACK: SET_PROP_SESSION_CANFD_BAUDRATE %llu> \n", stored, kWith);
}

// The acknowledgement goes out before the value is stored (two blanks before the number).
void IsoFdMode(HostConnection& connection, std::string_view value) {
  int32_t read = ReadInteger(value);
  Acknowledge(connection, "<ACK: SET_PROP_SESSION_ISOFD_MODE  %d> \n", std::to_string(read), kWith);
  connection.settings.isoFdMode.store(static_cast<uint32_t>(read));
}

// The acknowledgement, without the value, goes out before the value is stored.
void NodeAddress(HostConnection& connection, std::string_view value) {
  uint8_t read = ReadByte(value);
  SendPropertyReply(connection, "<ACK: SET_PROP_SESSION_NODE_ADDRESS>\n", kWith);
  connection.settings.nodeAddress.store(read);
}

void NodeName(HostConnection& connection, std::string_view value) {
  std::string stored = StoreUnsigned64(connection.settings.nodeName, value);
  Acknowledge(connection, "<ACK: SET_PROP_SESSION_NODE_NAME %llu> \n", stored, kWith);
}

// Stores `read` only when it is 0 to `highest`; otherwise the range error comes first. The
// acknowledgement always follows, with the value the setting now holds: a refused value is kept
// out, so acknowledging it would tell the host a mode that the session will not use.
void StoreValidOrRefuse(HostConnection& connection, std::atomic<uint32_t>& field, int32_t read,
                        int32_t highest, std::string_view rangeError, std::string_view pattern) {
  if (read >= 0 && read <= highest) {
    field.store(static_cast<uint32_t>(read));
  } else {
    SendPropertyReply(connection, std::string(rangeError), kWith);
  }
  Acknowledge(connection, pattern, std::to_string(static_cast<int32_t>(field.load())), kWith);
}

void CanIoMode(HostConnection& connection, std::string_view value) {
  StoreValidOrRefuse(connection, connection.settings.canIoMode, ReadInteger(value), 2,
                     "<ERROR: SET_PROP_SESSION_CAN_IOMODE: Value range error>\n",
                     "<ACK: SET_PROP_SESSION_IOMODE %d> \n");
}

void ApplicationProtocol(HostConnection& connection, std::string_view value) {
  StoreValidOrRefuse(connection, connection.settings.applicationProtocol, ReadInteger(value), 1,
                     "<ERROR: SET_PROP_SESSION_APPLICATION_PROTOCOL: Value range error>\n",
                     "<ACK: SET_PROP_SESSION_APPLICATION_PROTOCOL %d> \n");
}

}  // namespace

void AddPlainPropertyHandlers(PropertyHandlerTable& table) {
  table[kPropertySessionBaudRate] = &BaudRate;
  table[kPropertyTxTimeData] = &TxTimeData;
  table[kPropertyDataLogIdsMax] = &DataLogIdsMax;
  table[kPropertySessionKeySlot] = &KeySlot;
  table[kPropertySessionCanFdBaudRate] = &CanFdBaudRate;
  table[kPropertySessionIsoFdMode] = &IsoFdMode;
  table[kPropertySessionNodeAddress] = &NodeAddress;
  table[kPropertySessionNodeName] = &NodeName;
  table[kPropertySessionCanIoMode] = &CanIoMode;
  table[kPropertySessionApplicationProtocol] = &ApplicationProtocol;
}

}  // namespace nKV_DLL300
