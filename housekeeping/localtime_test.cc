#include "housekeeping/localtime.h"

#include <gtest/gtest.h>

#include "testing/sandbox.h"

namespace vell {
namespace {

using namespace vell::testing;

// The prefix tests themselves are held by localtime_fuzz.cc; these are the
// outcomes on disk and the messages.
TEST(LocalTime, OutcomeTable) {
  const std::string link = "/var/db/timezone/localtime", zoneinfo = "/var/db/timezone/zoneinfo";
  const std::string reset = "localtime link invalid; resetting to America/Los_Angeles: *";
  const std::string not_a_link = "read_symlink: /var/db/timezone/localtime: Invalid argument";
  const std::string to_default = "-> /var/db/timezone/zoneinfo/America/Los_Angeles";
  auto correcting = [&](const std::string& zone) { return "Correcting localtime link to " + zoneinfo + zone + ": *"; };
  const struct {
    const char* name;
    std::string at_start;  // what lay_out puts at the link's path; "" for nothing
    std::string after;
    std::vector<std::string> messages;
  } cases[] = {
      {"present form kept, file missing", link + " -> " + zoneinfo + "/Nowhere", "-> " + zoneinfo + "/Nowhere", {}},
      {"old form rewritten", link + " -> /usr/share/zoneinfo/Europe/Paris", "-> " + zoneinfo + "/Europe/Paris",
       {correcting("/Europe/Paris")}},
      {"old form, zone missing", link + " -> /usr/share/zoneinfo/Nowhere/Missing", to_default,
       {correcting("/Nowhere/Missing"), reset}},
      {"old prefix, no separator", link + " -> /usr/share/zoneinfo.default/Europe/Paris", to_default,
       {correcting(".default/Europe/Paris"), reset}},
      {"no link", "", to_default, {reset}},
      {"regular file", link + " = x", to_default, {not_a_link, reset}},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.name);
    sandbox box;
    sandbox::lay_out({"/usr/share/zoneinfo.default/Europe/Paris = TZif", zoneinfo + " -> /usr/share/zoneinfo.default"});
    if (!c.at_start.empty()) sandbox::lay_out({c.at_start});
    expect_messages(messages_of(check_localtime_link), c.messages);
    EXPECT_EQ(show(link), c.after);
  }
}

}  // namespace
}  // namespace vell
