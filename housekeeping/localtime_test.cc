#include "housekeeping/localtime.h"

#include <gtest/gtest.h>

namespace vell {
namespace {

// How a local-time link target is treated, and what a rewrite gives.
TEST(LocaltimeRule, Table) {
  const std::string zoneinfo = "/var/db/timezone/zoneinfo";
  const struct {
    std::string target;
    localtime_verdict verdict;
    std::string corrected;
  } cases[] = {
      {zoneinfo + "/Europe/Paris", localtime_verdict::keep, ""},
      {zoneinfo, localtime_verdict::keep, ""},
      {zoneinfo + ".old", localtime_verdict::keep, ""},
      {"/usr/share/zoneinfo/Europe/Paris", localtime_verdict::rewrite, zoneinfo + "/Europe/Paris"},
      {"/usr/share/zoneinfo", localtime_verdict::rewrite, zoneinfo},
      {"/usr/share/zoneinfo.default/UTC", localtime_verdict::rewrite, zoneinfo + ".default/UTC"},
      {"/usr/share/zoneinf", localtime_verdict::reset, ""},
      {"/var/db/timezone/zoneinf", localtime_verdict::reset, ""},
      {"Europe/Paris", localtime_verdict::reset, ""},
      {"", localtime_verdict::reset, ""},
  };
  for (const auto& c : cases) {
    std::string corrected;
    EXPECT_EQ(localtime_rule(c.target, corrected), c.verdict) << c.target;
    EXPECT_EQ(corrected, c.corrected) << c.target;
  }
}

}  // namespace
}  // namespace vell
