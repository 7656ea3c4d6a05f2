// The thread controller's states: start, second start, join, restart, failures, destruction.
#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <condition_variable>
#include <mutex>
#include <string>

#include "qvapal/ErrorCodes.h"
#include "qvapal/tThreadController.h"

namespace {

using nQVAPAL000::iThread;
using nQVAPAL000::StatusBlock;
using nQVAPAL000::tThreadController;

constexpr auto kDeadline = std::chrono::seconds(30);

// A body that runs until released, so tests control when the thread ends.
class GatedBody final : public iThread {
 public:
  void run() override {
    std::unique_lock<std::mutex> lock(mutex);
    started = true;
    changed.notify_all();
    changed.wait(lock, [this] { return released; });
    finished = true;
    changed.notify_all();
  }
  void release() {
    std::lock_guard<std::mutex> lock(mutex);
    released = true;
    changed.notify_all();
  }
  bool waitStarted() {
    return waitFor([this] { return started; });
  }
  bool waitFinished() {
    return waitFor([this] { return finished; });
  }
  bool hasFinished() {
    std::lock_guard<std::mutex> lock(mutex);
    return finished;
  }

 private:
  template <typename Predicate>
  bool waitFor(Predicate predicate) {
    std::unique_lock<std::mutex> lock(mutex);
    return changed.wait_for(lock, kDeadline, predicate);
  }
  std::mutex mutex;
  std::condition_variable changed;
  bool started = false;   // guarded by mutex
  bool released = false;  // guarded by mutex
  bool finished = false;  // guarded by mutex
};

// The system's threads with switches that make creation or the priority change fail.
class FaultyThreads final : public platform::ThreadSystem {
 public:
  bool create(platform::ThreadStartRoutine routine, void* argument, platform::ThreadHandle& handle,
              uint32_t& threadId) override {
    ++createCalls;
    if (failCreate) return false;
    return system.create(routine, argument, handle, threadId);
  }
  int32_t getPriority(platform::ThreadHandle handle) override {
    return abnormalPriority ? 2 : system.getPriority(handle);
  }
  bool setPriority(platform::ThreadHandle handle, int32_t priority) override {
    return refusePriority ? false : system.setPriority(handle, priority);
  }
  bool setName(platform::ThreadHandle handle, const char* name) override {
    lastName = name;
    return system.setName(handle, name);
  }
  void wait(platform::ThreadHandle handle) override { system.wait(handle); }
  void close(platform::ThreadHandle& handle) override {
    ++closeCalls;
    system.close(handle);
  }

  platform::ThreadSystem& system = platform::SystemThreads();
  bool failCreate = false;
  bool abnormalPriority = false;
  bool refusePriority = false;
  int createCalls = 0;
  int closeCalls = 0;
  std::string lastName;
};

TEST(tThreadControllerTest, StartRunsBodyNamedKelvanertAndJoinWaitsForIt) {
  FaultyThreads threads;
  tThreadController controller(threads);
  GatedBody body;
  StatusBlock status;
  controller.start(&body, status);
  EXPECT_EQ(status.code, 0);
  EXPECT_TRUE(controller.isRunning());
  EXPECT_TRUE(controller.ownsThreadHandle());
  EXPECT_EQ(threads.lastName, "kelvanert");
  ASSERT_TRUE(body.waitStarted());
  body.release();
  controller.join();
  EXPECT_TRUE(body.hasFinished());
  EXPECT_FALSE(controller.isRunning());
  EXPECT_TRUE(controller.ownsThreadHandle());
}

TEST(tThreadControllerTest, SecondStartWhileRunningLeavesBusyStatus) {
  tThreadController controller;
  GatedBody first;
  GatedBody second;
  StatusBlock firstStatus;
  controller.start(&first, firstStatus);
  StatusBlock status;
  controller.start(&second, status);
  EXPECT_EQ(status.code, qvapalerr_threadRunning);
  EXPECT_STREQ(status.file, "qvapal\\protons\\thread\\tThreadController");
  EXPECT_EQ(status.line, 56u);
  EXPECT_TRUE(controller.isRunning());
  first.release();
  controller.join();
  EXPECT_TRUE(first.hasFinished());
}

TEST(tThreadControllerTest, StartAfterJoinStartsAgain) {
  tThreadController controller;
  GatedBody first;
  GatedBody second;
  StatusBlock status;
  controller.start(&first, status);
  first.release();
  controller.join();
  controller.start(&second, status);
  EXPECT_EQ(status.code, 0);
  EXPECT_TRUE(controller.isRunning());
  ASSERT_TRUE(second.waitStarted());
  second.release();
  controller.join();
  EXPECT_TRUE(second.hasFinished());
}

TEST(tThreadControllerTest, StatusAlreadyInErrorCreatesNoThread) {
  FaultyThreads threads;
  tThreadController controller(threads);
  GatedBody body;
  StatusBlock status;
  status.code = -3;
  controller.start(&body, status);
  EXPECT_EQ(threads.createCalls, 0);
  EXPECT_EQ(status.code, -3);
  EXPECT_STREQ(status.file, "");
  EXPECT_FALSE(controller.isRunning());
}

TEST(tThreadControllerTest, CreationFailureRecordsOsFault) {
  FaultyThreads threads;
  threads.failCreate = true;
  tThreadController controller(threads);
  GatedBody body;
  StatusBlock status;
  controller.start(&body, status);
  EXPECT_EQ(status.code, qvapalerr_osFault);
  EXPECT_STREQ(status.file, "qvapal/quarks/thread");
  EXPECT_EQ(status.line, 536u);
  EXPECT_FALSE(controller.isRunning());
  EXPECT_FALSE(controller.ownsThreadHandle());
}

TEST(tThreadControllerTest, RefusedPriorityLeavesThreadDetached) {
  FaultyThreads threads;
  threads.abnormalPriority = true;
  threads.refusePriority = true;
  tThreadController controller(threads);
  GatedBody body;
  StatusBlock status;
  controller.start(&body, status);
  EXPECT_EQ(status.code, qvapalerr_osFault);
  EXPECT_EQ(status.line, 975u);
  EXPECT_FALSE(controller.isRunning());
  EXPECT_FALSE(controller.ownsThreadHandle());
  controller.join();  // nothing to wait for: returns at once
  ASSERT_TRUE(body.waitStarted());
  body.release();
  EXPECT_TRUE(body.waitFinished());
}

TEST(tThreadControllerTest, AbnormalPriorityIsForcedToNormal) {
  FaultyThreads threads;
  threads.abnormalPriority = true;
  tThreadController controller(threads);
  GatedBody body;
  StatusBlock status;
  controller.start(&body, status);
  EXPECT_EQ(status.code, 0);
  EXPECT_TRUE(controller.isRunning());
  body.release();
  controller.join();
}

TEST(tThreadControllerTest, WarningInStatusStillStartsThread) {
  tThreadController controller;
  GatedBody body;
  StatusBlock status;
  status.code = 5;
  controller.start(&body, status);
  EXPECT_TRUE(controller.isRunning());
  body.release();
  controller.join();
  EXPECT_TRUE(body.hasFinished());
}

TEST(tThreadControllerTest, DestroyingRunningControllerDoesNotWaitForThread) {
  FaultyThreads threads;
  GatedBody body;
  {
    tThreadController controller(threads);
    StatusBlock status;
    controller.start(&body, status);
    ASSERT_TRUE(body.waitStarted());
  }
  EXPECT_EQ(threads.closeCalls, 1);
  EXPECT_FALSE(body.hasFinished());
  body.release();
  EXPECT_TRUE(body.waitFinished());
}

}  // namespace
