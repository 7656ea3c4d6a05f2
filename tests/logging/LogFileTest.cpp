// Log file life cycle: naming, truncation, the open failures and their reports, closing.
#include <sys/resource.h>

#include <csignal>
#include <filesystem>
#include <functional>
#include <tuple>

#include "logging/LogFile.h"
#include "logging/LogFileName.h"
#include "logging/LogWriters.h"
#include "tests/logging/FrameBuilder.h"
#include "tests/logging/LogSessionHarness.h"

namespace kvtest {
namespace {

namespace fs = std::filesystem;
using namespace nKV_DLL300;

constexpr std::string_view kHeader = "Timestamp\tID\tPayload\tPayload Length\tType\tName";

std::vector<uint8_t> OneCanFrame(uint8_t counter) {
  return Batch({{.identifier = 0x100, .payload = {counter, 1, 2, 3, 4, 5, 6, 7}}});
}

// Every regular file below `root`, as paths relative to it.
std::vector<std::string> FilesBelow(const fs::path& root) {
  std::vector<std::string> files;
  for (const auto& entry : fs::recursive_directory_iterator(root)) {
    if (entry.is_regular_file()) files.push_back(fs::relative(entry.path(), root).string());
  }
  return files;
}

TEST(LogFileNameTest, OnlyPlainNamesAreFileNames) {
  for (const char* name : {"run", "", "run.1", "...", " a b ", "C:x", "..a"}) {
    EXPECT_TRUE(IsPlainFileName(name)) << name;
  }
  for (const std::string& name : std::vector<std::string>{"a/b", "a\\b", ".", "..", "..\\..\\x",
                                                          "/etc/passwd", std::string("a\0b", 3)}) {
    EXPECT_FALSE(IsPlainFileName(name)) << name;
  }
}

using LogFileTest = LogSessionTest;

TEST_F(LogFileTest, SecondRunWithTheSameNameKeepsOnlyItsOwnFrames) {
  for (uint8_t type : {kLogTypeText, kLogTypeBinary}) {
    settings().logFileType.store(type);
    settings().logFileName.set("again");
    const std::string file = "again" + LogFileExtension(type);
    for (uint8_t run : {1, 2}) {
      UseBus(driver::BusKind::kCan);
      OpenLogFile(log(), kHeader);
      for (uint8_t i = 0; i < (run == 1 ? 5 : 2); ++i) {
        const std::vector<uint8_t> batch = OneCanFrame(i);
        WriteCanLog(log(), batch.data(), static_cast<uint32_t>(batch.size()), 1);
      }
      CloseLogFile(log());
    }
    const std::optional<std::string> contents = ReadLog(file);
    ASSERT_TRUE(contents) << file;
    if (type == kLogTypeBinary) {
      EXPECT_EQ(contents->size(), 12u + 2 * 24u);
    } else {
      EXPECT_EQ(std::count(contents->begin(), contents->end(), '\n'), 3) << *contents;
    }
  }
}

TEST_F(LogFileTest, UnsafeNamesCreateNothingAndReportTwice) {
  // The directory exists before, so that only the log's own file could appear.
  settings().logFileType.store(kLogTypeText);
  settings().logFileName.set("ok");
  OpenLogFile(log(), kHeader);
  CloseLogFile(log());
  fs::remove(ServiceDirectory() / "ok.txt");
  const std::vector<std::string> before = FilesBelow(drive_.path());
  for (const std::string& name :
       std::vector<std::string>{"..\\..\\..\\escaped", "../../../escaped", "sub/escaped", ".", "..",
                                "\\escaped", std::string("cut\0..\\x", 8)}) {
    for (uint8_t type : {kLogTypeText, kLogTypeBinary}) {
      settings().logFileName.set(name);
      settings().logFileType.store(type);
      OpenLogFile(log(), kHeader);
      CloseLogFile(log());
      EXPECT_EQ(SentErrorTexts(), std::vector<std::string>(2, LogErrorText(kLogOpenFailed)))
          << name;
      EXPECT_EQ(session().lastStatus.load(), kLogOpenFailed);
    }
  }
  EXPECT_EQ(FilesBelow(drive_.path()), before);
  EXPECT_FALSE(fs::exists(drive_.path().parent_path() / "escaped.txt"));
}

// Each failure to open is reported (once, or twice when the directory lookup failed first) and the
// session keeps the status.
TEST_F(LogFileTest, OpenFailuresReportAndSkipTheRun) {
  struct Case {
    const char* what;
    uint8_t type;
    const char* name;
    std::function<void()> arrange;
    size_t reports;
  };
  const auto block = [&](const char* file) {
    return [this, file] { fs::create_directories(ServiceDirectory() / file); };
  };
  const Case cases[] = {
      {"unknown type: no name", 3, "any", [] {}, 1},
      // A directory where the file should be cannot be opened for writing, whoever runs the test.
      {"text file is a directory", kLogTypeText, "blocked", block("blocked.txt"), 1},
      {"binary file is a directory", kLogTypeBinary, "blocked", block("blocked.zfl"), 1},
      {"unwritable directory (not for root)", kLogTypeText, "denied",
       [&] { fs::permissions(ServiceDirectory(), fs::perms::owner_read | fs::perms::owner_exec); },
       ::geteuid() == 0 ? 0u : 1u},
      // A file stands where the directory's parent should be: the lookup fails, then the open.
      {"directory cannot be made", kLogTypeText, "",
       [&] {
         fs::permissions(ServiceDirectory(), fs::perms::owner_all);
         fs::remove_all(drive_.Native("QV-RT\\tarvix"));
         drive_.WriteFile("QV-RT\\tarvix", "not a directory");
       },
       2},
  };
  for (const Case& c : cases) {
    UseBus(driver::BusKind::kCan);
    settings().logFileType.store(c.type);
    settings().logFileName.set(c.name);
    c.arrange();
    OpenLogFile(log(), kHeader);
    const std::vector<uint8_t> batch = OneCanFrame(0);
    WriteCanLog(log(), batch.data(), static_cast<uint32_t>(batch.size()), 1);
    CloseLogFile(log());
    EXPECT_EQ(SentErrorTexts(), std::vector<std::string>(c.reports, LogErrorText(kLogOpenFailed)))
        << c.what;
    if (c.reports > 0) {
      EXPECT_EQ(session().lastStatus.load(), kLogOpenFailed) << c.what;
    }
  }
}

TEST_F(LogFileTest, CloseWithoutAnOpenSendsNothing) {
  CloseLogFile(log());
  CloseLogFile(log());
  EXPECT_TRUE(SentMessages().empty());
}

TEST_F(LogFileTest, TypeChangedDuringTheRunKeepsTheFileItsFormat) {
  settings().logFileName.set("steady");
  OpenLogFile(log(), kHeader);
  settings().logFileType.store(kLogTypeBinary);
  const std::vector<uint8_t> batch = OneCanFrame(7);
  WriteCanLog(log(), batch.data(), static_cast<uint32_t>(batch.size()), 1);
  settings().logFileType.store(kLogTypeMeasurementData);
  CloseLogFile(log());
  const std::optional<std::string> contents = ReadLog("steady.txt");
  ASSERT_TRUE(contents);
  EXPECT_EQ(*contents,
            std::string(kHeader) + "\n09:05:03,042\t100\t07  01  02  03  04  05  06  07  \t8\tS\n");
}

// A J1939 message far longer than a CAN FD frame is written whole, as a line and as a record.
TEST_F(LogFileTest, LongJ1939MessagesAreWrittenWhole) {
  settings().applicationProtocol.store(1);
  const std::vector<uint8_t> batch = Batch({{.identifier = 0x2000'0000 | 0x18EF00FE,
                                             .type = 0xC0,
                                             .info = 1785 / 256,
                                             .payload = Counting(1785),
                                             .lengthByte = 1785 % 256}});
  for (uint8_t type : {kLogTypeText, kLogTypeBinary}) {
    settings().logFileType.store(type);
    settings().logFileName.set("j1939");
    OpenLogFile(log(), kHeader);
    WriteCanLog(log(), batch.data(), static_cast<uint32_t>(batch.size()), 1);
    CloseLogFile(log());
  }
  const std::string text = ReadLog("j1939.txt").value_or("");
  EXPECT_NE(text.find("\t1785\tE\n"), std::string::npos);
  EXPECT_EQ(text.size(), kHeader.size() + 1 + 13 + 9 + 4 * 1785 + 6 + 2);
  EXPECT_EQ(ReadLog("j1939.zfl").value_or("").size(), 12u + 16u + 1792u);
}

// A file size limit stands for a full disk: writes beyond it fail (EFBIG), for root too.
class FullDiskTest : public LogSessionTest {
 protected:
  static constexpr rlim_t kLimit = 64 * 1024;
  void SetUp() override {
    LogSessionTest::SetUp();
    ASSERT_EQ(::getrlimit(RLIMIT_FSIZE, &saved_), 0);
    previousHandler_ = std::signal(SIGXFSZ, SIG_IGN);
  }
  void TearDown() override {
    ::setrlimit(RLIMIT_FSIZE, &saved_);
    std::signal(SIGXFSZ, previousHandler_);
    LogSessionTest::TearDown();
  }
  void LimitFileSize() {
    rlimit limit = saved_;
    limit.rlim_cur = kLimit;
    ASSERT_EQ(::setrlimit(RLIMIT_FSIZE, &limit), 0);
  }
  rlimit saved_{};
  void (*previousHandler_)(int) = SIG_DFL;
};

TEST_F(FullDiskTest, WritesBeyondTheLimitReportIncompleteLinesAndTheRunGoesOn) {
  for (uint8_t type : {kLogTypeText, kLogTypeBinary}) {
    settings().logFileType.store(type);
    settings().logFileName.set("full");
    OpenLogFile(log(), kHeader);
    LimitFileSize();
    constexpr int kBatches = 4000;  // far more than the limit holds in either format
    for (int i = 0; i < kBatches; ++i) {
      const std::vector<uint8_t> batch = OneCanFrame(static_cast<uint8_t>(i));
      WriteCanLog(log(), batch.data(), static_cast<uint32_t>(batch.size()), 1);
    }
    CloseLogFile(log());
    ::setrlimit(RLIMIT_FSIZE, &saved_);
    const std::vector<std::string> texts = SentErrorTexts();
    ASSERT_FALSE(texts.empty());
    for (const std::string& text : texts) EXPECT_EQ(text, LogErrorText(kLogWriteIncomplete));
    EXPECT_EQ(session().lastStatus.load(), kLogWriteIncomplete);
    EXPECT_LE(fs::file_size(ServiceDirectory() / ("full" + LogFileExtension(type))), kLimit);
    // The session still logs once there is room again.
    UseBus(driver::BusKind::kCan);
    OpenLogFile(log(), kHeader);
    CloseLogFile(log());
    EXPECT_TRUE(SentMessages().empty());
  }
}

}  // namespace
}  // namespace kvtest
