// The value readers of property messages, one row per input.
#include <gtest/gtest.h>

#include <string>

#include "protocol/ValueReaders.h"

namespace nKV_DLL300 {
namespace {

struct IntegerRow {
  std::string value;
  int32_t integer;
  uint8_t byte;
};

TEST(ValueReadersTest, IntegerAndByteFollowTheDecimalRule) {
  // clang-format off
  const IntegerRow rows[] = {
      {"500000", 500000, 0x20}, {"  \t42xyz", 42, 42}, {"+7", 7, 7}, {"-1", -1, 255},
      {"256", 256, 0}, {"abc", 0, 0}, {"", 0, 0}, {"-", 0, 0}, {"12 34", 12, 12}, {"1\n", 1, 1},
      {"99999999999", INT32_MAX, 0xFF}, {"-99999999999", INT32_MIN, 0x00},
      {"2147483648", INT32_MAX, 0xFF}, {"-2147483648", INT32_MIN, 0x00},
  };
  // clang-format on
  for (const IntegerRow& row : rows) {
    EXPECT_EQ(ReadInteger(row.value), row.integer) << row.value;
    EXPECT_EQ(ReadByte(row.value), row.byte) << row.value;
  }
}

TEST(ValueReadersTest, Unsigned64KeepsThePreviousValueWithoutDigits) {
  constexpr uint64_t kPrevious = 250000;
  // clang-format off
  const std::pair<std::string, uint64_t> rows[] = {
      {"500000", 500000}, {"abc", kPrevious}, {"", kPrevious}, {" -", kPrevious}, {"  +12x", 12},
      {"-1", UINT64_MAX}, {"18446744073709551615", UINT64_MAX},
      {"99999999999999999999999", UINT64_MAX},
  };
  // clang-format on
  for (const auto& [value, expected] : rows) {
    EXPECT_EQ(ReadUnsigned64(value, kPrevious), expected) << value;
  }
}

TEST(ValueReadersTest, KeyChoosesItsBaseFromThePrefix) {
  // clang-format off
  const std::pair<std::string, uint32_t> rows[] = {
      {"0x10", 16}, {"0X1f", 31}, {"010", 8}, {"10", 10}, {"0x", 0}, {"0xg", 0}, {"08", 0},
      {"", 0}, {"zz", 0}, {" 7", 7}, {"-1", 0xFFFFFFFFu}, {"-0x10", 0xFFFFFFF0u},
      {"0xFFFFFFFF", 0xFFFFFFFFu}, {"0x100000000", 0xFFFFFFFFu}, {"-99999999999", 0xFFFFFFFFu},
  };
  // clang-format on
  for (const auto& [value, expected] : rows) EXPECT_EQ(ReadKey(value), expected) << value;
}

TEST(ValueReadersTest, RateTakesACommaAsDecimalPoint) {
  const std::pair<std::string, double> rows[] = {
      {"0,5", 0.5}, {"0.25", 0.25}, {"2", 2.0}, {"abc", 0.0}, {"", 0.0}, {" -1,5e1", -15.0},
  };
  for (const auto& [value, expected] : rows) EXPECT_DOUBLE_EQ(ReadRate(value), expected) << value;
}

TEST(ValueReadersTest, ReadersStopAtTheEndOfTheViewEvenWithoutTerminator) {
  const char digits[] = {'1', '2', '3', '4'};
  std::string_view firstTwo(digits, 2);
  EXPECT_EQ(ReadInteger(firstTwo), 12);
  EXPECT_EQ(ReadUnsigned64(firstTwo, 0), 12u);
  EXPECT_EQ(ReadKey(firstTwo), 12u);
  EXPECT_DOUBLE_EQ(ReadRate(firstTwo), 12.0);
}

}  // namespace
}  // namespace nKV_DLL300
