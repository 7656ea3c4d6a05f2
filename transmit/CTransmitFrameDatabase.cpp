// The transmit frame's in-memory database: cluster, frame and the output session built on them.
#include <string>

#include "driver/Properties.h"
#include "driver/Sessions.h"
#include "driver/tarvix.h"
#include "transmit/CTransmitFrame.h"
#include "transmit/TransmitDatabaseName.h"

namespace nKV_DLL300 {

namespace {

constexpr char kClusterName[] = "Cluster";
constexpr char kFrameName[] = "TxFrame";

// Frame types that choose the database frame's CAN I/O mode.
constexpr uint8_t kFrameTypeClassic = 0x08;
constexpr uint8_t kFrameTypeFd = 0x10;
constexpr uint8_t kFrameTypeFdBrs = 0x18;

template <class T>
int32_t SetObjectProperty(uint32_t object, uint32_t id, T value) {
  return kxdbSetProperty(object, id, sizeof value, &value);
}

template <class T>
int32_t SetSessionProperty(uint32_t session, uint32_t id, T value) {
  return kxSetProperty(session, id, sizeof value, &value);
}

bool FdClusterMode(uint32_t canIoMode) {
  return canIoMode == driver::kCanIoModeFd || canIoMode == driver::kCanIoModeFdBrs;
}

}  // namespace

void CTransmitFrame::CreateTransmitSession() {
  TransmitDatabaseName::release(txDatabaseNumber_);
  txDatabaseNumber_ = TransmitDatabaseName::acquire();
  const std::string name = TransmitDatabaseName::format(txDatabaseNumber_);
  if ((status_ = kxdbOpenDatabase(name.c_str(), &txDatabase)) != 0) return;
  if ((status_ = kxdbCreateObject(txDatabase, driver::kClassCluster, kClusterName, &txCluster)) !=
      0) {
    return;
  }
  if (setClusterProperties() != 0) return;
  if ((status_ = kxdbCreateObject(txCluster, driver::kClassFrame, kFrameName, &txFrameObject)) !=
      0) {
    return;
  }
  if (setFrameProperties() != 0) return;
  // The raw port name: the output session names the interface without the receiving session's
  // suffix.
  const uint32_t mode = txTimingType == driver::kTimingEventData ? driver::kModeOutputQueued
                                                                 : driver::kModeOutputSinglePoint;
  const std::string port = settings_.portName.get();
  if ((status_ = kxCreateSession(name.c_str(), kClusterName, kFrameName, port.c_str(), mode,
                                 &txSession)) != 0) {
    return;
  }
  (void)setOutputSessionProperties();
}

int32_t CTransmitFrame::setClusterProperties() {
  const uint32_t canIoMode = settings_.canIoMode.load();
  if ((status_ = SetObjectProperty(txCluster, driver::kPropClusterApplicationProtocol,
                                   settings_.applicationProtocol.load())) != 0 ||
      (status_ = SetObjectProperty(txCluster, driver::kPropClusterBaudRate,
                                   settings_.baudRate.load())) != 0 ||
      (status_ = SetObjectProperty(txCluster, driver::kPropClusterCanIoMode, canIoMode)) != 0) {
    return status_;
  }
  if (FdClusterMode(canIoMode)) {
    status_ = SetObjectProperty(txCluster, driver::kPropClusterCanFdBaudRate,
                                settings_.canFdBaudRate.load());
  }
  return status_;
}

int32_t CTransmitFrame::setFrameProperties() {
  // Without an extended identifier the frame keeps the driver's default for a new frame.
  if (txExtendedId != 0 && (status_ = SetObjectProperty(txFrameObject, driver::kPropFrameExtendedId,
                                                        txExtendedId)) != 0) {
    return status_;
  }
  if ((status_ = SetObjectProperty(txFrameObject, driver::kPropFrameIdentifier, txIdentifier)) !=
          0 ||
      (status_ = SetObjectProperty(txFrameObject, driver::kPropFramePayloadLength,
                                   txPayloadLength)) != 0 ||
      (status_ = SetObjectProperty(txFrameObject, driver::kPropFrameTimingType, txTimingType)) !=
          0 ||
      (status_ = SetObjectProperty(txFrameObject, driver::kPropFrameCyclicRate, txCyclicRate)) !=
          0) {
    return status_;
  }
  return setFrameIoMode();
}

int32_t CTransmitFrame::setFrameIoMode() {
  uint32_t frameMode;
  switch (txFrameType) {
    case kFrameTypeClassic:
      frameMode = driver::kFrameCanIoModeClassic;
      break;
    case kFrameTypeFd:
      frameMode = driver::kFrameCanIoModeFd;
      break;
    case kFrameTypeFdBrs:
      frameMode = driver::kFrameCanIoModeFdBrs;
      break;
    default:
      return status_;
  }
  if (settings_.isoFdMode.load() != 0) return status_;
  status_ = SetObjectProperty(txFrameObject, driver::kPropFrameCanIoMode, frameMode);
  return status_;
}

int32_t CTransmitFrame::setOutputSessionProperties() {
  if ((status_ = SetSessionProperty(txSession, driver::kPropBaudRate, settings_.baudRate.load())) !=
          0 ||
      (status_ = SetSessionProperty(txSession, driver::kPropTermination,
                                    settings_.termination.load())) != 0) {
    return status_;
  }
  status_ =
      SetSessionProperty(txSession, driver::kPropTransceiverType, settings_.transceiverType.load());
  return status_;
}

}  // namespace nKV_DLL300
