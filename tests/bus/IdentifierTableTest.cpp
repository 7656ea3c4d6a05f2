// Identifier tables of the three buses: keys, capacity, reset, payload copies and record messages.
#include <gtest/gtest.h>

#include "bus/IdentifierTable.h"
#include "tests/bus/FrameBatch.h"

namespace nKV_DLL300 {
namespace {

using test::CountingResource;
using test::DecodeRecords;
using test::FrameBatch;
using test::MessageCapture;

constexpr TableSettings kDefaults{};
constexpr TableSettings kTakeAll{1, 1};
constexpr uint8_t kCanRemote = 0x01, kCanBusError = 0x02, kCanFdBrs = 0x18;
constexpr uint8_t kLinData = 0x40, kLinBusError = 0x41, kLinNoResponse = 0x42;
constexpr uint8_t kFrData = 0x20, kFrNull = 0x21;
constexpr uint8_t kChannelA = 0x10, kChannelB = 0x20, kEcho = 0x80;

template <class Table>
std::vector<test::Message> Send(Table& table, bool reset = false) {
  MessageCapture capture;
  EXPECT_EQ(table.sendIdentifierRecords(reset, capture.sink()), 0);
  return capture.messages;
}

TEST(CanIdentifierTable, RepeatedIdentifierCountsAndListsSortedWithBothTimestamps) {
  auto table = CanIdentifierTable::create(1000);
  FrameBatch batch;
  batch.can(10, 0x200, {1}).can(20, 0x100, {2, 2}).can(30, 0x200, {3, 3, 3});
  EXPECT_EQ(table->updateIdentifierTable(batch.data(), batch.size(), kDefaults), 0);
  ASSERT_EQ(table->idCount(), 2);

  const auto messages = Send(*table);
  ASSERT_EQ(messages.size(), 1u);
  EXPECT_EQ(messages[0].type, 0);
  EXPECT_EQ(messages[0].records, 2);
  EXPECT_EQ(messages[0].bytes.size(), 2 * 28u + 2 + 3);
  const auto records = DecodeRecords(messages[0], kCanRecordSize);
  EXPECT_EQ(records[0].identifier, 0x100u);
  EXPECT_EQ(records[0].previousTimestamp, 20u);
  EXPECT_EQ(records[1].identifier, 0x200u);
  EXPECT_EQ(records[1].count, 2u);
  EXPECT_EQ(records[1].lastTimestamp, 30u);
  EXPECT_EQ(records[1].previousTimestamp, 10u);
  EXPECT_EQ(records[1].payload, (std::vector<uint8_t>{3, 3, 3}));
}

TEST(CanIdentifierTable, TypeIsPartOfTheKeyAndTiesKeepTheirFirstSeenOrder) {
  auto table = CanIdentifierTable::create(1000);
  FrameBatch batch;
  batch.can(1, 0x321, {}, kCanRemote)
      .can(2, 0x321, {1, 2})
      .can(3, 0x100, {})
      .can(4, 0x321, {}, kCanRemote);
  ASSERT_EQ(table->updateIdentifierTable(batch.data(), batch.size(), kDefaults), 0);
  const auto records = DecodeRecords(Send(*table)[0], kCanRecordSize);
  ASSERT_EQ(records.size(), 3u);
  EXPECT_EQ(records[1].type, kCanRemote);
  EXPECT_EQ(records[1].count, 2u);
  EXPECT_EQ(records[2].type, 0);
  EXPECT_EQ(records[2].count, 1u);
}

TEST(IdentifierTable, EchoesAndBusErrorsEnterOnlyWhenTheirSettingAllowsIt) {
  const struct {
    uint8_t type, flags;
    TableSettings settings;
    bool taken;
  } canRows[] = {{0, kEcho, kDefaults, false},         {0, kEcho, {1, 0}, true},
                 {kCanBusError, 0, kDefaults, false},  {kCanBusError, 0, {0, 1}, true},
                 {kCanBusError, kEcho, {0, 1}, false}, {kCanRemote, 0, kDefaults, true}};
  for (const auto& row : canRows) {
    auto table = CanIdentifierTable::create(10);
    FrameBatch batch;
    batch.can(1, 0x10, {}, row.type, row.flags);
    int taken = 0;
    table->updateIdentifierTable(batch.data(), batch.size(), row.settings,
                                 [&](const driver::RawFrameView&) { ++taken; });
    EXPECT_EQ(table->idCount(), row.taken ? 1 : 0) << int(row.type) << " " << int(row.flags);
    EXPECT_EQ(taken, row.taken ? 1 : 0);
    if (row.taken) {
      EXPECT_EQ(table->entry(0).echo, row.flags & kEcho);
    }
  }
  auto lin = LinIdentifierTable::create(10);
  FrameBatch batch;
  batch.add(1, 0x12, kLinBusError, 0, 0, {}).add(2, 0x13, kLinNoResponse, 0, 0, {});
  lin->updateIdentifierTable(batch.data(), batch.size(), kDefaults);
  ASSERT_EQ(lin->idCount(), 1);
  EXPECT_EQ(lin->entry(0).identifier, 0x13u);
}

TEST(IdentifierTable, FullTableListsNoNewIdentifierButCountsEveryFrame) {
  auto table = CanIdentifierTable::create(2);
  FrameBatch batch;
  batch.can(1, 0x1, {}).can(2, 0x2, {}).can(3, 0x3, {}).can(4, 0x1, {});
  int counted = 0;
  table->updateIdentifierTable(batch.data(), batch.size(), kDefaults,
                               [&](const driver::RawFrameView&) { ++counted; });
  EXPECT_EQ(counted, 4);
  ASSERT_EQ(table->idCount(), 2);
  EXPECT_EQ(table->entry(0).count, 2u);
  EXPECT_EQ(table->entry(1).identifier, 0x2u);
}

TEST(IdentifierTable, CapacityIsCappedAtTheIdCountRange) {
  EXPECT_EQ(CanIdentifierTable::create(0xFFFFFFFF)->capacity(), kIdentifierTableLimit);
  auto empty = LinIdentifierTable::create(0);
  FrameBatch batch;
  batch.add(1, 0x10, kLinData, 0, 0, {1});
  empty->updateIdentifierTable(batch.data(), batch.size(), kDefaults);
  EXPECT_EQ(empty->idCount(), 0);
  EXPECT_TRUE(Send(*empty).empty());
}

TEST(IdentifierTable, ResetTakesEffectAtTheNextSendWhichSendsNothing) {
  auto table = CanIdentifierTable::create(100);
  FrameBatch batch;
  batch.can(1, 0x100, {1, 2, 3}).can(2, 0x100, {1, 2, 3});
  table->updateIdentifierTable(batch.data(), batch.size(), kDefaults);
  EXPECT_EQ(Send(*table).size(), 1u);
  EXPECT_TRUE(Send(*table, true).empty());
  EXPECT_EQ(table->idCount(), 0);
  EXPECT_TRUE(Send(*table).empty());

  FrameBatch next;
  next.can(5, 0x100, {9});
  table->updateIdentifierTable(next.data(), next.size(), kDefaults);
  const auto records = DecodeRecords(Send(*table)[0], kCanRecordSize);
  ASSERT_EQ(records.size(), 1u);
  EXPECT_EQ(records[0].count, 1u);
  EXPECT_EQ(records[0].previousTimestamp, 5u);
  EXPECT_EQ(records[0].payload, std::vector<uint8_t>{9});
}

TEST(CanIdentifierTable, PayloadCopyFollowsEveryLengthChange) {
  auto table = CanIdentifierTable::create(10);
  std::vector<uint8_t> j1939(2047);
  for (size_t i = 0; i < j1939.size(); ++i) j1939[i] = static_cast<uint8_t>(i * 7);
  std::vector<uint8_t> fd(64, 0xAB);
  const std::vector<std::vector<uint8_t>> lengths = {{1, 2, 3, 4, 5, 6, 7, 8}, {9, 9}, fd, {}, {5}};
  for (const auto& payload : lengths) {
    FrameBatch batch;
    batch.can(1, 0x200, payload, kCanFdBrs);
    table->updateIdentifierTable(batch.data(), batch.size(), kDefaults);
    const auto records = DecodeRecords(Send(*table)[0], kCanRecordSize);
    EXPECT_EQ(records[0].payload, payload);
  }
  FrameBatch batch;
  batch.add(1, 0x38FEF100, driver::kFrameJ1939, 0, 0, j1939);
  table->updateIdentifierTable(batch.data(), batch.size(), kDefaults);
  const auto records = DecodeRecords(Send(*table)[0], kCanRecordSize);
  EXPECT_EQ(records[1].payloadLength, 2047u);
  EXPECT_EQ(records[1].payload, j1939);
}

TEST(CanIdentifierTable, RefusedPayloadCopyIsReportedAndSentWithoutPayload) {
  CountingResource resource;
  auto table = CanIdentifierTable::create(10, &resource);
  resource.refuseFrom = resource.allocations;
  FrameBatch batch;
  batch.can(1, 0x100, {1, 2, 3}).can(2, 0x101, {});
  EXPECT_EQ(table->updateIdentifierTable(batch.data(), batch.size(), kDefaults),
            kStatusPayloadNotStored);
  auto records = DecodeRecords(Send(*table)[0], kCanRecordSize);
  ASSERT_EQ(records.size(), 2u);
  EXPECT_EQ(records[0].payloadLength, 0u);
  EXPECT_EQ(records[0].count, 1u);

  resource.refuseFrom = SIZE_MAX;
  EXPECT_EQ(table->updateIdentifierTable(batch.data(), batch.size(), kDefaults), 0);
  records = DecodeRecords(Send(*table)[0], kCanRecordSize);
  EXPECT_EQ(records[0].payload, (std::vector<uint8_t>{1, 2, 3}));
}

TEST(IdentifierTable, TableThatCannotBeAllocatedIsNotMade) {
  CountingResource resource;
  resource.refuseFrom = 2;
  EXPECT_EQ(FlexRayIdentifierTable::create(1000, &resource), nullptr);
  EXPECT_EQ(resource.outstanding, 0u);
}

TEST(IdentifierTable, KnownIdentifiersCostNoAllocation) {
  CountingResource resource;
  auto table = CanIdentifierTable::create(100, &resource);
  FrameBatch batch;
  for (uint32_t id = 0; id < 50; ++id) batch.can(id, id, std::vector<uint8_t>(id % 9, 1));
  table->updateIdentifierTable(batch.data(), batch.size(), kDefaults);
  Send(*table);
  const size_t settled = resource.allocations;
  for (int round = 0; round < 20; ++round) {
    table->updateIdentifierTable(batch.data(), batch.size(), kDefaults);
    Send(*table);
  }
  EXPECT_EQ(resource.allocations, settled);
}

TEST(LinIdentifierTable, OneEntryPerIdentifierShowsItsLastFrame) {
  auto table = LinIdentifierTable::create(10);
  FrameBatch batch;
  batch.add(1, 0x11, kLinData, 0x01, 0x5A, {1, 2, 3, 4, 5, 6, 7, 8})
      .add(2, 0x10, kLinData, 0, 0x33, {0x12, 0x34})
      .add(3, 0x11, kLinNoResponse, 0, 0x00, {})
      .add(4, 0x11, kLinData, 0x81, 0xC7, {9, 8});
  table->updateIdentifierTable(batch.data(), batch.size(), kTakeAll);
  const auto messages = Send(*table);
  ASSERT_EQ(messages.size(), 1u);
  EXPECT_EQ(messages[0].type, 1);
  EXPECT_EQ(messages[0].records, 2);
  ASSERT_EQ(messages[0].bytes.size(), 2 * 40u);
  LinIdentifierEntry e;
  std::memcpy(&e, messages[0].bytes.data() + 40, sizeof e);
  EXPECT_EQ(e.identifier, 0x11u);
  EXPECT_EQ(e.count, 3u);
  EXPECT_EQ(e.type, kLinData);
  EXPECT_EQ(e.echo, kEcho);
  EXPECT_EQ(e.flag, 1);
  EXPECT_EQ((std::vector<uint8_t>(e.checksum, e.checksum + 4)),
            (std::vector<uint8_t>{0xC7, 0, 0, 0}));
  EXPECT_EQ(e.payloadLength, 2);
  // The shorter payload cleared the bytes the 8-byte one had left behind.
  EXPECT_EQ((std::vector<uint8_t>(e.payload, e.payload + 8)),
            (std::vector<uint8_t>{9, 8, 0, 0, 0, 0, 0, 0}));
}

TEST(FlexRayIdentifierTable, ChannelKeyFollowsFlagsOrTheFrameBeforeIt) {
  auto table = FlexRayIdentifierTable::create(100);
  FrameBatch batch;
  batch.add(1, 5, kFrData, kChannelA | 0x03, 7, {1, 2})
      .add(2, 5, kFrData, kChannelB, 7, {3})
      .add(3, 5, kFrNull, 0, 8, {})   // after a channel B frame: channel B
      .add(4, 9, kFrData, 0, 8, {4})  // new slot, still channel B
      .add(5, 9, kFrData, 0, 9, {5});
  table->updateIdentifierTable(batch.data(), batch.size(), kDefaults);
  FrameBatch next;
  next.add(6, 5, kFrNull, 0, 9, {});  // first of its batch: channel A
  table->updateIdentifierTable(next.data(), next.size(), kDefaults);

  const auto messages = Send(*table);
  ASSERT_EQ(messages.size(), 1u);
  EXPECT_EQ(messages[0].type, 2);
  const auto records = DecodeRecords(messages[0], kFlexRayRecordSize);
  ASSERT_EQ(records.size(), 3u);
  const struct {
    uint32_t slot, count;
    uint8_t channel, type, startup, sync, cycle;
    uint32_t payloadLength;
  } expected[] = {{5, 2, 0, kFrData, 0, 0, 9, 0},
                  {5, 2, 1, kFrData, 0, 0, 8, 0},
                  {9, 2, 1, kFrData, 0, 0, 9, 1}};
  for (size_t i = 0; i < 3; ++i) {
    EXPECT_EQ(records[i].identifier, expected[i].slot) << i;
    EXPECT_EQ(records[i].count, expected[i].count) << i;
    EXPECT_EQ(records[i].head[29], expected[i].channel) << i;
    EXPECT_EQ(records[i].type, expected[i].type) << i;
    EXPECT_EQ(records[i].head[26], expected[i].startup) << i;
    EXPECT_EQ(records[i].head[30], expected[i].cycle) << i;
    EXPECT_EQ(records[i].payloadLength, expected[i].payloadLength) << i;
  }
}

TEST(IdentifierTable, RecordsBeyondTheSendBufferGoOutInFurtherMessages) {
  constexpr uint32_t kIdentifiers = 4000;
  auto table = CanIdentifierTable::create(kIdentifiers);
  FrameBatch batch;
  for (uint32_t id = 0; id < kIdentifiers; ++id)
    batch.can(id, kIdentifiers - id, std::vector<uint8_t>(64, 1), kCanFdBrs);
  table->updateIdentifierTable(batch.data(), batch.size(), kDefaults);
  const auto messages = Send(*table);
  ASSERT_EQ(messages.size(), 4u);  // 92 bytes a record: 1086 fit in 100 000 bytes
  uint32_t next = 1, total = 0;
  for (const auto& m : messages) {
    EXPECT_LE(m.bytes.size(), kSendBufferSize);
    const auto records = DecodeRecords(m, kCanRecordSize);
    EXPECT_EQ(m.records, records.size());
    for (const auto& r : records) EXPECT_EQ(r.identifier, next++);
    total += m.records;
  }
  EXPECT_EQ(total, kIdentifiers);
}

TEST(IdentifierTable, FailedSendEndsTheSendWithItsStatus) {
  constexpr int32_t kSendFailed = -3;
  auto table = FlexRayIdentifierTable::create(100, std::pmr::get_default_resource(), 100);
  FrameBatch batch;
  for (uint32_t slot = 1; slot <= 20; ++slot) batch.add(slot, slot, kFrData, kChannelA, 0, {1});
  table->updateIdentifierTable(batch.data(), batch.size(), kDefaults);
  MessageCapture capture;
  capture.result = kSendFailed;
  EXPECT_EQ(table->sendIdentifierRecords(false, capture.sink()), kSendFailed);
  EXPECT_EQ(capture.messages.size(), 1u);
}

TEST(IdentifierTable, TruncatedBatchEndsAtTheLastWholeFrame) {
  auto table = CanIdentifierTable::create(10);
  FrameBatch batch;
  batch.can(1, 0x1, {1}).can(2, 0x2, std::vector<uint8_t>(64, 2), kCanFdBrs);
  table->updateIdentifierTable(batch.data(), batch.size() - 8, kDefaults);
  EXPECT_EQ(table->idCount(), 1);
}

}  // namespace
}  // namespace nKV_DLL300
