// Handlers of the transmit-frame properties: acknowledge, then store in the CAN session's frame.
#include "protocol/TransmitProperties.h"

#include "bus/CCAN.h"
#include "hostlink/HostConnection.h"
#include "protocol/ValueReaders.h"
#include "transmit/CTransmitFrame.h"

namespace nKV_DLL300 {

namespace {

// Acknowledges with `text` and hands the frame to `store`; nothing at all without a CAN session.
template <class Store>
void AcknowledgeAndStore(HostConnection& connection, const char* text, Store store) {
  CTransmitFrame* frame = CanTransmitFrame(connection);
  if (frame == nullptr) return;
  SendPropertyReply(connection, text, ReplySession::kWith);
  store(*frame);
}

void PayloadLength(HostConnection& connection, std::string_view value) {
  AcknowledgeAndStore(connection, "<ACK: SET_TX_PROP_PAYLOAD_LENGTH>\n",
                      [&](CTransmitFrame& frame) {
                        frame.txPayloadLength = static_cast<uint32_t>(ReadInteger(value));
                      });
}

void ExtendedId(HostConnection& connection, std::string_view value) {
  AcknowledgeAndStore(connection, "<ACK: SET_TX_PROP_EXTENDED_ID>\n",
                      [&](CTransmitFrame& frame) { frame.txExtendedId = ReadByte(value); });
}

void FrameType(HostConnection& connection, std::string_view value) {
  AcknowledgeAndStore(connection, "<ACK: SET_TX_PROP_FRAME_TYPE>\n",
                      [&](CTransmitFrame& frame) { frame.txFrameType = ReadByte(value); });
}

void TimingType(HostConnection& connection, std::string_view value) {
  AcknowledgeAndStore(connection, "<ACK: SET_TX_PROP_TIMING_TYPE>\n", [&](CTransmitFrame& frame) {
    frame.txTimingType = static_cast<uint32_t>(ReadInteger(value));
  });
}

void CyclicRate(HostConnection& connection, std::string_view value) {
  AcknowledgeAndStore(connection, "<ACK: SET_TX_PROP_CYCLIC_RATE>\n",
                      [&](CTransmitFrame& frame) { frame.txCyclicRate = ReadRate(value); });
}

// The value is at most the rest of one received message, so it always fits the 256 bytes the
// list text may hold.
void Payload(HostConnection& connection, std::string_view value) {
  AcknowledgeAndStore(connection, "<ACK: SET_TX_PROP_PAYLOAD>\n",
                      [&](CTransmitFrame& frame) { frame.SetTxPayload(value); });
}

void Identifier(HostConnection& connection, std::string_view value) {
  AcknowledgeAndStore(connection, "<ACK: SET_TX_PROP_IDENTIFIER>\n", [&](CTransmitFrame& frame) {
    frame.txIdentifier = static_cast<uint32_t>(ReadInteger(value));
  });
}

}  // namespace

CTransmitFrame* CanTransmitFrame(HostConnection& connection) {
  auto* can = dynamic_cast<CCAN*>(connection.session.get());
  return can != nullptr ? &can->transmit : nullptr;
}

void AddTransmitPropertyHandlers(PropertyHandlerTable& table) {
  table[kPropertyTxPayloadLength] = &PayloadLength;
  table[kPropertyTxExtendedId] = &ExtendedId;
  table[kPropertyTxFrameType] = &FrameType;
  table[kPropertyTxTimingType] = &TimingType;
  table[kPropertyTxCyclicRate] = &CyclicRate;
  table[kPropertyTxPayload] = &Payload;
  table[kPropertyTxIdentifier] = &Identifier;
}

}  // namespace nKV_DLL300
