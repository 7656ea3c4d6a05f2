// The registry file: sections as keys, values with sizes, and everything missing.
#include <gtest/gtest.h>

#include "platform/Registry.h"
#include "tests/platform/TempDrive.h"

namespace {

using namespace platform;

constexpr const char* kInstallerKey = "SOFTWARE\\Quovera\\Common\\Installer";
constexpr const char* kRegistryText =
    "; installed components\r\n"
    "[HKEY_LOCAL_MACHINE\\SOFTWARE\\Other]\n"
    "QVSHAREDDIR=wrong\n"
    "\n"
    "[hkey_local_machine\\software\\quovera\\common\\installer]\r\n"
    "QVSHAREDDIR=C:\\Program Files\\Quovera\\Shared\r\n"
    "  Empty =\n"
    "Equals=a=b\n";

std::string query(HKEY key, const char* name, int32_t& result) {
  char buffer[128] = {};
  uint32_t size = sizeof buffer;
  uint32_t type = 0;
  result = RegQueryValueExA(key, name, nullptr, &type, reinterpret_cast<uint8_t*>(buffer), &size);
  return buffer;
}

TEST(RegistryTest, ReadsValuesOfMatchingSectionIgnoringCase) {
  TempDrive drive;
  drive.writeFile("Windows/registry.ini", kRegistryText);
  HKEY key = nullptr;
  ASSERT_EQ(RegOpenKeyExA(HKEY_LOCAL_MACHINE, kInstallerKey, 0, 0, &key), ERROR_SUCCESS);
  int32_t result = -1;
  EXPECT_EQ(query(key, "qvshareddir", result), "C:\\Program Files\\Quovera\\Shared");
  EXPECT_EQ(result, ERROR_SUCCESS);
  EXPECT_EQ(query(key, "Empty", result), "");
  EXPECT_EQ(query(key, "Equals", result), "a=b");
  query(key, "Missing", result);
  EXPECT_EQ(result, ERROR_FILE_NOT_FOUND);
  EXPECT_EQ(RegCloseKey(key), ERROR_SUCCESS);
}

TEST(RegistryTest, ShortBufferReportsNeededSize) {
  TempDrive drive;
  drive.writeFile("Windows/registry.ini", kRegistryText);
  HKEY key = nullptr;
  ASSERT_EQ(RegOpenKeyExA(HKEY_LOCAL_MACHINE, kInstallerKey, 0, 0, &key), ERROR_SUCCESS);
  uint8_t small[4];
  uint32_t size = sizeof small;
  EXPECT_EQ(RegQueryValueExA(key, "Equals", nullptr, nullptr, small, &size), ERROR_SUCCESS);
  size = 2;
  EXPECT_EQ(RegQueryValueExA(key, "QVSHAREDDIR", nullptr, nullptr, small, &size), ERROR_MORE_DATA);
  EXPECT_EQ(size, 32u);  // 31 characters and the NUL
  RegCloseKey(key);
}

TEST(RegistryTest, NoFileOrNoSectionIsMissingKey) {
  TempDrive drive;
  HKEY key = reinterpret_cast<HKEY>(1);
  EXPECT_EQ(RegOpenKeyExA(HKEY_LOCAL_MACHINE, kInstallerKey, 0, 0, &key), ERROR_FILE_NOT_FOUND);
  EXPECT_EQ(key, nullptr);
  drive.writeFile("Windows/registry.ini", kRegistryText);
  EXPECT_EQ(RegOpenKeyExA(HKEY_LOCAL_MACHINE, "SOFTWARE\\Nothing", 0, 0, &key),
            ERROR_FILE_NOT_FOUND);
}

}  // namespace
