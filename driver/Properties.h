// Property identifiers of the driver: sessions, the system object, devices, interfaces, databases.
#pragma once

#include <cstdint>

namespace driver {

// Session properties (kxSetProperty / kxGetProperty). Size in bytes after each.
inline constexpr uint32_t kPropBaudRate = 0x09100016;         // 8, bit/s (nominal rate)
inline constexpr uint32_t kPropCanFdBaudRate = 0x09100027;    // 8, bit/s (data phase)
inline constexpr uint32_t kPropTermination = 0x00100025;      // 4, 0 off, 1 on
inline constexpr uint32_t kPropCanIoMode = 0x00100026;        // 4, see kCanIoMode*
inline constexpr uint32_t kPropTransceiverType = 0x00100029;  // 4, 0 to 4
inline constexpr uint32_t kPropIsoFdMode = 0x0010003E;        // 4, 0 ISO CAN FD, 1 non-ISO
inline constexpr uint32_t kPropListenOnly = 0x02100022;       // 1, bool
inline constexpr uint32_t kPropEcho = 0x02100010;  // 1, bool: own transmissions are read back
inline constexpr uint32_t kPropBusErrorFrames = 0x02100015;       // 2, {enable, listen-only} bytes
inline constexpr uint32_t kPropLinNoResponseFrames = 0x02100080;  // 1, bool
inline constexpr uint32_t kPropLinChecksumFlag =
    0x02100081;  // 1, bool: info byte holds the checksum
inline constexpr uint32_t kPropFlexRayTermination = 0x00100057;  // 4, 0 off, 1 on
inline constexpr uint32_t kPropFlexRayNullFrames = 0x02100049;   // 1, bool
inline constexpr uint32_t kPropKeySlot = 0x00100038;             // 4, slot 0 to 2047 (0: none)
inline constexpr uint32_t kPropJ1939NodeName = 0x09100094;       // 8, the 64-bit NAME
inline constexpr uint32_t kPropJ1939NodeAddress =
    0x00100092;  // 4, set: address to claim; get: claimed
                 //    address, 0xFE while not claimed

// System object properties (read only).
inline constexpr uint32_t kPropSystemVersionPacked = 0x00110006;  // 4
inline constexpr uint32_t kPropSystemVersionMajor = 0x00110008;   // 4
inline constexpr uint32_t kPropSystemVersionMinor = 0x00110009;   // 4
inline constexpr uint32_t kPropSystemVersionPhase = 0x0011000A;   // 4
inline constexpr uint32_t kPropSystemVersionUpdate = 0x0011000B;  // 4
inline constexpr uint32_t kPropSystemDevices = 0x06110002;  // 4 per device, read as 256 (64 refs)

// Device properties (read only).
inline constexpr uint32_t kPropDeviceInterfaces =
    0x06120002;  // 4 per interface, read as 64 (16 refs)

// Interface properties (read only).
inline constexpr uint32_t kPropInterfaceName = 0x03130002;      // text, NUL-terminated, read as 16
inline constexpr uint32_t kPropInterfacePort = 0x00130003;      // 4 (4 to 16 accepted, rest zeroed)
inline constexpr uint32_t kPropInterfaceProtocol = 0x00130005;  // 4, see kProtocol*
inline constexpr uint32_t kPropInterfaceCanFd =
    0x00130007;  // 4, 1 when the interface can do CAN FD

// Cluster properties (kxdbSetProperty).
inline constexpr uint32_t kPropClusterApplicationProtocol = 0x00010073;  // 4, 0 none, 1 J1939
inline constexpr uint32_t kPropClusterBaudRate = 0x09010001;             // 8
inline constexpr uint32_t kPropClusterCanIoMode = 0x00010010;            // 4, see kCanIoMode*
inline constexpr uint32_t kPropClusterCanFdBaudRate = 0x09010011;        // 8

// Frame properties (kxdbSetProperty).
inline constexpr uint32_t kPropFrameExtendedId = 0x02020010;     // 1, bool
inline constexpr uint32_t kPropFrameIdentifier = 0x00020003;     // 4
inline constexpr uint32_t kPropFramePayloadLength = 0x00020007;  // 4, 0 to 64
inline constexpr uint32_t kPropFrameTimingType = 0x00020011;     // 4, see kTiming*
inline constexpr uint32_t kPropFrameCyclicRate = 0x01020012;     // 8, double, seconds
inline constexpr uint32_t kPropFrameCanIoMode = 0x00020066;      // 4, see kFrameCanIoMode*

// Values of kPropInterfaceProtocol.
inline constexpr uint32_t kProtocolCan = 0;
inline constexpr uint32_t kProtocolFlexRay = 1;
inline constexpr uint32_t kProtocolLin = 2;

// Values of kPropCanIoMode and kPropClusterCanIoMode.
inline constexpr uint32_t kCanIoModeClassic = 0;
inline constexpr uint32_t kCanIoModeFd = 1;
inline constexpr uint32_t kCanIoModeFdBrs = 2;

// Values of kPropFrameCanIoMode.
inline constexpr uint32_t kFrameCanIoModeClassic = 0;
inline constexpr uint32_t kFrameCanIoModeFd = 1;
inline constexpr uint32_t kFrameCanIoModeFdBrs = 2;

// Values of kPropFrameTimingType.
inline constexpr uint32_t kTimingCyclicData = 0;
inline constexpr uint32_t kTimingEventData = 1;
inline constexpr uint32_t kTimingCyclicRemote = 2;
inline constexpr uint32_t kTimingEventRemote = 3;
inline constexpr uint32_t kTimingCyclicAndEvent = 4;

// Values of kPropClusterApplicationProtocol.
inline constexpr uint32_t kApplicationProtocolNone = 0;
inline constexpr uint32_t kApplicationProtocolJ1939 = 1;

// J1939 addresses.
inline constexpr uint32_t kJ1939NullAddress = 0xFE;  // "cannot claim" / not claimed yet
inline constexpr uint32_t kJ1939GlobalAddress = 0xFF;

}  // namespace driver
