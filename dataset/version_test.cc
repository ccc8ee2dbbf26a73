#include "dataset/version.h"

#include <stdexcept>

#include <gtest/gtest.h>

#include "testing/sandbox.h"

namespace vell {
namespace {

using testing::expect_messages;
using testing::messages_of;

struct parse_case {
  std::string text;
  int year;
  const char* letters;
  int major, minor;
};

TEST(Version, ParsesTheWholeString) {
  const parse_case cases[] = {
      {"2016a.1.0", 2016, "a", 1, 0},      {"2016a", 2016, "a", -1, -1},
      {"2016a.7", 2016, "a", 7, -1},       {"2016ab.12.3", 2016, "ab", 12, 3},
      {"02016a.01.00", 2016, "a", 1, 0},   {"2147483647z.2147483647.0", 2147483647, "z", 2147483647, 0},
  };
  for (const parse_case& c : cases) {
    SCOPED_TRACE(c.text);
    vell_version v;
    expect_messages(messages_of([&] { v = vell_version(c.text); }), {});
    EXPECT_EQ(v.year, c.year);
    EXPECT_EQ(v.letters, c.letters);
    EXPECT_EQ(v.major, c.major);
    EXPECT_EQ(v.minor, c.minor);
  }
}

TEST(Version, OtherFormsGiveTheUnknownVersionWithTwoMessages) {
  const std::string cases[] = {
      "2016", "2016A.1.0", "2016a.", "2016a.1.", "2016a.1.0.0", "2016a-1", " 2016a", "2016a/",
      "", ".1.0", "2016a\t", "2016\xc3\xa9.1.0", "a2016.1.0", std::string(1025, '7'),
  };
  for (const std::string& text : cases) {
    SCOPED_TRACE(text);
    vell_version v;
    v.year = 5;
    v.letters = "x";
    const auto messages = messages_of([&] { parse_version(v, text); });
    expect_messages(messages, {"Cannot parse version string " + text + ", results.size() = 0: *",
                               "Cannot parse version string " + text + ": *"});
    EXPECT_TRUE(v == vell_version());
  }
}

TEST(Version, NumbersTooLargeLeaveTheParser) {
  vell_version v;
  EXPECT_THROW(parse_version(v, "99999999999a.1.0"), std::out_of_range);
  EXPECT_TRUE(v == vell_version());
  EXPECT_THROW(parse_version(v, "2016a.1.2147483648"), std::out_of_range);
  EXPECT_EQ(v.year, 2016);  // fields converted before the failure stay written
  EXPECT_EQ(v.major, 1);
  EXPECT_EQ(v.minor, -1);
}

vell_version V(const char* text) { return vell_version(text); }

TEST(Version, StrictOrder) {
  const struct {
    vell_version newer, older;
  } cases[] = {
      {V("2016b"), V("2016a.9.9")},   {V("2017a"), V("2016z.9.9")},     {V("2016za.1.0"), V("2016z.1.0")},
      {V("2016a.1.0"), V("2016a")},   {V("2016a.1.1"), V("2016a.1.0")}, {V("2016a.0"), V("2016a")},
      {V("0a"), vell_version()},      {V("2016b.0.0"), V("2016ab.9.9")},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.newer.letters + " over " + c.older.letters);
    EXPECT_TRUE(c.newer > c.older);
    EXPECT_FALSE(c.older > c.newer);
    EXPECT_FALSE(c.newer == c.older);
  }
  EXPECT_TRUE(vell_version("2016a.01.0") == vell_version("2016a.1.00"));
  EXPECT_FALSE(vell_version("2016a.01.0") > vell_version("2016a.1.00"));
  EXPECT_TRUE(vell_version() == vell_version());
  EXPECT_FALSE(vell_version() > vell_version());
}

}  // namespace
}  // namespace vell
