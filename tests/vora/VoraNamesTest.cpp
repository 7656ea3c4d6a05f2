// Object paths and the stored form of group and channel names.
#include <gtest/gtest.h>

#include "vora/VoraNames.h"

namespace vora {
namespace {

struct PathCase {
  const char* text;
  bool valid;
  ObjectPath::Kind kind;
  const char* group;
  const char* channel;
};

void PrintTo(const PathCase& c, std::ostream* os) { *os << c.text; }

const PathCase kPaths[] = {
    {"/'Bus'/'CAN1'", true, ObjectPath::Kind::kChannel, "Bus", "CAN1"},
    {"/''/''", true, ObjectPath::Kind::kChannel, "", ""},
    {"/'it's'/'ch'", true, ObjectPath::Kind::kChannel, "it's", "ch"},
    {"/'a/b'/'c/d'", true, ObjectPath::Kind::kChannel, "a/b", "c/d"},
    {"/'a'/'b'/'c'", true, ObjectPath::Kind::kChannel, "a", "b'/'c"},
    {"/'Group'", true, ObjectPath::Kind::kGroup, "Group", ""},
    {"/", true, ObjectPath::Kind::kRoot, "", ""},
    {"", false, {}, "", ""},
    {"/'", false, {}, "", ""},
    {"'a'/'b'", false, {}, "", ""},
    {"/'a'/'b", false, {}, "", ""},
    {"/a/b", false, {}, "", ""},
};

class ObjectPaths : public testing::TestWithParam<PathCase> {};

TEST_P(ObjectPaths, ParseIntoGroupAndChannel) {
  ObjectPath path;
  ASSERT_EQ(ParseObjectPath(GetParam().text, path), GetParam().valid);
  if (!GetParam().valid) return;
  EXPECT_EQ(path.kind, GetParam().kind);
  EXPECT_EQ(path.group, GetParam().group);
  EXPECT_EQ(path.channel, GetParam().channel);
}

INSTANTIATE_TEST_SUITE_P(Forms, ObjectPaths, testing::ValuesIn(kPaths));

TEST(StoredNames, EncodingIsHdf5SafeAndReversible) {
  const struct {
    const char* name;
    const char* stored;
  } cases[] = {{"CAN1", "CAN1"}, {"", "%"},        {"a/b", "a%2Fb"}, {"50%", "50%25"},
               {".", "%2E"},     {"..x", "%2E.x"}, {"it's", "it's"}, {"%2F", "%252F"}};
  for (const auto& c : cases) {
    EXPECT_EQ(EncodeStoredName(c.name), c.stored) << c.name;
    EXPECT_EQ(DecodeStoredName(c.stored), c.name) << c.stored;
  }
}

TEST(StoredNames, ForeignNamesDecodeAsTheyStand) {
  EXPECT_EQ(DecodeStoredName("100%"), "100%");
  EXPECT_EQ(DecodeStoredName("%zz"), "%zz");
  EXPECT_EQ(DecodeStoredName("%2"), "%2");
}

}  // namespace
}  // namespace vora
