// End-to-end starts of the real binary in a sandbox.
#include <gtest/gtest.h>

#include "testing/sandbox.h"

namespace vell {
namespace {

using testing::expect_messages;
using testing::run_vell;
using testing::sandbox;
using testing::show;

// A device whose links name the system partition and whose local time is set.
void lay_out_device() {
  sandbox::lay_out({
      "/usr/share/zoneinfo.default/+VERSION = 2016a",
      "/usr/share/zoneinfo.default/America/Los_Angeles = TZif",
      "/usr/share/icu/icutzformat.txt = 44l",
      "/var/db/timezone/tz/",
      "/var/db/timezone/localtime -> /var/db/timezone/zoneinfo/America/Los_Angeles",
  });
}

struct fallback_case {
  const char* name;
  std::vector<std::string> layout;
  std::vector<std::string> messages;
  int status;
  const char* zoneinfo_after;
};

TEST(Startup, FallsBackToTheSystemPartition) {
  const char* const system_link = "-> /usr/share/zoneinfo.default";
  const std::vector<std::string> failed_reset = {
      "remove: could not remove /var/db/timezone/zoneinfo: Is a directory", "Unlink of zoneinfo softlink failed: *",
      "create_symlink: from /var/db/timezone/zoneinfo to /usr/share/zoneinfo.default: File exists"};
  auto then = [](std::vector<std::string> first, const std::vector<std::string>& more) {
    first.insert(first.end(), more.begin(), more.end());
    return first;
  };
  const fallback_case cases[] = {
      {"links on the system partition", {"/var/db/timezone/zoneinfo -> /usr/share/zoneinfo.default"}, {}, 0,
       system_link},
      {"first start: no zoneinfo link", {},
       {"Bad zoneinfo link : *", "Invalid current symlinks; resetting to system partition: *"}, 0, system_link},
      {"zoneinfo link of the old form", {"/var/db/timezone/zoneinfo -> /usr/share/zoneinfo"},
       {"Bad zoneinfo link /usr/share/zoneinfo: *", "Invalid current symlinks; resetting to system partition: *"}, 0,
       system_link},
      {"tz_latest is a regular file",
       {"/var/db/timezone/zoneinfo -> /var/db/timezone/tz/2016b.1.0/zoneinfo",
        "/var/db/timezone/icutz -> /var/db/timezone/tz/2016b.1.0/icutz", "/var/db/timezone/tz_latest = 2016b.1.0"},
       {"read_symlink: /var/db/timezone/tz_latest: Invalid argument",
        "Unable to locate data; resetting to system partition: *"},
       0, system_link},
      {"system version out of range", {"/usr/share/zoneinfo.default/+VERSION = 99999999999a"},
       {"Unable to locate data; resetting to system partition: *", "Cannot repair time-zone links; giving up: *"}, 1,
       "absent"},
      {"both resets fail", {"/var/db/timezone/zoneinfo/keep = x"},
       then(then({"read_symlink: /var/db/timezone/zoneinfo: Invalid argument",
                  "Invalid current symlinks; resetting to system partition: *"},
                 failed_reset),
            then({"Unable to locate data; resetting to system partition: *"},
                 then(failed_reset, {"Cannot repair time-zone links; giving up: *"}))),
       1, "/"},
      {"local-time link cannot be repaired",
       {"/var/db/timezone/zoneinfo -> /usr/share/zoneinfo.default", "/var/db/timezone/localtime/keep = x"},
       {"read_symlink: /var/db/timezone/localtime: Invalid argument",
        "localtime link invalid; resetting to America/Los_Angeles: *",
        "create_symlink: from /var/db/timezone/localtime to /var/db/timezone/zoneinfo/America/Los_Angeles: File exists",
        "Cannot repair time-zone links; giving up: *"},
       1, system_link},
  };
  for (const fallback_case& c : cases) {
    SCOPED_TRACE(c.name);
    sandbox box;
    lay_out_device();
    for (const std::string& entry : c.layout) sandbox::lay_out({entry});
    const auto run = run_vell();
    EXPECT_EQ(run.status, c.status);
    expect_messages(run.messages, c.messages);
    EXPECT_EQ(show("/var/db/timezone/zoneinfo"), c.zoneinfo_after);
    if (c.status == 0) {
      EXPECT_EQ(show("/var/db/timezone/icutz"), "absent");
    }
  }
}

TEST(Startup, ClearsMarkerAndLegacyIcuDirectoryEveryStart) {
  sandbox box;
  sandbox::lay_out({
      "/var/db/timezone/needs_cleanup = left by the last start",
      "/var/db/icu/",
      "/var/db/timezone/localtime -> /var/db/timezone/zoneinfo/Europe/Paris",
  });
  const auto run = run_vell();
  EXPECT_EQ(run.status, 0);
  EXPECT_EQ(show("/var/db/timezone/needs_cleanup"), "absent");
  EXPECT_EQ(show("/var/db/icu"), "absent");
}

}  // namespace
}  // namespace vell
