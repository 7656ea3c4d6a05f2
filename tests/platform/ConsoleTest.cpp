// Console messages on standard error and the interrupt-level check.
#include <gtest/gtest.h>

#include "platform/Console.h"

namespace {

TEST(ConsoleTest, DisplayMessageWritesFormattedTextToStandardError) {
  testing::internal::CaptureStderr();
  platform::EtsDisplayMessage("%s=%d", "port", 13456);
  EXPECT_EQ(testing::internal::GetCapturedStderr(), "port=13456");
}

TEST(ConsoleTest, InterruptLevelOnlyInsideSignalHandlerScope) {
  EXPECT_FALSE(platform::EtsCheckISRPriority());
  {
    platform::SignalHandlerScope handler;
    EXPECT_TRUE(platform::EtsCheckISRPriority());
  }
  EXPECT_FALSE(platform::EtsCheckISRPriority());
}

}  // namespace
