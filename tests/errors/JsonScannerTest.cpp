// Which texts scan as one JSON object, and where its closing brace is.
#include <gtest/gtest.h>

#include <optional>
#include <ostream>
#include <string>

#include "errors/JsonScanner.h"

namespace {

struct Scan {
  std::string text;
  std::optional<size_t> end;
};

void PrintTo(const Scan& s, std::ostream* out) { *out << s.text; }

class JsonScannerTest : public ::testing::TestWithParam<Scan> {};

TEST_P(JsonScannerTest, FindsRootEndOrRejects) {
  EXPECT_EQ(qverr::findRootObjectEnd(GetParam().text), GetParam().end);
}

INSTANTIATE_TEST_SUITE_P(
    Texts, JsonScannerTest,
    ::testing::Values(Scan{"{}", 1}, Scan{" {}\r\n", 2}, Scan{R"({"a":"\u00e9\/\b"})", 17},
                      Scan{R"({"a":[true,false,null,0,-0.5,1E9]})", 33}, Scan{"", std::nullopt},
                      Scan{"[]", std::nullopt}, Scan{"{}x", std::nullopt}, Scan{"{", std::nullopt},
                      Scan{R"({"a":1,})", std::nullopt}, Scan{R"({"a":01x})", std::nullopt},
                      Scan{R"({"a":"\x"})", std::nullopt}, Scan{R"({"a":"\u12g4"})", std::nullopt},
                      Scan{"{\"a\":\"\t\"}", std::nullopt}, Scan{R"({"a":tru})", std::nullopt},
                      Scan{R"({"a":1.})", std::nullopt}, Scan{R"({a:1})", std::nullopt},
                      Scan{R"({"a":"open})", std::nullopt}));

TEST(JsonScannerDepthTest, DeepNestingIsRejectedNotOverflowed) {
  const std::string deep = "{\"a\":" + std::string(100000, '[') + std::string(100000, ']') + "}";
  EXPECT_FALSE(qverr::findRootObjectEnd(deep).has_value());
}

}  // namespace
