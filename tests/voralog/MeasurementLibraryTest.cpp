// Locating vora.dll from the environment and the registry file, loading it once, and unloading it.
#include "logging/MeasurementLibrary.h"

#include <dlfcn.h>
#include <stdlib.h>

#include <gtest/gtest.h>

#include <filesystem>
#include <ostream>
#include <functional>
#include <string>
#include <thread>
#include <vector>

#include "tests/support/ServiceFixture.h"

namespace {

using nKV_DLL300::kVorLibraryNotLoaded;
using nKV_DLL300::MeasurementLibrary;
using nKV_DLL300::vorException;
namespace fs = std::filesystem;

constexpr char kDefaultPath[] = "C:\\Program Files\\Quovera\\Shared\\vora\\vora.dll";
constexpr char kDefaultBelowDrive[] = "Program Files\\Quovera\\Shared\\vora\\vora.dll";
constexpr char kRegistryBelowDrive[] = "Windows\\registry.ini";
constexpr char kInstallerSection[] = "[HKEY_LOCAL_MACHINE\\SOFTWARE\\Quovera\\Common\\Installer]\n";

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

  // Copies `library` (the built vora.dll by default) to a place below the drive. The old file is
  // removed first, so the loader sees a new file and not a cached one.
  void Install(const std::string& belowDrive, const char* library = VORA_DLL_PATH) {
    const fs::path target = drive_.Native(belowDrive);
    fs::create_directories(target.parent_path());
    fs::remove(target);
    fs::copy_file(library, target);
  }
  void WriteRegistry(const std::string& text) { drive_.WriteFile(kRegistryBelowDrive, text); }

  kvtest::TemporaryDrive drive_;  // outlives library_, which may still hold a file of it
  MeasurementLibrary library_;
};

struct LocateCase {
  const char* what;
  const char* os;        // nullptr: unset
  const char* registry;  // nullptr: no registry file
  const char* path;
  int32_t platformCode;
};

void PrintTo(const LocateCase& c, std::ostream* os) { *os << c.what; }

class LocateTest : public MeasurementLibraryTest, public ::testing::WithParamInterface<LocateCase> {};

TEST_P(LocateTest, NamesTheLibraryFile) {
  const LocateCase& c = GetParam();
  if (c.os != nullptr) setenv("OS", c.os, 1);
  if (c.registry != nullptr) WriteRegistry(c.registry);
  library_.Locate();
  EXPECT_EQ(library_.path(), c.path);
  EXPECT_EQ(library_.platformCode(), c.platformCode);
}

const std::string kLongValue(300, 'x');
const std::string kLongRegistry = std::string(kInstallerSection) + "QVSHAREDDIR=C:\\" + kLongValue + "\n";

INSTANTIATE_TEST_SUITE_P(
    EnvironmentAndRegistry, LocateTest,
    ::testing::Values(
        LocateCase{"NoRegistryFile", nullptr, nullptr, kDefaultPath, 0},
        LocateCase{"RegistryValue", nullptr,
                   "[HKEY_LOCAL_MACHINE\\SOFTWARE\\Quovera\\Common\\Installer]\nQVSHAREDDIR=D:\\Shared\n",
                   "D:\\Shared\\vora\\vora.dll", 0},
        LocateCase{"KeyAndValueInOtherCase", nullptr,
                   "[hkey_local_machine\\software\\quovera\\common\\installer]\nqvshareddir=C:\\Tools\n",
                   "C:\\Tools\\vora\\vora.dll", 0},
        LocateCase{"EmptyValueStillGetsTheSubdirectory", nullptr,
                   "[HKEY_LOCAL_MACHINE\\SOFTWARE\\Quovera\\Common\\Installer]\nQVSHAREDDIR=\n",
                   "\\vora\\vora.dll", 0},
        LocateCase{"KeyWithoutValue", nullptr,
                   "[HKEY_LOCAL_MACHINE\\SOFTWARE\\Quovera\\Common\\Installer]\nOTHER=C:\\x\n", kDefaultPath, 0},
        LocateCase{"OtherKeyOnly", nullptr, "[HKEY_LOCAL_MACHINE\\SOFTWARE\\Other]\nQVSHAREDDIR=C:\\x\n",
                   kDefaultPath, 0},
        LocateCase{"ValueTooLongForThePathBuffer", nullptr, kLongRegistry.c_str(), kDefaultPath, 0},
        LocateCase{"DesktopOs", "Windows_NT", nullptr, kDefaultPath, 0},
        LocateCase{"RealTimeKernelInMixedCase", "PhArLaP", nullptr, "vora.dll", 1},
        LocateCase{"RealTimeKernelWithVersion", "PHARLAP ETS 2024",
                   "[HKEY_LOCAL_MACHINE\\SOFTWARE\\Quovera\\Common\\Installer]\nQVSHAREDDIR=D:\\Shared\n",
                   "vora.dll", 1},
        LocateCase{"ShorterThanTheKernelName", "PHARLA", nullptr, kDefaultPath, 0},
        LocateCase{"EmptyOs", "", nullptr, kDefaultPath, 0}),
    [](const ::testing::TestParamInfo<LocateCase>& info) { return std::string(info.param.what); });

TEST_F(MeasurementLibraryTest, PlatformIsDetectedOnceAndKept) {
  setenv("OS", "PHARLAP", 1);
  library_.Locate();
  unsetenv("OS");
  library_.Locate();
  EXPECT_EQ(library_.platformCode(), 1);
  EXPECT_EQ(library_.path(), "vora.dll");
}

struct InstallCase {
  const char* what;
  const char* registry;  // nullptr: no registry file
  const char* installedBelowDrive;
  bool loads;
};

void PrintTo(const InstallCase& c, std::ostream* os) { *os << c.what; }

class LoadTest : public MeasurementLibraryTest, public ::testing::WithParamInterface<InstallCase> {};

TEST_P(LoadTest, LoadsOnlyFromTheLocatedPlace) {
  const InstallCase& c = GetParam();
  if (c.registry != nullptr) WriteRegistry(c.registry);
  Install(c.installedBelowDrive);
  library_.Locate();
  EXPECT_EQ(ThrownCode([&] { library_.Load(); }), c.loads ? 0 : kVorLibraryNotLoaded);
  EXPECT_EQ(library_.loaded(), c.loads);
}

INSTANTIATE_TEST_SUITE_P(
    Installations, LoadTest,
    ::testing::Values(
        InstallCase{"DefaultDirectory", nullptr, kDefaultBelowDrive, true},
        InstallCase{"RegistryDirectory",
                    "[HKEY_LOCAL_MACHINE\\SOFTWARE\\Quovera\\Common\\Installer]\nQVSHAREDDIR=C:\\Tools\\Shared\n",
                    "Tools\\Shared\\vora\\vora.dll", true},
        InstallCase{"DefaultDirectoryIgnoredWhenTheRegistryNamesAnother",
                    "[HKEY_LOCAL_MACHINE\\SOFTWARE\\Quovera\\Common\\Installer]\nQVSHAREDDIR=C:\\Tools\\Shared\n",
                    kDefaultBelowDrive, false},
        InstallCase{"EmptyRegistryValueLooksInTheDriveRoot",
                    "[HKEY_LOCAL_MACHINE\\SOFTWARE\\Quovera\\Common\\Installer]\nQVSHAREDDIR=\n",
                    "vora\\vora.dll", true},
        InstallCase{"RegistryDirectoryOnAnotherDrive",
                    "[HKEY_LOCAL_MACHINE\\SOFTWARE\\Quovera\\Common\\Installer]\nQVSHAREDDIR=D:\\Shared\n",
                    "Shared\\vora\\vora.dll", false}),
    [](const ::testing::TestParamInfo<InstallCase>& info) { return std::string(info.param.what); });

// The test's environment puts the directory of the built library on the loader's search path.
TEST_F(MeasurementLibraryTest, RealTimeKernelLoadsTheBareNameThroughTheLoaderSearch) {
  setenv("OS", "PhArLaP", 1);
  library_.Locate();
  EXPECT_EQ(ThrownCode([&] { library_.Load(); }), 0);
  EXPECT_TRUE(library_.loaded());
}

TEST_F(MeasurementLibraryTest, MissingLibraryIsLoadedByALaterCallOnceInstalled) {
  library_.Locate();
  EXPECT_EQ(ThrownCode([&] { library_.Load(); }), kVorLibraryNotLoaded);
  EXPECT_EQ(ThrownCode([&] { library_.Load(); }), kVorLibraryNotLoaded);
  EXPECT_FALSE(library_.loaded());
  Install(kDefaultBelowDrive);
  EXPECT_EQ(ThrownCode([&] { library_.Load(); }), 0);
  EXPECT_TRUE(library_.loaded());
}

// A shared library without the Vor* entry points (the driver stand-in) is refused and unloaded.
TEST_F(MeasurementLibraryTest, LibraryWithoutTheEntryPointsIsRefusedThenReplaced) {
  Install(kDefaultBelowDrive, TARVIX_PATH);
  library_.Locate();
  EXPECT_EQ(ThrownCode([&] { library_.Load(); }), kVorLibraryNotLoaded);
  EXPECT_FALSE(library_.loaded());
  Install(kDefaultBelowDrive);
  EXPECT_EQ(ThrownCode([&] { library_.Load(); }), 0);
  EXPECT_TRUE(library_.loaded());
}

TEST_F(MeasurementLibraryTest, UnlocatedLibraryIsNotLoaded) {
  Install(kDefaultBelowDrive);
  EXPECT_EQ(ThrownCode([&] { library_.Load(); }), kVorLibraryNotLoaded);
}

TEST_F(MeasurementLibraryTest, EveryEntryPointRefusesWhileNotLoaded) {
  Install(kDefaultBelowDrive);
  library_.Locate();
  int32_t handle = -1;
  const std::vector<std::function<void()>> calls = {
      [&] { library_.FileOpenExA("C:\\x.vora", 2, 2, 4713, &handle); },
      [&] { library_.ObjCreateA("/'g'/'c'", 0, &handle); },
      [&] { library_.PropSetA("p", 3, &handle, 0, 0); },
      [&] { library_.ObjRawSet(5, 4, &handle, 0, 0); },
      [&] { library_.FileBufFlush(3, 0); },
      [&] { library_.FileClose(0); }};
  for (const auto& call : calls) EXPECT_EQ(ThrownCode(call), kVorLibraryNotLoaded);
  library_.Load();
  library_.Unload();
  EXPECT_FALSE(library_.loaded());
  for (const auto& call : calls) EXPECT_EQ(ThrownCode(call), kVorLibraryNotLoaded);
  EXPECT_EQ(handle, -1);
}

TEST_F(MeasurementLibraryTest, LoadedLibraryWritesAFileThroughItsEntryPoints) {
  Install(kDefaultBelowDrive);
  library_.Locate();
  library_.Load();
  int32_t file = -1;
  EXPECT_EQ(library_.FileOpenExA("C:\\run.vora", 2, 2, 4713, &file), 0);
  ASSERT_NE(file, -1);
  EXPECT_EQ(library_.FileClose(file), 0);
  EXPECT_TRUE(fs::exists(drive_.Native("run.vora")));
}

// Loading twice (even from several threads at once) opens the file once: after one unload the
// dynamic loader no longer holds it.
TEST_F(MeasurementLibraryTest, ConcurrentFirstLoadsLoadTheLibraryOnce) {
  Install(kDefaultBelowDrive);
  library_.Locate();
  constexpr int kThreads = 8;
  std::vector<std::thread> threads;
  std::vector<int32_t> codes(kThreads, -1);
  for (int i = 0; i < kThreads; ++i) {
    threads.emplace_back([&, i] { codes[i] = ThrownCode([&] { library_.Load(); }); });
  }
  for (std::thread& t : threads) t.join();
  EXPECT_EQ(codes, std::vector<int32_t>(kThreads, 0));
  library_.Load();
  EXPECT_EQ(ThrownCode([&] { library_.Unload(); }), 0);
  const std::string native = drive_.Native(kDefaultBelowDrive).string();
  void* still = dlopen(native.c_str(), RTLD_NOW | RTLD_NOLOAD);
  EXPECT_EQ(still, nullptr) << "the library was opened more than once";
  if (still != nullptr) dlclose(still);
}

}  // namespace
