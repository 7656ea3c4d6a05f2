// What a session is made of when it is created: its interface, its database's settings, its frames.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace tarvix {

// A frame of a database, as an output session sends it (a copy taken when the session is created).
struct FrameDefinition {
  std::string name;
  uint32_t identifier = 0;
  bool extended = false;
  uint32_t payloadLength = 8;
  uint32_t timingType = 1;   // driver::kTiming*
  double cyclicRateS = 0.0;  // seconds between repetitions of cyclic frames; 0: no repetition
  uint32_t canIoMode = 0;    // driver::kFrameCanIoMode*
};

// The settings of a database cluster (named, built-in or in-memory).
struct ClusterSettings {
  uint32_t protocol = 0;  // driver::kProtocol*
  uint64_t baudRate = 500000;
  uint64_t dataBaudRate = 0;
  uint32_t canIoMode = 0;
  bool j1939 = false;
};

struct SessionSetup {
  uint32_t mode = 6;
  int32_t interfaceIndex = -1;
  std::string interfaceName;
  bool subordinate = false;
  uint32_t transceiver = 0;
  ClusterSettings cluster;
  std::vector<FrameDefinition> frames;  // output sessions only
  uint32_t receiveQueueFrames = 16384;
  uint32_t transmitQueueFrames = 1024;
};

// The settings a session's properties hold (see SessionProperties.cpp for ids and rules).
struct SessionSettings {
  uint64_t baudRate = 0;
  uint64_t dataBaudRate = 0;
  uint32_t termination = 0;
  uint32_t transceiver = 0;
  uint32_t isoFdMode = 0;
  bool listenOnly = false;
  bool echo = false;
  uint8_t busErrorFrames = 0;      // byte 0 of 0x02100015: bus-error frames in the stream
  uint8_t busErrorListenOnly = 0;  // byte 1 of 0x02100015: kept, reported back
  bool linNoResponse = false;
  bool linChecksum = false;
  uint32_t flexRayTermination = 0;
  bool nullFrames = false;
  uint32_t keySlot = 0;
  uint64_t nodeName = 0;
  uint32_t nodeAddress = 0xFE;
};

}  // namespace tarvix
