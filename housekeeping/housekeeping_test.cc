// The clean-up marker and the legacy ICU link.
#include <sys/stat.h>

#include <gtest/gtest.h>

#include "housekeeping/cleanup_marker.h"
#include "housekeeping/legacy_icu.h"
#include "testing/sandbox.h"

namespace vell {
namespace {

using namespace vell::testing;

TEST(LegacyIcuLink, Migration) {
  const std::string target = "/var/db/timezone/tz/2016b.1.0/icutz", legacy = "/var/db/icutz -> " + target;
  const std::string present = "/var/db/timezone/icutz -> /usr/share/icu";
  const std::string read_failed = "read_symlink: /var/db/icutz: Invalid argument";
  const std::string not_migrated = "Could not migrate /var/db/icutz to /var/db/timezone/icutz: *";
  const std::vector<std::string> not_removed = {"remove: could not remove /var/db/icutz: Is a directory",
                                                "Could not remove /var/db/icutz: *"};
  const struct {
    const char* name;
    std::vector<std::string> layout, messages;
    std::string legacy_after, present_after;
  } cases[] = {
      {"moved", {legacy}, {}, "absent", "-> " + target},
      {"present link kept", {legacy, present}, {}, "absent", "-> /usr/share/icu"},
      {"dangling legacy link counts as absent", {"/var/db/icutz -> /nowhere"}, {}, "-> /nowhere", "absent"},
      {"dangling present link in the way", {legacy, "/var/db/timezone/icutz -> /nowhere"},
       {"create_symlink: from /var/db/timezone/icutz to " + target + ": File exists", not_migrated}, "absent",
       "-> /nowhere"},
      {"legacy regular file", {"/var/db/icutz = x"}, {read_failed, not_migrated}, "absent", "absent"},
      {"legacy directory", {"/var/db/icutz/"}, {read_failed, not_migrated, not_removed[0], not_removed[1]}, "/", "absent"},
      {"legacy directory, present link", {"/var/db/icutz/", present}, not_removed, "/", "-> /usr/share/icu"},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.name);
    sandbox box;
    sandbox::lay_out({target + "/", "/usr/share/icu/"});
    for (const std::string& entry : c.layout) sandbox::lay_out({entry});
    expect_messages(messages_of(migrate_legacy_icu_link), c.messages);
    EXPECT_EQ(show("/var/db/icutz"), c.legacy_after);
    EXPECT_EQ(show("/var/db/timezone/icutz"), c.present_after);
  }
}

TEST(CleanupMarker, CreatedEmptyKeptAsItIsReportedOnce) {
  sandbox box;
  expect_messages(messages_of(mark_needs_cleanup),
                  {"Cannot touch file /var/db/timezone/needs_cleanup: No such file or directory"});
  sandbox::lay_out({"/var/db/timezone/"});
  const mode_t mask = umask(022);
  expect_messages(messages_of(mark_needs_cleanup), {});
  umask(mask);
  struct stat status;
  ASSERT_EQ(stat("/var/db/timezone/needs_cleanup", &status), 0);
  EXPECT_EQ(status.st_mode & 07777, 0644u);
  sandbox::lay_out({"/var/db/timezone/needs_cleanup = kept"});
  expect_messages(messages_of(mark_needs_cleanup), {});
  EXPECT_EQ(show("/var/db/timezone/needs_cleanup"), "= kept");
}

}  // namespace
}  // namespace vell
