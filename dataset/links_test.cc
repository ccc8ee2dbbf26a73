#include "dataset/links.h"

#include <gtest/gtest.h>

#include "testing/sandbox.h"

namespace vell {
namespace {

using namespace vell::testing;

TEST(DatasetPathOfLink, DerivesTheDatasetDirectory) {
  const std::pair<std::string, const char*> target_path[] = {  // nullptr: a bad link
      {"/var/db/timezone/tz/2016a.1.0/zoneinfo", "/var/db/timezone/tz/2016a.1.0"},
      {"/var/db/timezone/tz/2016a.1.0/", "/var/db/timezone/tz/2016a.1.0"},
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
  for (const auto& [target_text, want] : target_path) {
    const std::string& target = target_text;  // a binding cannot be captured before C++20 in clang 14
    SCOPED_TRACE(target);
    std::string path = "unset";
    const call_result result = call([&] { path = dataset_path_of_link(target); });
    if (want != nullptr) {
      EXPECT_EQ(path, want);
      expect_messages(result.messages, {});
    } else {
      EXPECT_EQ(result.thrown, -1);
      expect_messages(result.messages, {"Bad zoneinfo link " + target + ": *"});
    }
  }
}

}  // namespace
}  // namespace vell
