// The header's bytes, and which types carry a caller-given payload length.
#include <gtest/gtest.h>

#include "hostlink/MessageHeader.h"

namespace nKV_DLL300 {
namespace {

TEST(MessageHeaderTest, EveryByteIsWhereTheHostExpectsIt) {
  MessageHeaderFields fields;
  fields.sequenceNumber = 0x04030201;
  fields.type = kMessageHardwareTable;
  fields.payloadLength = 440;
  fields.idCount = 0x1234;
  fields.lastStatus = static_cast<int32_t>(0xBFF6300A);
  const uint8_t version[4] = {21, 5, 0, 3};
  for (size_t i = 0; i < 4; ++i) fields.versionBytes[i] = version[i];
  const MessageHeader expected = {0x01, 0x02, 0x03, 0x04, 7,    0,    0,    0,    0xB8, 0x01,
                                  0x00, 0x00, 0x34, 0x12, 0x00, 0x00, 0x0A, 0x30, 0xF6, 0xBF,
                                  0x00, 0x0F, 0x00, 0x00, 0x15, 0x05, 0x00, 0x03};
  EXPECT_EQ(EncodeMessageHeader(fields), expected);
}

TEST(MessageHeaderTest, OnlyRecordStatisticsAndHardwareTypesAreBinary) {
  for (int type = 0; type < 256; ++type) {
    bool binary = type == 0 || type == 1 || type == 2 || type == 6 || type == 7;
    EXPECT_EQ(IsBinaryMessageType(static_cast<uint8_t>(type)), binary) << type;
  }
}

}  // namespace
}  // namespace nKV_DLL300
