// The decisions between datasets, as starts of the real binary show them.
#include <gtest/gtest.h>

#include "testing/sandbox.h"

namespace vell {
namespace {

using namespace vell::testing;

std::string zoneinfo_of(const std::string& dataset) {
  return "-> " + (dataset.empty() ? "/usr/share/zoneinfo.default" : tz + dataset + "/zoneinfo");
}

TEST(Selection, OutcomeTable) {
  const std::string reset = "Symlink points at data incompatible with installed system: *";
  auto rejected = [](const std::string& update, const std::string& current) {
    return "New update not compatible or older version: " + update + " vs. " + current + ": *";
  };
  const char* const unchanged = "2015z.1.0_2016a.1.0";
  const struct {
    const char* name;
    std::string current, latest;  // datasets the zoneinfo link and tz_latest name; "" for system / none
    std::vector<std::string> messages;
    std::string after;
    bool marker;
    const char* record;
  } cases[] = {
      {"kept, no update", "", "", {}, "", false, unchanged},
      {"kept, update is the current dataset", "2016d.1.0", "2016d.1.0", {rejected("2016d.1.0", "2016d.1.0")}, "2016d.1.0", false, unchanged},
      {"kept, update for another schema", "", "2017a.1.0", {rejected("2017a.1.0", "2016c.1.0")}, "", false, unchanged},
      {"kept, update older than current", "2016e.1.0", "2016d.1.0", {rejected("2016d.1.0", "2016e.1.0")}, "2016e.1.0", false, unchanged},
      {"kept, promoted over the system", "", "2016d.1.0", {}, "2016d.1.0", false, "2016c.1.0_2016d.1.0"},
      {"kept, promoted over a download", "2016d.1.0", "2016e.1.0", {}, "2016e.1.0", true, "2016d.1.0_2016e.1.0"},
      {"reset: older than the system", "2016b.1.0", "", {reset}, "", true, unchanged},
      {"reset: other schema; update older than it", "2017a.1.0", "2016b.1.0", {reset, rejected("2016b.1.0", "2017a.1.0")}, "", true, unchanged},
      {"reset, then promoted though older than the system", "2016a.1.0", "2016b.1.0", {reset}, "2016b.1.0", true, "2016c.1.0_2016b.1.0"},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.name);
    sandbox box;
    lay_out_device();
    lay_out_links(c.current.empty() ? "system" : c.current, c.latest);
    const run_result run = run_vell();
    EXPECT_EQ(run.status, 0);
    expect_messages(run.messages, c.messages);
    EXPECT_EQ(show("/var/db/timezone/zoneinfo"), zoneinfo_of(c.after));
    EXPECT_EQ(show("/var/db/timezone/icutz"), c.after.empty() ? "absent" : "-> " + tz + c.after + "/icutz");
    EXPECT_EQ(show("/var/db/timezone/needs_cleanup"), c.marker ? "= " : "absent");
    EXPECT_EQ(show("/var/db/timezone/TZVersionDiffRecord"), std::string("= ") + c.record);
  }
}

TEST(Selection, MarkerBeforeRecordWhenADownloadIsDisplaced) {
  sandbox box;
  lay_out_device();
  lay_out_links("2016d.1.0", "2016e.1.0");
  std::vector<std::string> opened;
  for (const std::string& line : run_vell({"/usr/bin/strace", "-qq", "-e", "trace=openat"}).messages) {
    if (line.find("needs_cleanup") != std::string::npos) opened.push_back("marker");
    if (line.find("TZVersionDiffRecord") != std::string::npos) opened.push_back("record");
  }
  EXPECT_EQ(opened, (std::vector<std::string>{"marker", "record"}));
}

}  // namespace
}  // namespace vell
