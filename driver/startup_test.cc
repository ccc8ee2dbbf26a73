// Whole starts of the real binary: the fallbacks and the exit status.
#include <algorithm>
#include <iterator>

#include <gtest/gtest.h>

#include "testing/sandbox.h"

namespace vell {
namespace {

using namespace vell::testing;

TEST(Startup, FallsBackToTheSystemPartition) {
  const std::string invalid = "Invalid current symlinks; resetting to system partition: *";
  const std::string unable = "Unable to locate data; resetting to system partition: *";
  const std::string giving_up = "Cannot repair time-zone links; giving up: *";
  const std::vector<std::string> failed_reset = {
      "remove: could not remove /var/db/timezone/zoneinfo: Is a directory", "Unlink of zoneinfo softlink failed: *",
      "create_symlink: from /var/db/timezone/zoneinfo to /usr/share/zoneinfo.default: File exists"};
  const struct {
    const char* name;
    std::vector<std::string> layout, messages;
    int status;
    const char* zoneinfo_after;
  } cases[] = {
      {"first start: no zoneinfo link", {}, {"Bad zoneinfo link : *", invalid}, 0, "-> /usr/share/zoneinfo.default"},
      {"an ICU directory survives the reset", {"/var/db/timezone/icutz/"},
       {"Bad zoneinfo link : *", invalid, "remove: could not remove /var/db/timezone/icutz: Is a directory",
        "unlink of ICU softlink failed: *"}, 0, "-> /usr/share/zoneinfo.default"},
      {"tz_latest is a regular file",
       {"/var/db/timezone/zoneinfo -> /var/db/timezone/tz/2016d.1.0/zoneinfo",
        "/var/db/timezone/icutz -> /var/db/timezone/tz/2016d.1.0/icutz", "/var/db/timezone/tz_latest = 2016e.1.0"},
       {"read_symlink: /var/db/timezone/tz_latest: Invalid argument", unable}, 0, "-> /usr/share/zoneinfo.default"},
      {"tz_latest outside the update directory",
       {"/var/db/timezone/zoneinfo -> /var/db/timezone/tz/2016d.1.0/zoneinfo", "/var/db/timezone/tz_latest -> ../x"},
       {"vell_dataset::create_components: bad path ../x: *", unable}, 0, "-> /usr/share/zoneinfo.default"},
      {"tz_latest is the update directory itself", {"/var/db/timezone/tz_latest -> /var/db/timezone/tz/"},
       {"Bad zoneinfo link : *", invalid, "vell_dataset::create_components: bad path /var/db/timezone/tz/: *", unable},
       0, "-> /usr/share/zoneinfo.default"},
      {"system version out of range", {"/usr/share/zoneinfo.default/+VERSION = 99999999999c"}, {unable, giving_up}, 1,
       "absent"},
      {"both resets fail", {"/var/db/timezone/zoneinfo/keep = x"},
       {"read_symlink: /var/db/timezone/zoneinfo: Invalid argument", invalid, failed_reset[0], failed_reset[1],
        failed_reset[2], unable, failed_reset[0], failed_reset[1], failed_reset[2], giving_up},
       1, "/"},
      {"local-time link cannot be repaired",
       {"/var/db/timezone/zoneinfo -> /usr/share/zoneinfo.default", "/var/db/timezone/localtime/keep = x"},
       {"read_symlink: /var/db/timezone/localtime: Invalid argument",
        "localtime link invalid; resetting to America/Los_Angeles: *",
        "create_symlink: from /var/db/timezone/localtime to /var/db/timezone/zoneinfo/America/Los_Angeles: File exists",
        giving_up},
       1, "-> /usr/share/zoneinfo.default"},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.name);
    sandbox box;
    lay_out_device();
    for (const std::string& entry : c.layout) sandbox::lay_out({entry});
    const run_result run = run_vell();
    EXPECT_EQ(run.status, c.status);
    expect_messages(run.messages, c.messages);
    EXPECT_EQ(show("/var/db/timezone/zoneinfo"), c.zoneinfo_after);
    EXPECT_EQ(show("/var/db/timezone/needs_cleanup"), "absent");  // cleared first, and no fallback sets it
    EXPECT_EQ(show("/var/db/icu"), "absent");
  }
}

// Hostile bytes in every file and link a start reads: each start ends
// normally, prints only vell's own messages and leaves usable links.
TEST(Startup, AnyBytesInFilesAndLinksEndNormally) {
  const std::string long_word = "2016c" + std::string(1019, 'x');  // 1024 bytes
  const std::string values[] = {"", long_word, long_word + "x", "2016c\n2017a", "\n\n", "2016\xc3\xa9",
                                std::string("20\0" "16c", 5), "\xff\xfe/..//"};
  const std::string places[] = {
      "/usr/share/zoneinfo.default/+VERSION = ", "/usr/share/icu/icutzformat.txt = ",
      "/var/db/timezone/tz/2016d.1.0/zoneinfo/+VERSION = ", "/var/db/timezone/zoneinfo -> ",
      "/var/db/timezone/zoneinfo -> " + tz + "2016d.1.0/", "/var/db/timezone/tz_latest -> " + tz,
      "/var/db/timezone/localtime -> ", "/var/db/timezone/localtime -> /usr/share/zoneinfo/"};
  const char* const own_messages[] = {
      "Cannot parse version string ", "Bad zoneinfo link ", "Invalid current symlinks; resetting to system partition",
      "Unable to locate data; resetting to system partition", "Symlink points at data incompatible",
      "New update not compatible or older version: ", "No ICU schema found for ", "localtime link invalid; resetting to ",
      "Correcting localtime link to ", "read_symlink: ", "vell_dataset::create_components: bad path "};
  for (const std::string& place : places) {
    for (const std::string& value : values) {
      const bool is_link = place.find(" -> ") != std::string::npos;
      if (is_link && (value.find('\0') != std::string::npos || (value.empty() && place.ends_with("-> ")))) continue;
      SCOPED_TRACE(place + value.substr(0, 40));
      sandbox box;
      lay_out_device();
      lay_out_links("2016d.1.0", "2016e.1.0");
      sandbox::lay_out({place + value});
      const run_result run = run_vell();
      EXPECT_EQ(run.status, 0);
      // A message quoting a newline goes on in a line of its own.
      for (const std::string& line : value.find('\n') == std::string::npos ? run.messages : std::vector<std::string>{}) {
        EXPECT_TRUE(std::any_of(std::begin(own_messages), std::end(own_messages),
                                [&](const char* own) { return line.starts_with(own); })) << line.substr(0, 200);
      }
      EXPECT_TRUE(show("/var/db/timezone/localtime").starts_with("-> /var/db/timezone/zoneinfo/"));
      const std::string zoneinfo = show("/var/db/timezone/zoneinfo");
      EXPECT_TRUE(zoneinfo == "-> /usr/share/zoneinfo.default" || zoneinfo == "-> " + tz + "2016d.1.0/zoneinfo" ||
                  zoneinfo == "-> " + tz + "2016e.1.0/zoneinfo")
          << zoneinfo;
    }
  }
}

// Only the first 1024 bytes are read: a million digits and a letter are cut
// to digits alone, which do not parse, and the system data's version is unknown.
TEST(Startup, MillionDigitSystemVersionEndsNormally) {
  sandbox box;
  lay_out_device();
  sandbox::lay_out({"/usr/share/zoneinfo.default/+VERSION = " + std::string(1000000, '7') + "a"});
  const run_result run = run_vell();
  EXPECT_EQ(run.status, 0);
  const std::string digits = "Cannot parse version string " + std::string(1024, '7') + ".1.0";
  expect_messages(run.messages, {digits + ", results.size() = 0: *", digits + ": *",
                                 "Bad zoneinfo link : *",
                                 "Invalid current symlinks; resetting to system partition: *",
                                 digits + ", results.size() = 0: *", digits + ": *",
                                 digits + ", results.size() = 0: *", digits + ": *"});
}

}  // namespace
}  // namespace vell
