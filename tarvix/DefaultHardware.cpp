// The default simulated hardware: three devices, five buses and their traffic.
#include "driver/FrameTypes.h"
#include "driver/Properties.h"
#include "tarvix/HardwareConfig.h"

namespace tarvix {
namespace {

PeriodicFrame Can(uint32_t id, bool extended, uint8_t type, uint32_t length, double periodMs,
                  PayloadPattern payload) {
  PeriodicFrame f;
  f.identifier = id;
  f.extended = extended;
  f.type = type;
  f.length = length;
  f.periodMs = periodMs;
  f.payload = std::move(payload);
  return f;
}

BusConfig BodyBus() {
  BusConfig b;
  b.name = "body";
  b.bitRate = 500000;
  b.traffic = {
      Can(0x100, false, driver::kFrameCanData, 8, 10,
          PayloadPattern::CounterThen({1, 2, 3, 4, 5, 6, 7})),
      Can(0x1A0, false, driver::kFrameCanData, 3, 50, PayloadPattern::Bytes({0xAA, 0xBB, 0xCC})),
      Can(0x321, false, driver::kFrameCanRemote, 0, 500, {}),
      Can(0x18FEF100, true, driver::kFrameCanData, 8, 100,
          PayloadPattern::Bytes({0x00, 0x11, 0x22, 0x33, 0x44, 0x55, 0x66, 0x77})),
      Can(0, false, driver::kFrameCanBusError, 0, 1000, {}),
  };
  return b;
}

BusConfig TestBus() {
  BusConfig b;
  b.name = "test";
  b.bitRate = 500000;
  b.dataBitRate = 2000000;
  b.canIoMode = driver::kCanIoModeFdBrs;
  return b;
}

BusConfig FdBus() {
  BusConfig b = TestBus();
  b.name = "fd";
  b.traffic = {
      Can(0x200, false, driver::kFrameCanFdBrsData, 64, 20, PayloadPattern::Ramp(0x00)),
      Can(0x201, false, driver::kFrameCanFdData, 12, 20, PayloadPattern::Ramp(0xA0)),
      Can(0x1ABCDE00, true, driver::kFrameCanFdBrsData, 16, 100, PayloadPattern::Ramp(0xF0)),
      Can(0x080, false, driver::kFrameCanData, 8, 100, PayloadPattern::CounterThen({})),
  };
  return b;
}

LinSlot Lin(uint8_t id, bool response, uint32_t length, PayloadPattern payload) {
  return LinSlot{id, response, length, std::move(payload)};
}

BusConfig LinBus() {
  BusConfig b;
  b.name = "lin";
  b.protocol = driver::BusKind::kLin;
  b.bitRate = 19200;
  b.linSlotMs = 10;
  b.linSchedule = {
      Lin(0x10, true, 2, PayloadPattern::Bytes({0x12, 0x34})),
      Lin(0x11, true, 8, PayloadPattern::CounterThen({1, 2, 3, 4, 5, 6, 7})),
      Lin(0x12, false, 0, {}),
      Lin(0x13, true, 4, PayloadPattern::Bytes({0xDE, 0xAD, 0xBE, 0xEF})),
  };
  return b;
}

FlexRaySlot Slot(uint16_t slot, bool a, bool b, uint32_t length, PayloadPattern payload) {
  FlexRaySlot s;
  s.slot = slot;
  s.channelA = a;
  s.channelB = b;
  s.length = length;
  s.payload = std::move(payload);
  return s;
}

BusConfig FlexRayBus() {
  BusConfig b;
  b.name = "fr";
  b.protocol = driver::BusKind::kFlexRay;
  b.bitRate = 10000000;
  b.flexRayCycleMs = 5;
  FlexRaySlot key = Slot(1, true, true, 16, PayloadPattern::Ramp(0x10));
  key.startup = key.sync = true;
  FlexRaySlot odd = Slot(3, true, false, 8,
                         PayloadPattern::Bytes({0x30, 0x31, 0x32, 0x33, 0x34, 0x35, 0x36, 0x37}));
  odd.nullCycles = NullCycles::Odd;
  b.flexRaySlots = {key, Slot(2, true, false, 16, PayloadPattern::CounterThen({})), odd,
                    Slot(40, false, true, 32, PayloadPattern::Ramp(0x40))};
  return b;
}

InterfaceConfig Interface(const char* name, const char* bus, uint32_t port, uint32_t protocol,
                          uint32_t canFd) {
  return InterfaceConfig{name, bus, port, protocol, canFd, 0, ""};
}

}  // namespace

HardwareConfig DefaultHardware() {
  using driver::kProtocolCan;
  HardwareConfig h;
  h.buses = {BodyBus(), TestBus(), FdBus(), LinBus(), FlexRayBus()};
  h.devices = {
      {"SIM-CAN",
       {Interface("CAN1", "body", 1, kProtocolCan, 0),
        Interface("CAN2", "body", 2, kProtocolCan, 0),
        Interface("CAN3", "test", 3, kProtocolCan, 1),
        Interface("CAN4", "test", 4, kProtocolCan, 1), Interface("CAN5", "fd", 5, kProtocolCan, 1),
        Interface("CAN6", "fd", 6, kProtocolCan, 1)}},
      {"SIM-LIN",
       {Interface("LIN1", "lin", 1, driver::kProtocolLin, 0),
        Interface("LIN2", "lin", 2, driver::kProtocolLin, 0)}},
      {"SIM-FR",
       {Interface("FlexRay1", "fr", 1, driver::kProtocolFlexRay, 0),
        Interface("FlexRay2", "fr", 2, driver::kProtocolFlexRay, 0)}},
  };
  return h;
}

}  // namespace tarvix
