// Trace output: the 255-character cut, length-limited text, arguments and interrupt level.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "platform/Console.h"
#include "qvapal/TraceOutput.h"
#include "qvapal/tConsoleTraceDestination.h"
#include "qvapal/tTrace.h"

namespace {

using namespace nQVAPAL000;

std::vector<std::string> shown;  // test thread only

void captureOutput(const char* text) { shown.emplace_back(text); }

class TraceTest : public ::testing::Test {
 protected:
  void SetUp() override {
    shown.clear();
    consoleOutputHook = captureOutput;
  }
  void TearDown() override { consoleOutputHook = defaultConsoleOutput; }
};

TEST_F(TraceTest, LongResultIsCutAt255Characters) {
  const std::string text(300, 'x');
  tracePrintf("%s", text.c_str());
  ASSERT_EQ(shown.size(), 1u);
  EXPECT_EQ(shown[0], text.substr(0, 255));
}

TEST_F(TraceTest, WriteTextNShowsAtMostLengthCharacters) {
  tConsoleTraceDestination console;
  console.writeTextN("abcdef", 3);
  console.writeTextN("ab", 5);
  console.writeText("whole\n");
  EXPECT_EQ(shown, (std::vector<std::string>{"abc", "ab", "whole\n"}));
}

TEST_F(TraceTest, ModuleTraceWritesThroughConsoleDestination) {
  moduleTrace().write("hello");
  EXPECT_EQ(shown, (std::vector<std::string>{"hello"}));
  EXPECT_TRUE(moduleTrace().destination()->isReady());
}

TEST(ConsoleDestinationTest, DestinationArgumentsTruncateAndReportNeededSize) {
  tConsoleTraceDestination console;
  char buffer[32];
  uint32_t needed = 0;
  console.getDestinationArguments(buffer, 8, &needed);
  EXPECT_STREQ(buffer, " --dest");
  EXPECT_EQ(needed, 20u);
  char untouched[4] = {'a', 'b', 'c', '\0'};
  needed = 0;
  console.getDestinationArguments(untouched, 0, &needed);
  EXPECT_STREQ(untouched, "abc");
  EXPECT_EQ(needed, 20u);
  console.getDestinationArguments(buffer, sizeof buffer, nullptr);
  EXPECT_STREQ(buffer, " --destination apal");
  console.getDestinationArguments(nullptr, 8, &needed);
}

TEST(DefaultConsoleOutputTest, ShowsTextOnStandardError) {
  testing::internal::CaptureStderr();
  tracePrintf("value %d", 7);
  EXPECT_EQ(testing::internal::GetCapturedStderr(), "value 7");
}

TEST(DefaultConsoleOutputTest, NothingReachesConsoleAtInterruptLevel) {
  testing::internal::CaptureStderr();
  {
    platform::SignalHandlerScope handler;
    tracePrintf("dropped");
  }
  EXPECT_EQ(testing::internal::GetCapturedStderr(), "");
}

}  // namespace
