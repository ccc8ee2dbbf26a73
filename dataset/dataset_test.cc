#include "dataset/dataset.h"

#include <errno.h>

#include <stdexcept>

#include <gtest/gtest.h>

#include "dataset/zoneinfo.h"
#include "testing/sandbox.h"

namespace vell {
namespace {

using testing::expect_messages;
using testing::messages_of;
using testing::sandbox;
using testing::show;

std::vector<std::string> unparsable(const std::string& text) {
  return {"Cannot parse version string " + text + ", results.size() = 0: *",
          "Cannot parse version string " + text + ": *"};
}

struct path_case {
  const char* name;
  std::string path;
  std::string version_text;  // "badpath" when the path is rejected
  std::vector<std::string> messages;
};

TEST(Dataset, PathRuleAndVersionString) {
  const std::string a = "/var/db/timezone/tz/2016a.1.0";
  const path_case cases[] = {
      {"system dataset", "", "2016a.1.0", {}},
      {"downloaded dataset", a, "2016a.1.0", {}},
      {"one byte after the prefix", "/var/db/timezone/tz/x", "x", unparsable("x")},
      {"trailing slash kept", a + "/", "2016a.1.0/", unparsable("2016a.1.0/")},
      {"prefix alone", "/var/db/timezone/tz/", "badpath",
       {"vell_dataset::create_components: bad path /var/db/timezone/tz/: *"}},
      {"prefix without slash", "/var/db/timezone/tz", "badpath",
       {"vell_dataset::create_components: bad path /var/db/timezone/tz: *"}},
      {"other case", "/var/db/timezone/TZ/2016a.1.0", "badpath",
       {"vell_dataset::create_components: bad path /var/db/timezone/TZ/2016a.1.0: *"}},
  };
  for (const path_case& c : cases) {
    SCOPED_TRACE(c.name);
    sandbox box;
    sandbox::lay_out({"/usr/share/zoneinfo.default/+VERSION = 2016a\n", "/usr/share/icu/icutzformat.txt = 44l",
                      a + "/icutz/icutz44l.dat = x", "/var/db/timezone/tz/x/icutz/icutz44l.dat = x"});
    std::string version_text;
    const auto messages = messages_of([&] {
      try {
        version_text = vell_dataset(c.path).version_string();
      } catch (const std::invalid_argument& e) {
        version_text = e.what();
      }
    });
    EXPECT_EQ(version_text, c.version_text);
    // "2016a.1.0/" walks a doubled slash and still finds the ICU data.
    expect_messages(messages, c.messages);
  }
}

TEST(Dataset, SystemVersionFromTheZoneFiles) {
  const struct {
    const char* name;
    std::string version_file;
    const char* version_text;
    int year;
  } cases[] = {
      {"first word only", "/usr/share/zoneinfo.default/+VERSION =   2016a\n2016b", "2016a.1.0", 2016},
      {"no version file", "/usr/share/zoneinfo.default/", ".1.0", -1},
      {"whitespace only", "/usr/share/zoneinfo.default/+VERSION = \n\t ", ".1.0", -1},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.name);
    sandbox box;
    sandbox::lay_out({c.version_file});
    std::vector<std::string> messages = messages_of([&] {
      const vell_dataset system;
      EXPECT_EQ(system.version_string(), c.version_text);
      EXPECT_EQ(system.version().year, c.year);
      ASSERT_EQ(system.components().size(), 2u);
      EXPECT_NE(dynamic_cast<const vell_zoneinfo*>(system.components()[0].get()), nullptr);
    });
    if (c.year < 0) expect_messages(messages, unparsable(".1.0"));
  }
}

TEST(Dataset, SamePathComparesBytes) {
  sandbox box;
  messages_of([] {
    EXPECT_TRUE(vell_dataset().same_path(vell_dataset("")));
    EXPECT_FALSE(vell_dataset("/var/db/timezone/tz/2016a.1.0").same_path(vell_dataset("/var/db/timezone/tz/2016a.1.0/")));
    EXPECT_FALSE(vell_dataset("/var/db/timezone/tz/2016a.1.0").same_path(vell_dataset()));
  });
}

TEST(ZoneinfoActivate, ReplacesTheLink) {
  const struct {
    const char* name;
    std::string dataset_path;
    const char* at_link;  // lay_out entry, or nullptr
    int thrown;
    std::vector<std::string> messages;
    const char* after;
  } cases[] = {
      {"system dataset, no link before", "", nullptr, 0, {}, "-> /usr/share/zoneinfo.default"},
      {"downloaded dataset over the system's", "/var/db/timezone/tz/2016b.1.0",
       "/var/db/timezone/zoneinfo -> /usr/share/zoneinfo.default", 0, {},
       "-> /var/db/timezone/tz/2016b.1.0/zoneinfo"},
      {"directory in the way", "", "/var/db/timezone/zoneinfo/", EEXIST,
       {"remove: could not remove /var/db/timezone/zoneinfo: Is a directory", "Unlink of zoneinfo softlink failed: *",
        "create_symlink: from /var/db/timezone/zoneinfo to /usr/share/zoneinfo.default: File exists"},
       "/"},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.name);
    sandbox box;
    sandbox::lay_out({"/var/db/timezone/"});
    if (c.at_link != nullptr) sandbox::lay_out({c.at_link});
    const vell_zoneinfo zoneinfo(c.dataset_path);
    int thrown = 0;
    const auto messages = messages_of([&] {
      try {
        zoneinfo.activate();
      } catch (int error) {
        thrown = error;
      }
    });
    EXPECT_EQ(thrown, c.thrown);
    expect_messages(messages, c.messages);
    EXPECT_EQ(show("/var/db/timezone/zoneinfo"), c.after);
  }
}

}  // namespace
}  // namespace vell
