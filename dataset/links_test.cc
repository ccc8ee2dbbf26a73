#include "dataset/links.h"

#include <gtest/gtest.h>

namespace vell {
namespace {

// The dataset a zoneinfo link target names; "bad" where it is rejected.
TEST(DatasetPathOfLink, Table) {
  const std::pair<std::string, std::string> cases[] = {
      {"/usr/share/zoneinfo.default", ""},
      {"/var/db/timezone/tz/2016a.1.0/zoneinfo", "/var/db/timezone/tz/2016a.1.0"},
      {"/var/db/timezone/tz/2016a.1.0/zoneinfo/", "/var/db/timezone/tz/2016a.1.0/zoneinfo"},
      {"/var/db/timezone/tz/x/", "/var/db/timezone/tz/x"},
      {"/var/db/timezone/tz//zoneinfo", "bad"},
      {"/var/db/timezone/tz/2016a.1.0", "bad"},
      {"/var/db/timezone/tz/", "bad"},
      {"/var/db/timezone/tzz/2016a.1.0/zoneinfo", "bad"},
      {"/usr/share/zoneinfo.default/", "bad"},
      {"/usr/share/zoneinfo", "bad"},
      {"", "bad"},
  };
  for (const auto& [target, dataset] : cases) {
    std::string got;
    try {
      got = dataset_path_of_link(target);
    } catch (int thrown) {
      got = thrown == -1 ? "bad" : "threw another value";
    }
    EXPECT_EQ(got, dataset) << target;
  }
}

}  // namespace
}  // namespace vell
