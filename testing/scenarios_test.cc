// Plays every scenario in testing/scenarios (the notation is in sandbox.h).
#include <gtest/gtest.h>

#include "testing/sandbox.h"

namespace vell::testing {
namespace {

TEST(Scenarios, EndAsWritten) {
  const std::vector<scenario> all = read_scenarios();
  ASSERT_GT(all.size(), 10u) << "scenarios missing from " << VELL_SCENARIOS;
  for (const scenario& s : all) {
    SCOPED_TRACE(s.name);
    sandbox box;
    play(s);
  }
}

}  // namespace
}  // namespace vell::testing
