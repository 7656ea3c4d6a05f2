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
