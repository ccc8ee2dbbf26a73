#include "dataset/links.h"

#include <gtest/gtest.h>

#include "dataset/dataset.h"
#include "testing/sandbox.h"

namespace vell {
namespace {

using testing::expect_messages;
using testing::messages_of;
using testing::sandbox;
using testing::show;

TEST(DatasetPathOfLink, DerivesTheDatasetDirectory) {
  const struct {
    const char* target;
    const char* path;  // nullptr: a bad link
  } cases[] = {
      {"/var/db/timezone/tz/2016a.1.0/zoneinfo", "/var/db/timezone/tz/2016a.1.0"},
      {"/var/db/timezone/tz/2016a.1.0/", "/var/db/timezone/tz/2016a.1.0"},
      {"/var/db/timezone/tz/2016a.1.0/anything", "/var/db/timezone/tz/2016a.1.0"},
      {"/var/db/timezone/tz/x/zoneinfo", "/var/db/timezone/tz/x"},
      {"/var/db/timezone/tz/a/b/zoneinfo", "/var/db/timezone/tz/a/b"},
      {"/usr/share/zoneinfo.default", ""},
      {"/var/db/timezone/tz/2016a.1.0", nullptr},
      {"/var/db/timezone/tz//zoneinfo", nullptr},
      {"/var/db/timezone/tz/", nullptr},
      {"/var/db/timezone/TZ/2016a.1.0/zoneinfo", nullptr},
      {"/usr/share/zoneinfo.default/", nullptr},
      {"/usr/share/zoneinfo", nullptr},
      {"", nullptr},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.target);
    std::string path = "unset";
    int thrown = 0;
    const auto messages = messages_of([&] {
      try {
        path = dataset_path_of_link(c.target);
      } catch (int value) {
        thrown = value;
      }
    });
    if (c.path != nullptr) {
      EXPECT_EQ(path, c.path);
      expect_messages(messages, {});
    } else {
      EXPECT_EQ(thrown, -1);
      expect_messages(messages, {std::string("Bad zoneinfo link ") + c.target + ": *"});
    }
  }
}

TEST(ResetToSystem, LinksZoneFilesAndDropsIcuLinks) {
  sandbox box;
  sandbox::lay_out({
      "/usr/share/zoneinfo.default/+VERSION = 2016a",
      "/var/db/timezone/zoneinfo -> /var/db/timezone/tz/2016b.1.0/zoneinfo",
      "/var/db/timezone/icutz -> /var/db/timezone/tz/2016b.1.0/icutz",
      "/var/db/icutz -> /var/db/timezone/tz/2016b.1.0/icutz",
  });
  expect_messages(messages_of(reset_to_system), {});
  EXPECT_EQ(show("/var/db/timezone/zoneinfo"), "-> /usr/share/zoneinfo.default");
  EXPECT_EQ(show("/var/db/timezone/icutz"), "absent");
  EXPECT_EQ(show("/var/db/icutz"), "absent");
}

}  // namespace
}  // namespace vell
