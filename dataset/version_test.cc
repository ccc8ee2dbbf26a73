#include "dataset/version.h"

#include <gtest/gtest.h>

#include <stdexcept>

namespace vell {
namespace {

TEST(Version, ParsesTheWholeStringOrNothing) {
  const struct {
    std::string text;
    int year;
    std::string letters;
    int major, minor;
  } cases[] = {
      {"2016a.1.0", 2016, "a", 1, 0},     {"2016a", 2016, "a", -1, -1},
      {"2016ab.12.3", 2016, "ab", 12, 3}, {"02016a.01.00", 2016, "a", 1, 0},
      {"2016", -1, "", -1, -1},           {"2016A.1.0", -1, "", -1, -1},
      {"2016a.1.", -1, "", -1, -1},       {"2016a.1.0.0", -1, "", -1, -1},
      {" 2016a", -1, "", -1, -1},         {"", -1, "", -1, -1},
  };
  for (const auto& c : cases) {
    vell_version v;
    v.letters = "stale";
    parse_version(v, c.text);
    EXPECT_EQ(std::tie(v.year, v.letters, v.major, v.minor),
              std::tie(c.year, c.letters, c.major, c.minor))
        << c.text;
  }
  EXPECT_THROW(vell_version("2016a.2147483648"), std::out_of_range);
}

TEST(Version, StrictOrder) {
  const std::pair<const char*, const char*> newer_older[] = {
      {"2016b", "2016a.9.9"}, {"2017a", "2016z.9.9"},      {"2016za.1.0", "2016z.1.0"},
      {"2016a.1.0", "2016a"}, {"2016a.1.1", "2016a.1.0"},  {"2016a.0", "2016a"},
      {"0a", "unknown"},      {"2016b.0.0", "2016ab.9.9"},
  };
  for (const auto& [newer, older] : newer_older) {
    EXPECT_TRUE(vell_version(newer) > vell_version(older)) << newer << " > " << older;
    EXPECT_FALSE(vell_version(older) > vell_version(newer)) << older << " > " << newer;
  }
  EXPECT_TRUE(vell_version("2016a.01.0") == vell_version("2016a.1.00"));
  EXPECT_FALSE(vell_version("2016a.01.0") > vell_version("2016a.1.00"));
}

}  // namespace
}  // namespace vell
