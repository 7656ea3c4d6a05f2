// Random traffic through the indexed table and the plain reference table gives the same messages.
#include <gtest/gtest.h>

#include <random>

#include "bus/IdentifierTable.h"
#include "tests/bus/FrameBatch.h"
#include "tests/bus/LiteralIdentifierTable.h"

namespace nKV_DLL300 {
namespace {

using test::FrameBatch;
using test::LiteralIdentifierTable;
using test::MessageCapture;

struct Traffic {
  std::vector<uint8_t> types;
  std::vector<uint8_t> flags;
  std::vector<uint32_t> lengths;
  uint32_t identifiers;  // identifiers are drawn from 0 to identifiers - 1
};

const Traffic kCanTraffic{
    {0x00, 0x01, 0x02, 0x10, 0x18, 0xC0}, {0, 0, 0, 0x80}, {0, 1, 3, 8, 12, 64, 300, 2047}, 300};
const Traffic kLinTraffic{{0x40, 0x40, 0x41, 0x42}, {0, 1, 0x80, 0x81}, {0, 1, 2, 4, 8}, 64};
const Traffic kFlexRayTraffic{
    {0x20, 0x20, 0x21}, {0, 0x10, 0x20, 0x11, 0x22, 0x07, 0x90}, {0, 8, 16, 32, 254}, 120};

template <class T>
T Pick(std::mt19937& random, const std::vector<T>& from) {
  return from[std::uniform_int_distribution<size_t>(0, from.size() - 1)(random)];
}

FrameBatch RandomBatch(std::mt19937& random, const Traffic& traffic, uint64_t& clock) {
  FrameBatch batch;
  const int frames = std::uniform_int_distribution<int>(0, 40)(random);
  for (int i = 0; i < frames; ++i) {
    // Identifiers crowd at the low end so ties and repeats are frequent.
    const uint32_t a = std::uniform_int_distribution<uint32_t>(0, traffic.identifiers - 1)(random);
    const uint32_t identifier = a % (1 + a % 17);
    std::vector<uint8_t> payload(Pick(random, traffic.lengths));
    for (auto& b : payload) b = static_cast<uint8_t>(random());
    batch.add(++clock, identifier, Pick(random, traffic.types), Pick(random, traffic.flags),
              static_cast<uint8_t>(random()), payload);
  }
  return batch;
}

template <class Rules>
void CompareOnRandomTraffic(const Traffic& traffic, uint32_t seed) {
  std::mt19937 random(seed);
  const uint32_t capacity = std::uniform_int_distribution<uint32_t>(0, 80)(random);
  const uint32_t sendBuffer = std::uniform_int_distribution<uint32_t>(100, 6000)(random);
  auto table =
      IdentifierTable<Rules>::create(capacity, std::pmr::get_default_resource(), sendBuffer);
  LiteralIdentifierTable<Rules> reference(capacity, sendBuffer);
  uint64_t clock = 0;
  for (int step = 0; step < 300; ++step) {
    const TableSettings settings{static_cast<uint8_t>(random() % 2),
                                 static_cast<uint8_t>(random() % 2)};
    const FrameBatch batch = RandomBatch(random, traffic, clock);
    ASSERT_EQ(table->updateIdentifierTable(batch.data(), batch.size(), settings), 0);
    reference.updateIdentifierTable(batch.data(), batch.size(), settings);
    ASSERT_EQ(table->idCount(), reference.idCount()) << "seed " << seed << " step " << step;
    if (random() % 4 != 0) continue;
    const bool reset = random() % 8 == 0;
    MessageCapture ours, theirs;
    ASSERT_EQ(table->sendIdentifierRecords(reset, ours.sink()), 0);
    reference.sendIdentifierRecords(reset, theirs.sink());
    ASSERT_EQ(ours.messages, theirs.messages) << "seed " << seed << " step " << step;
  }
}

TEST(IdentifierTableReference, CanMessagesMatchThePlainSearchAndSort) {
  for (uint32_t seed = 1; seed <= 40; ++seed)
    CompareOnRandomTraffic<CanIdentifierRules>(kCanTraffic, seed);
}

TEST(IdentifierTableReference, LinMessagesMatchThePlainSearchAndSort) {
  for (uint32_t seed = 1; seed <= 40; ++seed)
    CompareOnRandomTraffic<LinIdentifierRules>(kLinTraffic, seed);
}

TEST(IdentifierTableReference, FlexRayMessagesMatchThePlainSearchAndSort) {
  for (uint32_t seed = 1; seed <= 40; ++seed) {
    CompareOnRandomTraffic<FlexRayIdentifierRules>(kFlexRayTraffic, seed);
  }
}

}  // namespace
}  // namespace nKV_DLL300
