// The transmit frame's payload, start, write and stop.
#include "transmit/CTransmitFrame.h"

#include "driver/Properties.h"
#include "driver/Sessions.h"
#include "driver/tarvix.h"
#include "transmit/TransmitDatabaseName.h"
#include "transmit/TxFrameRecord.h"

namespace nKV_DLL300 {

namespace {

constexpr double kWriteTimeoutSeconds = 10.0;
constexpr double kTransmitWaitSeconds = 2.0;
constexpr uint8_t kRemoteFrameType = 1;

}  // namespace

CTransmitFrame::CTransmitFrame(const SessionSettings& settings, int32_t& status)
    : settings_(settings), status_(status) {}

CTransmitFrame::~CTransmitFrame() { stopIfActive(); }

void CTransmitFrame::SetTxPayload(std::string_view text) {
  txPayload.clear();
  int32_t number = 0;
  for (char c : text) {
    if (c == ',') {
      txPayload.push_back(static_cast<uint8_t>(number));
      number = 0;
    } else {
      // Unsigned arithmetic: the low 8 bits are those of the signed accumulator, and a long run
      // of digits wraps instead of overflowing.
      number = static_cast<int32_t>(static_cast<uint32_t>(number) * 10u +
                                    static_cast<uint32_t>(static_cast<unsigned char>(c) - '0'));
    }
  }
  if (!text.empty() && text.back() != ',') txPayload.push_back(static_cast<uint8_t>(number));
  if (txTimingType == driver::kTimingCyclicData && txActive) SendTxFrame();
}

void CTransmitFrame::StartTransmit() {
  // A second start while one is active would otherwise leave the first output session running
  // on the bus with nobody holding its reference.
  if (txActive) releaseOutput();
  CreateTransmitSession();
  SendTxFrame();
}

void CTransmitFrame::SendTxFrame() {
  txActive = true;
  TxFrameRecord record;
  TxFrameFields fields;
  fields.identifier = txIdentifier;
  fields.extended = txExtendedId != 0;
  fields.remote = txFrameType == kRemoteFrameType;
  fields.payloadLength = txPayloadLength;
  fields.payload = &txPayload;
  const uint32_t size = BuildTxFrameRecord(fields, record);
  if (status_ != 0) return;  // an earlier step failed: nothing is written until the next start
  status_ = kxWriteFrame(txSession, &record, size, kWriteTimeoutSeconds);
  if (status_ == 0 && txTimingType == driver::kTimingEventData) {
    status_ = kxWait(txSession, driver::kWaitTransmitComplete, 0, kTransmitWaitSeconds, nullptr);
  }
}

void CTransmitFrame::StopTransmit() {
  txActive = false;
  txPayload.clear();
  releaseOutput();
}

void CTransmitFrame::releaseOutput() {
  // References that were never created are not handed to the driver.
  if (txSession != 0) {
    if (txTimingType == driver::kTimingCyclicData) (void)kxStop(txSession, driver::kScopeNormal);
    (void)kxClear(txSession);
  }
  status_ = txDatabase != 0 ? kxdbCloseDatabase(txDatabase, driver::kCloseThisReference) : 0;
  TransmitDatabaseName::release(txDatabaseNumber_);
  txDatabaseNumber_ = -1;
  txSession = txDatabase = txCluster = txFrameObject = 0;
}

}  // namespace nKV_DLL300
