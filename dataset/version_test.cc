#include "dataset/version.h"

#include <gtest/gtest.h>

#include "testing/sandbox.h"

namespace vell {
namespace {

using namespace vell::testing;

TEST(Version, ParsesTheWholeStringOrNothing) {
  const struct {
    std::string text;
    int year;
    const char* letters;
    int major, minor;
  } cases[] = {
      {"2016a.1.0", 2016, "a", 1, 0},     {"2016a", 2016, "a", -1, -1},          {"2016ab.12.3", 2016, "ab", 12, 3},
      {"02016a.01.00", 2016, "a", 1, 0},  {"2016", -1, "", -1, -1},              {"2016A.1.0", -1, "", -1, -1},
      {"2016a.1.", -1, "", -1, -1},       {"2016a.1.0.0", -1, "", -1, -1},       {" 2016a", -1, "", -1, -1},
      {"", -1, "", -1, -1},               {std::string(1025, '7'), -1, "", -1, -1},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.text);
    vell_version v;
    v.letters = "stale";
    const auto messages = messages_of([&] { parse_version(v, c.text); });
    EXPECT_EQ(std::tie(v.year, v.letters, v.major, v.minor), std::tie(c.year, c.letters, c.major, c.minor));
    if (c.year >= 0) {
      expect_messages(messages, {});
    } else {
      expect_messages(messages, {"Cannot parse version string " + c.text + ", results.size() = 0: *",
                                 "Cannot parse version string " + c.text + ": *"});
    }
  }
}

TEST(Version, StrictOrder) {
  const std::pair<const char*, const char*> newer_older[] = {
      {"2016b", "2016a.9.9"}, {"2017a", "2016z.9.9"}, {"2016za.1.0", "2016z.1.0"}, {"2016a.1.0", "2016a"},
      {"2016a.1.1", "2016a.1.0"}, {"2016a.0", "2016a"}, {"0a", "unknown"}, {"2016b.0.0", "2016ab.9.9"},
  };
  for (const auto& pair : newer_older) {
    SCOPED_TRACE(std::string(pair.first) + " > " + pair.second);
    vell_version newer(pair.first), older;
    messages_of([&] { older = vell_version(pair.second); });
    EXPECT_TRUE(newer > older);
    EXPECT_FALSE(older > newer);
    EXPECT_FALSE(newer == older);
  }
  EXPECT_TRUE(vell_version("2016a.01.0") == vell_version("2016a.1.00"));
  EXPECT_FALSE(vell_version("2016a.01.0") > vell_version("2016a.1.00"));
  EXPECT_FALSE(vell_version() > vell_version());
}

}  // namespace
}  // namespace vell
