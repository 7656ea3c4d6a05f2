// Loading a library from the drive or by bare name, resolving a symbol, unloading.
#include <gtest/gtest.h>

#include "platform/Environment.h"
#include "platform/Library.h"
#include "tests/platform/TempDrive.h"

namespace {

using namespace platform;

TEST(LibraryTest, LoadsFromDrivePathAndResolvesSymbol) {
  TempDrive drive;
  std::filesystem::create_directories(drive.native("Program Files/vora"));
  std::filesystem::copy_file(KV_TEST_PLUGIN, drive.native("Program Files/vora/vora.dll"));
  HMODULE library = LoadLibraryA("c:\\Program Files\\vora\\vora.dll");
  ASSERT_NE(library, nullptr);
  auto answer = reinterpret_cast<int (*)()>(GetProcAddress(library, "kv_test_plugin_answer"));
  ASSERT_NE(answer, nullptr);
  EXPECT_EQ(answer(), 42);
  EXPECT_EQ(GetProcAddress(library, "no_such_symbol"), nullptr);
  EXPECT_TRUE(FreeLibrary(library));
}

TEST(LibraryTest, BareNameUsesLoaderSearch) {
  HMODULE library = LoadLibraryA("libc.so.6");
  ASSERT_NE(library, nullptr);
  EXPECT_NE(GetProcAddress(library, "strlen"), nullptr);
  FreeLibrary(library);
}

TEST(LibraryTest, MissingOrEscapingPathsFail) {
  TempDrive drive;
  EXPECT_EQ(LoadLibraryA("C:\\missing\\vora.dll"), nullptr);
  EXPECT_EQ(LoadLibraryA("C:\\..\\..\\lib\\libc.so.6"), nullptr);
  EXPECT_EQ(LoadLibraryA(""), nullptr);
  EXPECT_EQ(LoadLibraryA(nullptr), nullptr);
  EXPECT_FALSE(FreeLibrary(nullptr));
}

TEST(EnvironmentTest, ReadsSetAndMissingVariables) {
  setenv("KV_TEST_VARIABLE", "Windows_NT", 1);
  EXPECT_EQ(GetEnvironmentVariable("KV_TEST_VARIABLE"), "Windows_NT");
  unsetenv("KV_TEST_VARIABLE");
  EXPECT_FALSE(GetEnvironmentVariable("KV_TEST_VARIABLE").has_value());
}

}  // namespace
