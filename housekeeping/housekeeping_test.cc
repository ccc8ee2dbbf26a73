// Directory protection, the clean-up marker and the legacy ICU link.
#include <sys/stat.h>

#include <gtest/gtest.h>

#include "housekeeping/cleanup_marker.h"
#include "housekeeping/legacy_icu.h"
#include "housekeeping/protection.h"
#include "testing/sandbox.h"

namespace vell {
namespace {

using testing::expect_messages;
using testing::messages_of;
using testing::sandbox;
using testing::show;

struct legacy_case {
  const char* name;
  std::vector<std::string> layout;
  std::vector<std::string> messages;
  const char* legacy_after;
  const char* current_after;
};

TEST(LegacyIcuLink, Migration) {
  const std::string target = "/var/db/timezone/tz/2016b.1.0/icutz";
  const std::string legacy = "/var/db/icutz -> " + target;
  const std::string read_failed = "read_symlink: /var/db/icutz: Invalid argument";
  const std::string not_migrated = "Could not migrate /var/db/icutz to /var/db/timezone/icutz: *";
  const legacy_case cases[] = {
      {"moved to its present place", {legacy}, {}, "absent", "-> /var/db/timezone/tz/2016b.1.0/icutz"},
      {"present link kept, legacy removed", {legacy, "/var/db/timezone/icutz -> /usr/share/icu"}, {}, "absent",
       "-> /usr/share/icu"},
      {"dangling legacy link counts as absent", {"/var/db/icutz -> /nowhere"}, {}, "-> /nowhere", "absent"},
      {"dangling present link is in the way", {legacy, "/var/db/timezone/icutz -> /nowhere"},
       {"create_symlink: from /var/db/timezone/icutz to " + target + ": File exists", not_migrated}, "absent",
       "-> /nowhere"},
      {"legacy regular file", {"/var/db/icutz = x"}, {read_failed, not_migrated}, "absent", "absent"},
      {"legacy directory", {"/var/db/icutz/"},
       {read_failed, not_migrated, "remove: could not remove /var/db/icutz: Is a directory",
        "Could not remove /var/db/icutz: *"},
       "/", "absent"},
      {"legacy directory beside a present link", {"/var/db/icutz/", "/var/db/timezone/icutz -> /usr/share/icu"},
       {"remove: could not remove /var/db/icutz: Is a directory", "Could not remove /var/db/icutz: *"}, "/",
       "-> /usr/share/icu"},
  };
  for (const legacy_case& c : cases) {
    SCOPED_TRACE(c.name);
    sandbox box;
    sandbox::lay_out({target + "/", "/usr/share/icu/"});
    for (const std::string& entry : c.layout) sandbox::lay_out({entry});
    expect_messages(messages_of(migrate_legacy_icu_link), c.messages);
    EXPECT_EQ(show("/var/db/icutz"), c.legacy_after);
    EXPECT_EQ(show("/var/db/timezone/icutz"), c.current_after);
  }
}

TEST(CleanupMarker, CreatedOnceAndNeverTruncated) {
  sandbox box;
  sandbox::lay_out({"/var/db/timezone/"});
  const mode_t mask = umask(022);
  expect_messages(messages_of(mark_needs_cleanup), {});
  umask(mask);
  struct stat status;
  ASSERT_EQ(stat("/var/db/timezone/needs_cleanup", &status), 0);
  EXPECT_EQ(status.st_mode & 07777, 0644u);
  EXPECT_EQ(show("/var/db/timezone/needs_cleanup"), "= ");

  sandbox::lay_out({"/var/db/timezone/needs_cleanup = kept"});
  expect_messages(messages_of(mark_needs_cleanup), {});
  EXPECT_EQ(show("/var/db/timezone/needs_cleanup"), "= kept");
}

TEST(CleanupMarker, FailureIsReportedOnce) {
  sandbox box;
  expect_messages(messages_of(mark_needs_cleanup),
                  {"Cannot touch file /var/db/timezone/needs_cleanup: No such file or directory"});
}

TEST(Protection, MissingDirectoriesArePassedOver) {
  sandbox box;
  const std::string before = testing::snapshot();
  expect_messages(messages_of(protect_data_directories), {});
  EXPECT_EQ(testing::snapshot(), before);
}

}  // namespace
}  // namespace vell
