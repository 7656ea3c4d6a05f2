// What the view decides for each row: identifier filters, timing health, keys, and the selection
// by change, age and sort order.
#include <gtest/gtest.h>

#include <algorithm>
#include <string>
#include <vector>

#include "host/kvmon/RowFilter.h"
#include "host/kvmon/RowSelection.h"
#include "host/kvmon/TerminalKeys.h"
#include "host/kvmon/TimingHealth.h"

namespace kvmon {
namespace {

constexpr uint64_t kMs = 10000;                  // 100 ns units
constexpr uint64_t kT0 = 133604103030420000ULL;  // some moment in 2024
constexpr uint32_t kExtended = 0x20000000;

kvhost::IdentifierRecord Frame(uint32_t id, uint32_t count, uint64_t last, uint64_t previous,
                               uint8_t channel = 0, std::vector<uint8_t> payload = {}) {
  kvhost::IdentifierRecord r;
  r.identifier = id;
  r.count = count;
  r.lastTimestamp = last;
  r.previousTimestamp = previous;
  r.channel = channel;
  r.payloadLength = static_cast<uint32_t>(payload.size());
  r.payload = std::move(payload);
  return r;
}

struct FilterCase {
  const char* filter;
  Bus bus;
  uint32_t identifier;  // CAN: with the extended bit
  uint8_t channel;
  bool shown;
};

TEST(KvmonRowFilter, TermsAreReadByTheBusOfTheRow) {
  const FilterCase cases[] = {
      {"100,1A0", Bus::kCan, 0x100, 0, true},
      {"100,1A0", Bus::kCan, 0x1A0, 0, true},
      {"100,1A0", Bus::kCan, 0x321, 0, false},
      {"100", Bus::kCan, kExtended | 0x100, 0, false},  // three digits: standard only
      {"00000100", Bus::kCan, kExtended | 0x100, 0, true},
      {"18FEF100", Bus::kCan, kExtended | 0x18FEF100, 0, true},
      {"18fef100", Bus::kCan, 0x100, 0, false},
      {"100:700", Bus::kCan, 0x1FF, 0, true},  // mask: only the top three bits count
      {"100:700", Bus::kCan, 0x200, 0, false},
      {"18FE0000:1FFF0000", Bus::kCan, kExtended | 0x18FEF100, 0, true},
      {"~321", Bus::kCan, 0x321, 0, false},
      {"~321", Bus::kCan, 0x100, 0, true},
      {"100:700,~123", Bus::kCan, 0x123, 0, false},
      {"10", Bus::kLin, 0x10, 0, true},
      {"10:30", Bus::kLin, 0x13, 0, true},
      {"10", Bus::kLin, 0x11, 0, false},
      {"40", Bus::kFlexRay, 40, 1, true},  // FlexRay: a decimal slot on either channel
      {"40A", Bus::kFlexRay, 40, 1, false},
      {"40b", Bus::kFlexRay, 40, 1, true},
      {"40", Bus::kFlexRay, 0x40, 0, false},
      {"1A0", Bus::kFlexRay, 1, 0, false},  // no slot reading
      {"~2", Bus::kFlexRay, 3, 0, true},
  };
  for (const auto& c : cases) {
    std::string error;
    const auto filter = RowFilter::parse(c.filter, error);
    ASSERT_TRUE(filter) << c.filter << ": " << error;
    EXPECT_EQ(filter->accepts(c.bus, Frame(c.identifier, 1, 0, 0, c.channel)), c.shown)
        << c.filter << " on " << BusName(c.bus) << " " << std::hex << c.identifier;
  }
  // Neither a hex identifier nor a decimal slot.
  for (const char* bad : {"", "100,", "G1", "100:", "123456789", "~", "40G", "1:2:3", "20000000"}) {
    std::string error;
    EXPECT_FALSE(RowFilter::parse(bad, error)) << bad;
    EXPECT_FALSE(error.empty()) << bad;
  }
}

// One identifier's reports: count and the last two stamps, as the controller sends them, and the
// host time of receipt (0: when the last frame was stamped, the host clock running with the bus).
struct Report {
  uint32_t count;
  uint64_t lastMs, previousMs, receivedMs = 0;
};

struct Expected {
  std::optional<double> mean, jitter, minGap, maxGap;
};

struct TimingCase {
  const char* name;
  std::vector<Report> reports;
  Expected expected;
  bool overdue;
  uint64_t busyUntilMs = 0;  // the last report also holds another identifier stamped then
};

TEST(KvmonTimingHealth, GapsMeanJitterAndOverdueFollowTheReports) {
  const TimingCase cases[] = {
      {"one frame tells nothing", {{1, 5, 5}}, {}, false},
      {"steady 10 ms", {{100, 1000, 990}, {200, 2000, 1990}}, {10.0, 0.0, 10.0, 10.0}, false},
      {"a first report gives its gap", {{100, 1000, 990}}, {10.0, {}, 10.0, 10.0}, false},
      {"gaps of 9 and 11 ms", {{100, 1000, 991}, {200, 2000, 1989}}, {10.0, 1.0, 9.0, 11.0}, false},
      {"a stall between reports widens the largest gap",
       {{10, 1000, 990}, {11, 1500, 1000}, {21, 1600, 1590}},
       {600.0 / 11, 230.9882, 10.0, 500.0},
       false},
      {"silent for more than three periods while the bus is busy",
       {{100, 1000, 990}, {200, 2000, 1990}},
       {10.0, 0.0, 10.0, 10.0},
       true,
       2031},
      {"three periods exactly are no silence yet",
       {{100, 1000, 990}, {200, 2000, 1990}},
       {10.0, 0.0, 10.0, 10.0},
       false,
       2030},
      {"a report received late by the host is no silence",
       {{100, 1000, 990, 1005}, {200, 2000, 1990, 2400}},
       {10.0, 0.0, 10.0, 10.0},
       false},
      {"a bus that fell silent ages by the host clock",
       {{100, 1000, 990}, {200, 2000, 1990}, {200, 2000, 1990, 3000}},
       {10.0, 0.0, 10.0, 10.0},
       true},
      {"a reset starts again",
       {{500, 1000, 990}, {3, 1100, 1050}, {5, 1200, 1150}},
       {50.0, 0.0, 50.0, 50.0},
       false},
  };
  for (const auto& c : cases) {
    TimingTracker tracker(3.0);
    for (const Report& r : c.reports) {
      std::vector<kvhost::IdentifierRecord> records = {
          Frame(0x100, r.count, kT0 + r.lastMs * kMs, kT0 + r.previousMs * kMs)};
      const bool last = &r == &c.reports.back();
      if (last && c.busyUntilMs != 0)
        records.push_back(Frame(0x200, 1, kT0 + c.busyUntilMs * kMs, kT0 + c.busyUntilMs * kMs));
      const uint64_t received =
          r.receivedMs != 0 ? r.receivedMs : std::max(r.lastMs, c.busyUntilMs);
      tracker.update(Bus::kCan, records, kT0 + (last ? received : r.lastMs) * kMs);
    }
    const auto& last = c.reports.back();
    const Timing t = tracker.of(Bus::kCan, Frame(0x100, last.count, kT0 + last.lastMs * kMs, 0));
    const Expected& e = c.expected;
    EXPECT_EQ(t.meanMs.has_value(), e.mean.has_value()) << c.name;
    EXPECT_NEAR(t.meanMs.value_or(0), e.mean.value_or(0), 1e-9) << c.name;
    EXPECT_EQ(t.jitterMs.has_value(), e.jitter.has_value()) << c.name;
    EXPECT_NEAR(t.jitterMs.value_or(0), e.jitter.value_or(0), 1e-3) << c.name;
    EXPECT_EQ(t.minGapMs, e.minGap) << c.name;
    EXPECT_EQ(t.maxGapMs, e.maxGap) << c.name;
    EXPECT_EQ(t.overdue, c.overdue) << c.name;
  }
}

TEST(KvmonTimingHealth, ReportTimeGoesOnWithTheHostClockWhenTheBusFallsSilent) {
  TimingTracker tracker(3.0);
  // The controller's clock is 5 s ahead of the host's; the first report reaches the host at once.
  constexpr uint64_t kAhead = 5000 * kMs;
  const auto row = Frame(0x100, 100, kT0 + 1000 * kMs, kT0 + 990 * kMs);
  tracker.update(Bus::kCan, {row}, kT0 + 1000 * kMs - kAhead);
  EXPECT_EQ(tracker.reportTime(), kT0 + 1000 * kMs);
  tracker.update(Bus::kCan, {row}, kT0 + 2000 * kMs - kAhead);  // the same row a second later
  EXPECT_EQ(tracker.reportTime(), kT0 + 1500 * kMs);            // half a second of slack
  EXPECT_TRUE(tracker.of(Bus::kCan, row).overdue);
}

TEST(KvmonKeys, TerminalBytesBecomeKeys) {
  const std::pair<std::string, std::vector<Key>> cases[] = {
      {"q", {Key::kQuit}},
      {" pc", {Key::kPause, Key::kPause, Key::kClear}},
      {"st", {Key::kSort, Key::kTiming}},
      {"\x1b[A\x1b[B", {Key::kUp, Key::kDown}},
      {"\x1b[5~\x1b[6~", {Key::kPageUp, Key::kPageDown}},
      {"\x1b[H\x1b[F\x1bOH\x1b[4~", {Key::kHome, Key::kEnd, Key::kHome, Key::kEnd}},
      {"jkgG", {Key::kDown, Key::kUp, Key::kHome, Key::kEnd}},
      {"\x1b[15~x\x1b[Cq", {Key::kQuit}},  // F5, an unknown letter and arrow right are skipped
  };
  for (const auto& [bytes, keys] : cases) EXPECT_EQ(DecodeKeys(bytes), keys) << bytes.size();
}

std::vector<uint32_t> Shown(const SourceModel& source, const ViewOptions& view) {
  std::vector<uint32_t> ids;
  for (const auto& row : SelectRows({&source}, view)) ids.push_back(row.row->record.identifier);
  return ids;
}

TEST(KvmonRowSelection, ChangedOnlyAgeAndSortOrderPickTheRows) {
  SourceModel can("CAN1", Bus::kCan, 3.0);
  const uint64_t now = kT0 + 2000 * kMs;
  can.takeRecords({Frame(0x100, 100, kT0 + 1000 * kMs, kT0 + 990 * kMs, 0, {1}),
                   Frame(0x200, 5, kT0 + 1000 * kMs, kT0 + 800 * kMs, 0, {2})},
                  0, kT0 + 1000 * kMs);
  can.takeRecords({Frame(0x100, 200, now, now - 10 * kMs, 0, {9}),
                   Frame(0x200, 5, kT0 + 1000 * kMs, kT0 + 800 * kMs, 0, {2}),
                   Frame(0x300, 900, now - 1 * kMs, now - 2 * kMs, 0, {3})},
                  0, now);
  ViewOptions view;
  EXPECT_EQ(Shown(can, view), (std::vector<uint32_t>{0x100, 0x200, 0x300}));
  view.changedOnly = true;  // 0x200 kept its payload; 0x300 is new
  EXPECT_EQ(Shown(can, view), (std::vector<uint32_t>{0x100, 0x300}));
  view = ViewOptions{};
  view.ageSeconds = 0.5;  // 0x200's last frame is a second old
  EXPECT_EQ(Shown(can, view), (std::vector<uint32_t>{0x100, 0x300}));
  view = ViewOptions{};
  const std::pair<SortOrder, std::vector<uint32_t>> orders[] = {
      {SortOrder::kCount, {0x300, 0x100, 0x200}},
      {SortOrder::kPeriod, {0x300, 0x100, 0x200}},
      {SortOrder::kRecent, {0x100, 0x300, 0x200}},
      {SortOrder::kIdentifier, {0x100, 0x200, 0x300}},
  };
  for (const auto& [order, ids] : orders) {
    view.sort = order;
    EXPECT_EQ(Shown(can, view), ids) << SortOrderName(order);
  }
}

}  // namespace
}  // namespace kvmon
