// The host library's decoders: short headers, hardware tables of the wrong length.
#include <gtest/gtest.h>

#include "host/HostMessage.h"

namespace kvhost {
namespace {

TEST(HostMessageTest, HeaderNeedsAll28Bytes) {
  std::vector<uint8_t> bytes(27, 0);
  EXPECT_FALSE(DecodeHeader(bytes.data(), bytes.size()));
  bytes.push_back(0);
  EXPECT_TRUE(DecodeHeader(bytes.data(), bytes.size()));
}

TEST(HostMessageTest, HeaderFieldsAreLittleEndian) {
  std::vector<uint8_t> bytes = {1, 0, 0,    0,    7,    0,    0, 0,    0xB8, 1, 0,  0, 2, 0,
                                0, 0, 0xEC, 0xFF, 0xFF, 0xFF, 0, 0x0F, 0,    0, 21, 5, 0, 3};
  auto header = DecodeHeader(bytes.data(), bytes.size());
  ASSERT_TRUE(header);
  EXPECT_EQ(header->sequence, 1u);
  EXPECT_EQ(header->type, kHardwareTable);
  EXPECT_EQ(header->payloadLength, 440u);
  EXPECT_EQ(header->idCount, 2u);
  EXPECT_EQ(header->lastStatus, -20);
  EXPECT_EQ(header->version[0], 21);
}

TEST(HostMessageTest, HardwareTableMustBeWholeRecords) {
  EXPECT_FALSE(DecodeHardwareTable(std::vector<uint8_t>(45)));
  auto empty = DecodeHardwareTable({});
  ASSERT_TRUE(empty);
  EXPECT_TRUE(empty->empty());
  std::vector<uint8_t> record(44, 0);
  for (size_t i = 0; i < 16; ++i) record[i] = 'A';  // a name without NUL stops at 16 characters
  record[16] = 9;
  auto table = DecodeHardwareTable(record);
  ASSERT_TRUE(table);
  EXPECT_EQ((*table)[0].name, std::string(16, 'A'));
  EXPECT_EQ((*table)[0].port, 9u);
}

}  // namespace
}  // namespace kvhost
