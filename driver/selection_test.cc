// The decisions between datasets, as starts of the real binary show them.
#include "driver/selection.h"

#include <gtest/gtest.h>

#include "testing/sandbox.h"

namespace vell {
namespace {

using testing::expect_messages;
using testing::run_vell;
using testing::sandbox;
using testing::show;

const std::string tz = "/var/db/timezone/tz/";
const char previous_record[] = "2015z.1.0_2016a.1.0";

// System data 2016c with ICU schema 44l; downloads older, newer and one
// built for another ICU schema.
void lay_out_device() {
  sandbox::lay_out({
      "/usr/share/zoneinfo.default/+VERSION = 2016c",
      "/usr/share/zoneinfo.default/America/Los_Angeles = TZif",
      "/usr/share/icu/icutzformat.txt = 44l",
      "/var/db/timezone/localtime -> /var/db/timezone/zoneinfo/America/Los_Angeles",
      std::string("/var/db/timezone/TZVersionDiffRecord = ") + previous_record,
  });
  const struct {
    const char* version;
    const char* icu_file;
  } downloads[] = {{"2016a.1.0", "icutz44l.dat"}, {"2016b.1.0", "icutz44l.dat"}, {"2016d.1.0", "icutz44l.dat"},
                   {"2016e.1.0", "icutz44l.dat"}, {"2017a.1.0", "icutz44b.dat"}};
  for (const auto& d : downloads) {
    sandbox::lay_out({tz + d.version + "/zoneinfo/America/Los_Angeles = TZif",
                      tz + d.version + "/icutz/" + d.icu_file + " = ICU"});
  }
}

struct outcome_case {
  const char* name;
  const char* current;  // dataset the zoneinfo link names; "" for the system partition
  const char* latest;   // tz_latest's target, nullptr for none
  std::vector<std::string> messages;
  const char* after;    // dataset the links name afterwards; "" for the system partition
  bool marker;
  const char* record;
};

std::string zoneinfo_link_for(const std::string& dataset) {
  return dataset.empty() ? "/usr/share/zoneinfo.default" : tz + dataset + "/zoneinfo";
}

TEST(Selection, OutcomeTable) {
  const std::string reset = "Symlink points at data incompatible with installed system: *";
  auto rejected = [](const std::string& update, const std::string& current) {
    return "New update not compatible or older version: " + update + " vs. " + current + ": *";
  };
  const outcome_case cases[] = {
      {"kept, no update", "", nullptr, {}, "", false, previous_record},
      {"kept, update is the current dataset", "2016d.1.0", "2016d.1.0", {rejected("2016d.1.0", "2016d.1.0")},
       "2016d.1.0", false, previous_record},
      {"kept, update built for another schema", "", "2017a.1.0", {rejected("2017a.1.0", "2016c.1.0")}, "", false,
       previous_record},
      {"kept, update older than current", "2016e.1.0", "2016d.1.0", {rejected("2016d.1.0", "2016e.1.0")},
       "2016e.1.0", false, previous_record},
      {"kept, promoted over the system partition", "", "2016d.1.0", {}, "2016d.1.0", false, "2016c.1.0_2016d.1.0"},
      {"kept, promoted over a download", "2016d.1.0", "2016e.1.0", {}, "2016e.1.0", true, "2016d.1.0_2016e.1.0"},
      {"reset: older than the system, no update", "2016b.1.0", nullptr, {reset}, "", true, previous_record},
      {"reset: other schema, update older than current", "2017a.1.0", "2016b.1.0",
       {reset, rejected("2016b.1.0", "2017a.1.0")}, "", true, previous_record},
      {"reset, then promoted though older than the system", "2016a.1.0", "2016b.1.0", {reset}, "2016b.1.0", true,
       "2016c.1.0_2016b.1.0"},
      {"tz_latest outside the update directory", "2016d.1.0", "../2016e.1.0",
       {"vell_dataset::create_components: bad path ../2016e.1.0: *",
        "Unable to locate data; resetting to system partition: *"},
       "", false, previous_record},
  };
  for (const outcome_case& c : cases) {
    SCOPED_TRACE(c.name);
    sandbox box;
    lay_out_device();
    sandbox::lay_out({"/var/db/timezone/zoneinfo -> " + zoneinfo_link_for(c.current)});
    if (*c.current) sandbox::lay_out({"/var/db/timezone/icutz -> " + tz + c.current + "/icutz"});
    if (c.latest != nullptr) {
      const std::string latest = c.latest;
      sandbox::lay_out({"/var/db/timezone/tz_latest -> " + (latest.starts_with("..") ? latest : tz + latest)});
    }
    const auto run = run_vell();
    EXPECT_EQ(run.status, 0);
    expect_messages(run.messages, c.messages);
    EXPECT_EQ(show("/var/db/timezone/zoneinfo"), "-> " + zoneinfo_link_for(c.after));
    EXPECT_EQ(show("/var/db/timezone/icutz"), *c.after ? "-> " + tz + c.after + "/icutz" : "absent");
    EXPECT_EQ(show("/var/db/timezone/needs_cleanup"), c.marker ? "= " : "absent");
    EXPECT_EQ(show("/var/db/timezone/TZVersionDiffRecord"), std::string("= ") + c.record);
  }
}

TEST(Selection, TypicalStartThenSteadyState) {
  sandbox box;
  lay_out_device();
  sandbox::lay_out({"/var/db/timezone/needs_cleanup = ", "/var/db/timezone/zoneinfo -> /usr/share/zoneinfo.default",
                    "/var/db/timezone/tz_latest -> " + tz + "2016d.1.0"});
  auto run = run_vell();
  EXPECT_EQ(run.status, 0);
  expect_messages(run.messages, {});
  EXPECT_EQ(show("/var/db/timezone/zoneinfo"), "-> " + tz + "2016d.1.0/zoneinfo");
  EXPECT_EQ(show("/var/db/timezone/needs_cleanup"), "absent");
  EXPECT_EQ(show("/var/db/timezone/TZVersionDiffRecord"), "= 2016c.1.0_2016d.1.0");

  const std::string promoted = testing::snapshot();
  run = run_vell();
  EXPECT_EQ(run.status, 0);
  expect_messages(run.messages, {"New update not compatible or older version: 2016d.1.0 vs. 2016d.1.0: *"});
  EXPECT_EQ(testing::snapshot(), promoted);
}

TEST(Selection, MarkerBeforeRecordWhenADownloadIsDisplaced) {
  sandbox box;
  lay_out_device();
  sandbox::lay_out({"/var/db/timezone/zoneinfo -> " + tz + "2016d.1.0/zoneinfo",
                    "/var/db/timezone/tz_latest -> " + tz + "2016e.1.0"});
  const auto run = testing::run_vell({"/usr/bin/strace", "-qq", "-e", "trace=openat"});
  EXPECT_EQ(run.status, 0);
  std::vector<std::string> opened;
  for (const std::string& line : run.messages) {
    if (line.find("needs_cleanup") != std::string::npos) opened.push_back("marker");
    if (line.find("TZVersionDiffRecord") != std::string::npos) opened.push_back("record");
  }
  EXPECT_EQ(opened, (std::vector<std::string>{"marker", "record"}));
}

}  // namespace
}  // namespace vell
