// The frame record a transmit write carries, and the payload list a host sends.
#include <gtest/gtest.h>

#include <algorithm>
#include <iterator>
#include <ostream>
#include <string>
#include <vector>

#include "hostlink/SessionSettings.h"
#include "transmit/CTransmitFrame.h"
#include "transmit/TransmitDatabaseName.h"
#include "transmit/TxFrameRecord.h"

namespace kvtest {
namespace {

using nKV_DLL300::BuildTxFrameRecord;
using nKV_DLL300::TxFrameFields;
using nKV_DLL300::TxFrameRecord;
using Bytes = std::vector<uint8_t>;

constexpr uint32_t kExtendedBit = 0x20000000;

struct RecordCase {
  const char* name;
  uint32_t identifier;
  bool extended;
  bool remote;
  uint32_t payloadLength;
  Bytes payload;
  uint32_t expectedSize;
  Bytes expectedPayload;  // the record's payload bytes up to its length
};

void PrintTo(const RecordCase& c, std::ostream* os) { *os << c.name; }

class TxFrameRecordTest : public ::testing::TestWithParam<RecordCase> {};

TEST_P(TxFrameRecordTest, CarriesIdentifierTypeLengthAndZeroPaddedPayload) {
  const RecordCase& c = GetParam();
  TxFrameFields fields;
  fields.identifier = c.identifier;
  fields.extended = c.extended;
  fields.remote = c.remote;
  fields.payloadLength = c.payloadLength;
  fields.payload = &c.payload;
  TxFrameRecord record;
  record.header.flags = record.header.info = 0xEE;  // nothing of an old record may survive
  std::fill(std::begin(record.payload), std::end(record.payload), 0xEE);

  const uint32_t size = BuildTxFrameRecord(fields, record);

  EXPECT_EQ(size, c.expectedSize);
  EXPECT_EQ(record.header.timestamp, 0u);
  EXPECT_EQ(record.header.identifier, c.identifier | (c.extended ? kExtendedBit : 0u));
  EXPECT_EQ(record.header.type, c.remote ? 1 : 0);
  EXPECT_EQ(record.header.flags, 0);
  EXPECT_EQ(record.header.info, 0);
  EXPECT_EQ(record.header.length, c.expectedPayload.size());
  const Bytes written(record.payload, record.payload + size - driver::kRawFrameHeaderSize);
  Bytes expected = c.expectedPayload;
  expected.resize(written.size(), 0);  // the padding is zeros
  EXPECT_EQ(written, expected);
}

INSTANTIATE_TEST_SUITE_P(
    Records, TxFrameRecordTest,
    ::testing::Values(
        RecordCase{
            "ShortPayloadPaddedToLength", 0x123, false, false, 5, {1, 2, 3}, 24, {1, 2, 3, 0, 0}},
        RecordCase{"EmptyFrame", 0x7FF, false, false, 0, {}, 24, {}},
        RecordCase{"PayloadLongerThanLengthIsCut", 0x10, false, false, 2, {9, 8, 7}, 24, {9, 8}},
        RecordCase{"NineBytesTakeSixteen", 0x10, false, false, 9, Bytes(9, 0x55), 32,
                   Bytes(9, 0x55)},
        RecordCase{"RemoteFrame", 0x321, false, true, 4, {}, 24, {0, 0, 0, 0}},
        RecordCase{"ExtendedIdentifierGetsBit29", 0x1ABCDE00, true, false, 1, {7}, 24, {7}},
        RecordCase{"FullFdPayload", 0x200, false, false, 64, Bytes(64, 0xA5), 80, Bytes(64, 0xA5)},
        // Only the low byte of the length counts (0x105 -> 5), and a record never holds more
        // than 64 payload bytes (200 -> 64).
        RecordCase{"LengthTakesItsLowByte", 0x1, false, false, 0x105, {1}, 24, {1, 0, 0, 0, 0}},
        RecordCase{"LengthAboveSixtyFourIsHeld", 0x1, false, false, 200, Bytes(70, 3), 80,
                   Bytes(64, 3)}),
    [](const auto& info) { return std::string(info.param.name); });

struct PayloadCase {
  const char* text;
  Bytes bytes;
};

void PrintTo(const PayloadCase& c, std::ostream* os) { *os << '"' << c.text << '"'; }

class SetTxPayloadTest : public ::testing::TestWithParam<PayloadCase> {};

// Without an active transmission the payload is only stored: no driver call is made.
TEST_P(SetTxPayloadTest, ListTextBecomesBytes) {
  nKV_DLL300::SessionSettings settings;
  int32_t status = 0;
  nKV_DLL300::CTransmitFrame frame(settings, status);
  frame.txPayload = {0xFF, 0xFF, 0xFF, 0xFF};  // an earlier payload is replaced whole

  frame.SetTxPayload(GetParam().text);

  EXPECT_EQ(frame.txPayload, GetParam().bytes);
  EXPECT_EQ(status, 0);
}

INSTANTIATE_TEST_SUITE_P(Lists, SetTxPayloadTest,
                         ::testing::Values(PayloadCase{"1,2,255", {1, 2, 255}}, PayloadCase{"", {}},
                                           PayloadCase{"1,,2", {1, 0, 2}},
                                           PayloadCase{"1,2,", {1, 2}}, PayloadCase{",", {0}},
                                           PayloadCase{"300", {0x2C}},
                                           PayloadCase{"256,257", {0, 1}},
                                           // No character is checked: each adds its code minus '0'.
                                           PayloadCase{"a", {'a' - '0'}}, PayloadCase{" 1", {97}},
                                           // A long run of digits wraps instead of overflowing.
                                           PayloadCase{"99999999999999999999", {255}}));

TEST(TransmitDatabaseNameTest, SameSecondDrawsSameNumberButOpenNamesStayDistinct) {
  using nKV_DLL300::TransmitDatabaseName;
  EXPECT_EQ(TransmitDatabaseName::draw(1234), TransmitDatabaseName::draw(1234));
  EXPECT_GE(TransmitDatabaseName::draw(0xFFFFFFFF), 0);
  EXPECT_LE(TransmitDatabaseName::draw(0xFFFFFFFF), 32767);

  const int first = TransmitDatabaseName::acquire();
  const int second = TransmitDatabaseName::acquire();
  EXPECT_NE(first, second);
  EXPECT_EQ(TransmitDatabaseName::format(first), ":memory" + std::to_string(first));
  TransmitDatabaseName::release(first);
  TransmitDatabaseName::release(second);
  TransmitDatabaseName::release(-1);  // nothing held: no effect
}

}  // namespace
}  // namespace kvtest
