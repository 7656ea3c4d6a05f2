// The CAN state word of a bound interface.
#include "tarvix/socketcan/BusState.h"

#include <linux/can.h>
#include <linux/can/error.h>

#include <algorithm>

#include "driver/States.h"

namespace tarvix {
namespace {

constexpr uint32_t kSleepBit = 1u << 5;
constexpr uint32_t kKernelStatePassive = 2;
constexpr uint32_t kKernelStateBusOff = 3;
constexpr uint32_t kKernelStateStopped = 4;
constexpr uint32_t kKernelStateSleeping = 5;

uint32_t CommFromKernel(uint32_t canState) {
  if (canState == kKernelStatePassive) return driver::kCanCommErrorPassive;
  if (canState == kKernelStateBusOff || canState == kKernelStateStopped)
    return driver::kCanCommBusOff;
  return driver::kCanCommErrorActive;
}

uint32_t Pack(uint32_t comm, uint32_t lastError, uint32_t tx, uint32_t rx) {
  return comm | (lastError & 0xF) << 8 | std::min(tx, 255u) << 16 | std::min(rx, 255u) << 24;
}

}  // namespace

void BusState::observe(const WireFrame& f) {
  const uint32_t cls = f.canId & CAN_ERR_MASK;
  const uint8_t controller = f.data[1];
  if (cls & CAN_ERR_CRTL) {
    if (controller & (CAN_ERR_CRTL_RX_PASSIVE | CAN_ERR_CRTL_TX_PASSIVE))
      comm_ = driver::kCanCommErrorPassive;
    if (controller & CAN_ERR_CRTL_ACTIVE) comm_ = driver::kCanCommErrorActive;
  }
  if (cls & CAN_ERR_RESTARTED) comm_ = driver::kCanCommErrorActive;
  if (cls & CAN_ERR_BUSOFF) comm_ = driver::kCanCommBusOff;
  if (cls & CAN_ERR_PROT) {
    if (f.data[2] & CAN_ERR_PROT_STUFF) lastError_ = driver::kCanLastErrorStuff;
    if (f.data[2] & CAN_ERR_PROT_FORM) lastError_ = driver::kCanLastErrorForm;
  }
  if (cls & CAN_ERR_ACK) lastError_ = driver::kCanLastErrorAck;
  if (cls & CAN_ERR_CNT) {
    txErrors_ = f.data[6];
    rxErrors_ = f.data[7];
  }
}

uint32_t BusState::word(bool started, const DeviceReport& device) const {
  if (!started) return Pack(driver::kCanCommStopped, lastError_, txErrors_, rxErrors_);
  // A device that is gone or down is a lost bus.
  uint32_t comm = device.present && device.up ? comm_ : driver::kCanCommBusOff;
  uint32_t sleep = 0;
  if (device.present && device.up && device.hasState) {
    comm = CommFromKernel(device.canState);
    if (device.canState == kKernelStateSleeping) sleep = kSleepBit;
  }
  const uint32_t tx = device.hasCounters ? device.txErrors : txErrors_;
  const uint32_t rx = device.hasCounters ? device.rxErrors : rxErrors_;
  return Pack(comm, lastError_, tx, rx) | sleep;
}

}  // namespace tarvix
