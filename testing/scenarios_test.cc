// Plays every scenario in testing/scenarios (the notation is in sandbox.h).
#include <gtest/gtest.h>

#include <filesystem>

#include "testing/sandbox.h"

namespace vell::testing {
namespace {

class Scenarios : public ::testing::TestWithParam<std::string> {};

TEST_P(Scenarios, EndAsWritten) {
  int played = 0;
  for (const scenario& s : read_scenarios()) {
    if (!s.name.starts_with(GetParam() + ":")) continue;
    SCOPED_TRACE(s.name);
    sandbox box;
    play(s);
    ++played;
  }
  EXPECT_GT(played, 0) << "no scenario in " << GetParam();
}

std::vector<std::string> files() {
  std::vector<std::string> names;
  for (const auto& entry : std::filesystem::directory_iterator(VELL_SCENARIOS))
    names.push_back(entry.path().filename());
  return names;
}

INSTANTIATE_TEST_SUITE_P(In, Scenarios, ::testing::ValuesIn(files()), [](const auto& info) {
  return info.param.substr(0, info.param.find('.'));
});

}  // namespace
}  // namespace vell::testing
