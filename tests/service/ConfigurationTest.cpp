// Choosing the port from the configuration file's contents.
#include <gtest/gtest.h>

#include "service/Configuration.h"

namespace nKV_DLL300 {
namespace {

struct ConfigRow {
  const char* what;
  std::optional<std::string> contents;
  uint16_t port;
  bool complains;
};

TEST(ConfigurationTest, FirstWordGivesThePortOrTheDefault) {
  const ConfigRow rows[] = {
      {"no file", std::nullopt, 13456, false},
      {"PORT=2000", "PORT=2000\n", 2000, false},
      {"more words", "x=2000 PORT=3000 and more\n", 2000, false},
      {"empty", "", 13456, false},
      {"only blanks", " \n\t\n", 13456, false},
      {"not a number", "PORT=abc", 0, false},
      {"low 16 bits", "PORT=70000", 4464, false},
      {"leading blanks", "\n   PORT=2001", 2001, false},
      {"value with =", "a=b=2002", 0, false},
      {"no =", "2000", 13456, true},
      {"too long", "PORT=2000000000000000", 13456, true},
      {"19 characters", "PORT=00000000002003", 2003, false},
  };
  for (const ConfigRow& row : rows) {
    PortChoice choice = ChoosePortText(row.contents);
    EXPECT_EQ(PortFromText(choice.portText), row.port) << row.what;
    EXPECT_EQ(!choice.problem.empty(), row.complains) << row.what;
  }
}

}  // namespace
}  // namespace nKV_DLL300
