// The code exception: location word bits, what() texts, and translation of foreign exceptions.
#include <gtest/gtest.h>

#include <new>
#include <stdexcept>

#include "errors/Exception.h"
#include "errors/RaiseSites.h"
#include "errors/cExceptionBase.h"

namespace {

using namespace nENSPAN000;

TEST(cExceptionBaseTest, LocationWordPacksFilledModuleFileKindLine) {
  const cExceptionBase e(ErrorKind::UsageError, kPathModule, kPathFile, kLineBadStandardPathId);
  EXPECT_EQ(e.locationWord(), 0x80000000u | 22u << 26 | 1u << 16 | 2u << 14 | 161u);
}

TEST(cExceptionBaseTest, LaterFillIsIgnored) {
  cExceptionBase e(ErrorKind::DriverStatus, kPathModule, kPathFile, 71, kDriverBufferMissing);
  const uint32_t before = e.locationWord();
  e.fillLocation(ErrorKind::StatusCode, 1, 1, 1);
  EXPECT_EQ(e.locationWord(), before);
}

TEST(cExceptionBaseTest, UsageErrorAlwaysCarriesCodeOne) {
  const cExceptionBase e(ErrorKind::UsageError, kPathModule, kPathFile, 426, -99);
  EXPECT_EQ(e.errorCode(), 1);
  EXPECT_EQ(e.getRecord().code, 1);
  EXPECT_EQ(e.record().location, e.getRecord().location);
}

TEST(cExceptionBaseTest, WhatPrintsCodeAsEightHexDigits) {
  const struct {
    int32_t code;
    const char* text;
  } rows[] = {{1, "0x00000001"},
              {-52013, "0xFFFF34D3"},
              {kDriverBufferTooSmall, "0xBFF63258"},
              {0, "0x00000000"}};
  for (const auto& row : rows) {
    const cExceptionBase e(ErrorKind::StatusCode, kPathModule, kPathFile, 59, row.code);
    EXPECT_STREQ(e.what(), row.text);
  }
}

template <typename Thrown>
cExceptionBase translated(Thrown thrown) {
  try {
    try {
      throw thrown;
    } catch (...) {
      translateException();
    }
  } catch (const cExceptionBase& e) {
    return e;
  }
  throw std::logic_error("not translated");
}

TEST(TranslateExceptionTest, StatusErrorBecomesKindThree) {
  qverr::Exception status;
  qverr::setCode(status.status(), -52006);
  const cExceptionBase e = translated(status);
  EXPECT_EQ(e.errorCode(), -52006);
  EXPECT_EQ(e.locationWord(), packLocation(ErrorKind::StatusCode, 22, 1, 59));
}

TEST(TranslateExceptionTest, OutOfMemoryBecomesDriverCode) {
  const cExceptionBase e = translated(std::bad_alloc());
  EXPECT_EQ(e.errorCode(), kDriverOutOfMemory);
  EXPECT_EQ(e.locationWord(), packLocation(ErrorKind::DriverStatus, 22, 1, 63));
}

TEST(TranslateExceptionTest, CodeExceptionPassesUnchanged) {
  const cExceptionBase original(ErrorKind::UsageError, 22, 1, 426);
  const cExceptionBase e = translated(original);
  EXPECT_EQ(e.locationWord(), original.locationWord());
}

TEST(TranslateExceptionTest, OtherExceptionsPassUnchanged) {
  EXPECT_THROW(
      {
        try {
          throw std::runtime_error("other");
        } catch (...) {
          translateException();
        }
      },
      std::runtime_error);
}

}  // namespace
