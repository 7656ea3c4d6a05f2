// Locating vora.dll from the environment and the registry file, loading it once, and unloading it.
#include <dlfcn.h>
#include <gtest/gtest.h>
#include <stdlib.h>

#include <filesystem>
#include <functional>
#include <ostream>
#include <string>
#include <thread>
#include <vector>

#include "logging/MeasurementLibrary.h"
#include "tests/voralog/VoraSupport.h"

namespace {

using nKV_DLL300::kVorLibraryNotLoaded;
using nKV_DLL300::MeasurementLibrary;
using nKV_DLL300::vorException;
namespace fs = std::filesystem;

constexpr char kDefaultPath[] = "C:\\Program Files\\Quovera\\Shared\\vora\\vora.dll";
constexpr char kRegistryBelowDrive[] = "Windows\\registry.ini";
#define INSTALLER "[HKEY_LOCAL_MACHINE\\SOFTWARE\\Quovera\\Common\\Installer]\n"

// The code of the vorException that `action` throws, or 0 when it throws none.
template <typename Action>
int32_t ThrownCode(Action&& action) {
  try {
    action();
  } catch (const vorException& e) {
    return e.code;
  }
  return 0;
}

class MeasurementLibraryTest : public ::testing::Test {
 protected:
  void SetUp() override { unsetenv("OS"); }

  void Install(const std::string& belowDrive = kvtest::kVoraBelowDrive,
               const char* library = VORA_DLL_PATH) {
    kvtest::InstallLibrary(drive_, belowDrive, library);
  }
  void WriteRegistry(const std::string& text) { drive_.WriteFile(kRegistryBelowDrive, text); }

  kvtest::TemporaryDrive drive_;  // outlives library_, which may still hold a file of it
  MeasurementLibrary library_;
};

struct LocateCase {
  const char* what;
  const char* os;         // nullptr: unset
  const char* registry;   // nullptr: no registry file
  const char* installed;  // below the drive; nullptr: nowhere but the test's loader search path
  const char* path;
  int32_t platformCode;
  bool loads;
};

void PrintTo(const LocateCase& c, std::ostream* os) { *os << c.what; }

class LocateTest : public MeasurementLibraryTest,
                   public ::testing::WithParamInterface<LocateCase> {};

// The library is named from the environment and the registry file, and loads only from there.
TEST_P(LocateTest, NamesTheLibraryFileAndLoadsOnlyFromThere) {
  const LocateCase& c = GetParam();
  if (c.os != nullptr) setenv("OS", c.os, 1);
  if (c.registry != nullptr) WriteRegistry(c.registry);
  if (c.installed != nullptr) Install(c.installed);
  library_.locate();
  EXPECT_EQ(library_.path(), c.path);
  EXPECT_EQ(library_.platformCode(), c.platformCode);
  EXPECT_EQ(ThrownCode([&] { library_.load(); }), c.loads ? 0 : kVorLibraryNotLoaded);
  EXPECT_EQ(library_.loaded(), c.loads);
}

const std::string kLongRegistry =
    std::string(INSTALLER) + "QVSHAREDDIR=C:\\" + std::string(300, 'x') + "\n";
constexpr char kTools[] = INSTALLER "QVSHAREDDIR=C:\\Tools\\Shared\n";
constexpr char kToolsPath[] = "C:\\Tools\\Shared\\vora\\vora.dll";
constexpr char kOtherDrive[] = INSTALLER "QVSHAREDDIR=D:\\Shared\n";
constexpr char kEmptyValue[] = INSTALLER "QVSHAREDDIR=\n";
const char* const kDefault = kvtest::kVoraBelowDrive;

// The real-time kernel's bare name is found through the loader search path of the test's
// environment.
INSTANTIATE_TEST_SUITE_P(
    EnvironmentAndRegistry, LocateTest,
    ::testing::Values(
        LocateCase{"DefaultDirectory", nullptr, nullptr, kDefault, kDefaultPath, 0, true},
        LocateCase{"NoRegistryFileNothingInstalled", nullptr, nullptr, nullptr, kDefaultPath, 0,
                   false},
        LocateCase{"RegistryDirectory", nullptr, kTools, "Tools\\Shared\\vora\\vora.dll",
                   kToolsPath, 0, true},
        LocateCase{"DefaultDirectoryIgnoredWhenTheRegistryNamesAnother", nullptr, kTools, kDefault,
                   kToolsPath, 0, false},
        LocateCase{"RegistryDirectoryOnAnotherDrive", nullptr, kOtherDrive,
                   "Shared\\vora\\vora.dll", "D:\\Shared\\vora\\vora.dll", 0, false},
        LocateCase{
            "KeyAndValueInOtherCase", nullptr,
            "[hkey_local_machine\\software\\quovera\\common\\installer]\nqvshareddir=C:\\Tools\n",
            nullptr, "C:\\Tools\\vora\\vora.dll", 0, false},
        LocateCase{"EmptyValueLooksInTheDriveRoot", nullptr, kEmptyValue, "vora\\vora.dll",
                   "\\vora\\vora.dll", 0, true},
        LocateCase{"KeyWithoutValue", nullptr, INSTALLER "OTHER=C:\\x\n", kDefault, kDefaultPath, 0,
                   true},
        LocateCase{"OtherKeyOnly", nullptr,
                   "[HKEY_LOCAL_MACHINE\\SOFTWARE\\Other]\nQVSHAREDDIR=C:\\x\n", nullptr,
                   kDefaultPath, 0, false},
        LocateCase{"ValueTooLongForThePathBuffer", nullptr, kLongRegistry.c_str(), nullptr,
                   kDefaultPath, 0, false},
        LocateCase{"DesktopOs", "Windows_NT", nullptr, nullptr, kDefaultPath, 0, false},
        LocateCase{"RealTimeKernelInMixedCase", "PhArLaP", nullptr, nullptr, "vora.dll", 1, true},
        LocateCase{"RealTimeKernelWithVersion", "PHARLAP ETS 2024", kOtherDrive, nullptr,
                   "vora.dll", 1, true},
        LocateCase{"ShorterThanTheKernelName", "PHARLA", nullptr, nullptr, kDefaultPath, 0, false},
        LocateCase{"EmptyOs", "", nullptr, nullptr, kDefaultPath, 0, false}),
    [](const ::testing::TestParamInfo<LocateCase>& info) { return std::string(info.param.what); });

TEST_F(MeasurementLibraryTest, PlatformIsDetectedOnceAndKept) {
  setenv("OS", "PHARLAP", 1);
  library_.locate();
  unsetenv("OS");
  library_.locate();
  EXPECT_EQ(library_.platformCode(), 1);
  EXPECT_EQ(library_.path(), "vora.dll");
}

// A library without the Vor* entry points (the driver stand-in) is refused on every call until the
// real one is installed (a missing one is tested over TCP).
TEST_F(MeasurementLibraryTest, RefusedLibraryIsLoadedByALaterCallOnceInstalled) {
  Install(kvtest::kVoraBelowDrive, TARVIX_PATH);
  library_.locate();
  EXPECT_EQ(ThrownCode([&] { library_.load(); }), kVorLibraryNotLoaded);
  EXPECT_EQ(ThrownCode([&] { library_.load(); }), kVorLibraryNotLoaded);
  EXPECT_FALSE(library_.loaded());
  Install();
  EXPECT_EQ(ThrownCode([&] { library_.load(); }), 0);
  EXPECT_TRUE(library_.loaded());
}

// Unlocated, not loaded or unloaded, every entry point refuses; loaded, they write a file.
TEST_F(MeasurementLibraryTest, EntryPointsWorkOnlyWhileLoaded) {
  Install();
  EXPECT_EQ(ThrownCode([&] { library_.load(); }), kVorLibraryNotLoaded);
  library_.locate();
  int32_t handle = -1;
  const std::vector<std::function<void()>> calls = {
      [&] { library_.FileOpenExA("C:\\x.vora", 2, 2, 4713, &handle); },
      [&] { library_.ObjCreateA("/'g'/'c'", 0, &handle); },
      [&] { library_.PropSetA("p", 3, &handle, 0, 0); },
      [&] { library_.ObjRawSet(5, 4, &handle, 0, 0); },
      [&] { library_.FileBufFlush(3, 0); },
      [&] { library_.FileClose(0); }};
  for (const auto& call : calls) EXPECT_EQ(ThrownCode(call), kVorLibraryNotLoaded);
  EXPECT_EQ(handle, -1);
  library_.load();
  int32_t file = -1;
  EXPECT_EQ(library_.FileOpenExA("C:\\run.vora", 2, 2, 4713, &file), 0);
  ASSERT_NE(file, -1);
  EXPECT_EQ(library_.FileClose(file), 0);
  EXPECT_TRUE(fs::exists(drive_.Native("run.vora")));
  library_.unload();
  EXPECT_FALSE(library_.loaded());
  handle = -1;
  for (const auto& call : calls) EXPECT_EQ(ThrownCode(call), kVorLibraryNotLoaded);
  EXPECT_EQ(handle, -1);
}

// Loading twice (even from several threads at once) opens the file once: after one unload the
// dynamic loader no longer holds it.
TEST_F(MeasurementLibraryTest, ConcurrentFirstLoadsLoadTheLibraryOnce) {
  Install();
  library_.locate();
  constexpr int kThreads = 8;
  std::vector<std::thread> threads;
  std::vector<int32_t> codes(kThreads, -1);
  for (int i = 0; i < kThreads; ++i) {
    threads.emplace_back([&, i] { codes[i] = ThrownCode([&] { library_.load(); }); });
  }
  for (std::thread& t : threads) t.join();
  EXPECT_EQ(codes, std::vector<int32_t>(kThreads, 0));
  library_.load();
  EXPECT_EQ(ThrownCode([&] { library_.unload(); }), 0);
  const std::string native = drive_.Native(kvtest::kVoraBelowDrive).string();
  void* still = dlopen(native.c_str(), RTLD_NOW | RTLD_NOLOAD);
  EXPECT_EQ(still, nullptr) << "the library was opened more than once";
  if (still != nullptr) dlclose(still);
}

}  // namespace
