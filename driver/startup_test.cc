// End-to-end starts of the real binary in a sandbox.
#include <gtest/gtest.h>

#include "testing/sandbox.h"

namespace vell {
namespace {

using testing::expect_messages;
using testing::run_vell;
using testing::sandbox;
using testing::show;

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

struct giving_up_case {
  const char* name;
  std::initializer_list<std::string> layout;
  std::vector<std::string> messages;
};

TEST(Startup, GivesUpWhenTheLocalTimeLinkCannotBeRepaired) {
  const char* const create = "create_symlink: from /var/db/timezone/localtime to "
                             "/var/db/timezone/zoneinfo/America/Los_Angeles: ";
  const giving_up_case cases[] = {
      {"non-empty directory at the link", {"/var/db/timezone/localtime/keep = x"},
       {"read_symlink: /var/db/timezone/localtime: Invalid argument", "localtime link invalid; resetting to America/Los_Angeles: *",
        std::string(create) + "File exists", "Cannot repair time-zone links; giving up: *"}},
      {"no data directory", {"/var/db/"},
       {"localtime link invalid; resetting to America/Los_Angeles: *",
        std::string(create) + "No such file or directory", "Cannot repair time-zone links; giving up: *"}},
  };
  for (const giving_up_case& c : cases) {
    SCOPED_TRACE(c.name);
    sandbox box;
    sandbox::lay_out(c.layout);
    const auto run = run_vell();
    EXPECT_EQ(run.status, 1);
    expect_messages(run.messages, c.messages);
  }
}

}  // namespace
}  // namespace vell
