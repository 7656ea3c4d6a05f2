// The values a host sets with property messages, read live by its bus session.
#pragma once

#include <atomic>
#include <cstdint>

#include "hostlink/GuardedText.h"

namespace nKV_DLL300 {

// One per host connection, filled with these defaults at accept and never reset. The service
// thread writes (property handlers); the session's poll thread and log writers read at the same
// time: numbers are atomics, texts are GuardedText.
struct SessionSettings {
  std::atomic<uint32_t> txTimeData{1000};  // ms between identifier-record messages
  GuardedText portName;
  std::atomic<uint64_t> baudRate{0};
  std::atomic<uint8_t> logBusErrorFrames{0};
  std::atomic<uint8_t> listenOnly{0};
  GuardedText runMode{"SUBORDINATE"};
  std::atomic<uint32_t> termination{0};
  std::atomic<uint32_t> transceiverType{0};
  std::atomic<uint32_t> txTimeStatistic{1000};  // ms between bus-statistics messages
  std::atomic<uint32_t> canIoMode{0};
  std::atomic<uint64_t> canFdBaudRate{0};
  std::atomic<uint32_t> isoFdMode{0};
  std::atomic<uint32_t> applicationProtocol{0};
  std::atomic<uint8_t> nodeAddress{0};
  std::atomic<uint64_t> nodeName{0};
  std::atomic<uint32_t> keySlot{0xFFFFFFFFu};
  std::atomic<uint8_t> showNullFrames{0};
  std::atomic<uint8_t> noResponseFrames{0};
  std::atomic<uint8_t> logChecksum{0};
  GuardedText cluster;
  GuardedText alias;
  std::atomic<uint8_t> logFileEnabled{0};
  std::atomic<uint8_t> logFileType{0};  // 0 text, 1 binary, 2 measurement data
  std::atomic<uint8_t> logTransmittedFrames{0};
  GuardedText voraChannelName;
  GuardedText voraGroupName;
  std::atomic<uint32_t> dataLogIdsMax{1000};  // capacity of the identifier table
  GuardedText interfaceName;                  // port name followed by "@qv_corle_tarvix"
  GuardedText logFileName;
};

}  // namespace nKV_DLL300
