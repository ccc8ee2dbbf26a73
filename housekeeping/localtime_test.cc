#include "housekeeping/localtime.h"

#include <errno.h>

#include <gtest/gtest.h>

#include "testing/sandbox.h"

namespace vell {
namespace {

using testing::expect_messages;
using testing::messages_of;
using testing::sandbox;
using testing::show;

const char reset[] = "localtime link invalid; resetting to America/Los_Angeles: *";
const char default_link[] = "-> /var/db/timezone/zoneinfo/America/Los_Angeles";

void lay_out_zoneinfo() {
  sandbox::lay_out({
      "/usr/share/zoneinfo.default/Europe/Paris = TZif",
      "/usr/share/zoneinfo.default/America/Los_Angeles = TZif",
      "/var/db/timezone/zoneinfo -> /usr/share/zoneinfo.default",
  });
}

struct localtime_case {
  const char* name;
  std::string at_start;  // a lay_out entry for the link's path, or "" for none
  std::string after;
  std::vector<std::string> messages;
};

TEST(LocalTime, OutcomeTable) {
  const localtime_case cases[] = {
      {"new form kept though its file is missing",
       "/var/db/timezone/localtime -> /var/db/timezone/zoneinfo/Nowhere",
       "-> /var/db/timezone/zoneinfo/Nowhere", {}},
      {"new prefix needs no separator", "/var/db/timezone/localtime -> /var/db/timezone/zoneinfoXY",
       "-> /var/db/timezone/zoneinfoXY", {}},
      {"old form rewritten", "/var/db/timezone/localtime -> /usr/share/zoneinfo/Europe/Paris",
       "-> /var/db/timezone/zoneinfo/Europe/Paris",
       {"Correcting localtime link to /var/db/timezone/zoneinfo/Europe/Paris: *"}},
      {"old form whose zone is missing", "/var/db/timezone/localtime -> /usr/share/zoneinfo/Nowhere/Missing",
       default_link, {"Correcting localtime link to /var/db/timezone/zoneinfo/Nowhere/Missing: *", reset}},
      {"old prefix without separator",
       "/var/db/timezone/localtime -> /usr/share/zoneinfo.default/Europe/Paris", default_link,
       {"Correcting localtime link to /var/db/timezone/zoneinfo.default/Europe/Paris: *", reset}},
      {"shorter than the old prefix", "/var/db/timezone/localtime -> /usr/share/zoneinf", default_link,
       {reset}},
      {"relative target", "/var/db/timezone/localtime -> Europe/Paris", default_link, {reset}},
      {"no link at all", "", default_link, {reset}},
      {"regular file", "/var/db/timezone/localtime = x", default_link,
       {"read_symlink: /var/db/timezone/localtime: Invalid argument", reset}},
      {"empty directory", "/var/db/timezone/localtime/", default_link,
       {"read_symlink: /var/db/timezone/localtime: Invalid argument", reset}},
  };
  for (const localtime_case& c : cases) {
    SCOPED_TRACE(c.name);
    sandbox box;
    lay_out_zoneinfo();
    if (!c.at_start.empty()) sandbox::lay_out({c.at_start});
    expect_messages(messages_of(check_localtime_link), c.messages);
    EXPECT_EQ(show("/var/db/timezone/localtime"), c.after);
  }
}

TEST(LocalTime, FailedResetLeavesWithTheErrno) {
  sandbox box;
  lay_out_zoneinfo();
  sandbox::lay_out({"/var/db/timezone/localtime/keep = x"});
  int thrown = 0;
  const auto messages = messages_of([&] {
    try {
      check_localtime_link();
    } catch (int error) {
      thrown = error;
    }
  });
  EXPECT_EQ(thrown, EEXIST);
  expect_messages(messages, {"read_symlink: /var/db/timezone/localtime: Invalid argument", reset,
                             "create_symlink: from /var/db/timezone/localtime to "
                             "/var/db/timezone/zoneinfo/America/Los_Angeles: File exists"});
}

}  // namespace
}  // namespace vell
