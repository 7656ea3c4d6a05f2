// Standard directories by id: their texts, creation on a temporary drive, and failures.
#include <gtest/gtest.h>

#include "errors/RaiseSites.h"
#include "errors/cExceptionBase.h"
#include "paths/StandardPaths.h"
#include "tests/platform/TempDrive.h"

namespace {

using nENSPAN000::cExceptionBase;
using nENSPAN000::ErrorKind;

struct Expected {
  int32_t id;
  const char* path;
  const char* createdNative;  // null: nothing is created
};

void PrintTo(const Expected& e, std::ostream* out) { *out << "id " << e.id; }

class StandardPathTest : public ::testing::TestWithParam<Expected> {};

TEST_P(StandardPathTest, BuildsPathAndCreatesDataDirectories) {
  TempDrive drive;
  kxpath::cSysqWrapper wrapper;
  const Expected& e = GetParam();
  EXPECT_EQ(kxpath::getStandardPath(e.id, wrapper).getUtf8(), e.path);
  if (e.createdNative != nullptr) {
    EXPECT_TRUE(drive.isDirectory(e.createdNative));
  } else {
    EXPECT_FALSE(std::filesystem::exists(drive.native("QV-RT")));
  }
}

INSTANTIATE_TEST_SUITE_P(
    Ids, StandardPathTest,
    ::testing::Values(Expected{0, "C:\\QV-RT\\tarvix", nullptr},
                      Expected{1, "C:\\QV-RT\\tarvix\\dbCache", nullptr},
                      Expected{2, "C:\\QV-RT\\tarvix", "QV-RT/tarvix"},
                      Expected{3, "C:\\QV-RT\\tarvix\\log", "QV-RT/tarvix/log"},
                      Expected{4, "C:\\QV-RT\\tarvix\\firmware", nullptr},
                      Expected{5, "C:\\QV-RT\\tarvix", nullptr},
                      Expected{6, "C:\\QV-RT\\tarvix", nullptr},
                      Expected{7, "C:\\QV-RT\\SYSTEM\\errors\\English", nullptr},
                      Expected{8, "C:\\QV-RT\\SYSTEM\\errors\\German", nullptr},
                      Expected{9, "C:\\QV-RT\\SYSTEM\\errors\\French", nullptr},
                      Expected{10, "C:\\QV-RT\\SYSTEM\\errors\\Japanese", nullptr},
                      Expected{11, "C:\\QV-RT\\tarvix\\log", "QV-RT/tarvix/log"},
                      Expected{12, "C:\\QV-RT\\tarvix\\log", "QV-RT/tarvix/log"},
                      Expected{13, "c:\\temp\\tarvix", nullptr},
                      Expected{14, "C:\\QV-RT\\tarvix", nullptr},
                      Expected{15, "C:\\QV-RT\\tarvix", "QV-RT/tarvix"},
                      Expected{16, "C:\\QV-RT\\tarvix\\kelvane", "QV-RT/tarvix/kelvane"},
                      Expected{17, "C:\\QV-RT\\tarvix\\kelvane", "QV-RT/tarvix/kelvane"}));

TEST(StandardPathFailureTest, IdsAboveSeventeenAndNegativeRaiseLine161) {
  TempDrive drive;
  kxpath::cSysqWrapper wrapper;
  for (const int32_t id : {18, -1, INT32_MIN}) {
    try {
      kxpath::getStandardPath(id, wrapper);
      FAIL() << id;
    } catch (const cExceptionBase& e) {
      EXPECT_EQ(e.errorCode(), 1);
      EXPECT_EQ(e.locationWord(), nENSPAN000::packLocation(ErrorKind::UsageError, 22, 1, 161));
    }
  }
}

TEST(StandardPathFailureTest, ServiceDirectoryAlreadyPresentIsAccepted) {
  TempDrive drive;
  kxpath::cSysqWrapper wrapper;
  kxpath::getStandardPath(kxpath::kServiceConfigPathId, wrapper);
  EXPECT_EQ(kxpath::getStandardPath(kxpath::kServiceLogPathId, wrapper).getUtf8(),
            "C:\\QV-RT\\tarvix\\kelvane");
}

TEST(StandardPathFailureTest, FileInTheWayBecomesKindThreeCollision) {
  TempDrive drive;
  drive.writeFile("QV-RT");
  kxpath::cSysqWrapper wrapper;
  try {
    kxpath::getStandardPath(kxpath::kServiceLogPathId, wrapper);
    FAIL();
  } catch (const cExceptionBase& e) {
    EXPECT_EQ(e.errorCode(), qvapalerr_objectNameCollision);
    EXPECT_EQ(e.locationWord(), nENSPAN000::packLocation(ErrorKind::StatusCode, 22, 1, 59));
    EXPECT_STREQ(e.what(), "0xFFFF34D3");
  }
}

// A wrapper whose directory creation runs out of memory.
class OutOfMemoryWrapper final : public kxpath::cSysqWrapper {
 public:
  void createDirectories(const char*, bool*) override { throw std::bad_alloc(); }
};

TEST(StandardPathFailureTest, OutOfMemoryBecomesDriverCode) {
  TempDrive drive;
  OutOfMemoryWrapper wrapper;
  try {
    kxpath::getStandardPath(kxpath::kServiceConfigPathId, wrapper);
    FAIL();
  } catch (const cExceptionBase& e) {
    EXPECT_EQ(e.errorCode(), nENSPAN000::kDriverOutOfMemory);
  }
}

}  // namespace
