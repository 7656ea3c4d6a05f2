// The status precedence rule and what a taken code records.
#include <gtest/gtest.h>

#include <cstdio>
#include <ostream>
#include <string>

#include "qvapal/StatusBlock.h"

namespace {

using nQVAPAL000::setStatus;
using nQVAPAL000::StatusBlock;

constexpr int32_t kError = -52008;
constexpr int32_t kOtherError = -7;
constexpr int32_t kWarning = 12;
constexpr int32_t kOtherWarning = 3;

struct Precedence {
  int32_t held;
  int32_t offered;
  bool taken;
  int32_t after;
};

void PrintTo(const Precedence& p, std::ostream* out) {
  *out << "held " << p.held << " offered " << p.offered;
}

class SetStatusPrecedenceTest : public ::testing::TestWithParam<Precedence> {};

TEST_P(SetStatusPrecedenceTest, TakesCodeOnlyByPrecedence) {
  const Precedence& p = GetParam();
  StatusBlock status;
  status.code = p.held;
  EXPECT_EQ(setStatus(status, p.offered, "file", 1), p.taken);
  EXPECT_EQ(status.code, p.after);
}

INSTANTIATE_TEST_SUITE_P(Rule, SetStatusPrecedenceTest,
                         ::testing::Values(Precedence{0, kError, true, kError},
                                           Precedence{0, kWarning, true, kWarning},
                                           Precedence{0, 0, false, 0},
                                           Precedence{kWarning, kError, true, kError},
                                           Precedence{kWarning, kOtherWarning, false, kWarning},
                                           Precedence{kWarning, 0, false, kWarning},
                                           Precedence{kError, kOtherError, false, kError},
                                           Precedence{kError, kWarning, false, kError},
                                           Precedence{kError, 0, false, kError}));

TEST(SetStatusTest, FullRecordGetsComponentFileAndLine) {
  StatusBlock status;
  status.reserved = 99;
  ASSERT_TRUE(setStatus(status, kError, "qvapal/quarks/thread", 536));
  EXPECT_STREQ(status.component, "kelvanert");
  EXPECT_STREQ(status.file, "qvapal/quarks/thread");
  EXPECT_EQ(status.line, 536u);
  EXPECT_EQ(status.reserved, 0u);
}

TEST(SetStatusTest, ShortStructSizeGetsCodeButNoDetails) {
  StatusBlock status;
  status.structSize = StatusBlock::kFullSize - 1;
  ASSERT_TRUE(setStatus(status, kError, "somewhere", 7));
  EXPECT_EQ(status.code, kError);
  EXPECT_STREQ(status.component, "");
  EXPECT_STREQ(status.file, "");
  EXPECT_EQ(status.line, 0u);
}

// The file is kept whole up to 100 characters, longer ones keep their first and last 49.
TEST(SetStatusTest, FileIsRecordedWholeCutInTheMiddleOrEmpty) {
  std::string longPath;
  for (int i = 0; i < 120; ++i) longPath += static_cast<char>('A' + i % 26);
  const std::string hundred(100, 'p');
  const std::pair<const char*, std::string> rows[] = {
      {hundred.c_str(), hundred},
      {longPath.c_str(), longPath.substr(0, 49) + ".." + longPath.substr(120 - 49)},
      {nullptr, ""}};
  for (const auto& [file, recorded] : rows) {
    StatusBlock status;
    std::snprintf(status.file, sizeof status.file, "stale");
    setStatus(status, kError, file, 4);
    EXPECT_EQ(std::string(status.file), recorded);
    EXPECT_EQ(status.line, 4u);
  }
}

}  // namespace
