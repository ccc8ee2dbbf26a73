// Runs every scenario in testing/scenarios (the format is in scenario.h).
#include <gtest/gtest.h>

#include <sys/stat.h>

#include <filesystem>

#include "testing/sandbox.h"
#include "testing/scenario.h"

namespace vell::testing {
namespace {

// A message without the error text that warn() puts after its last ": ",
// and without the blanks before it.
std::string without_error_text(const std::string& message) {
  const std::string text = message.substr(0, message.rfind(": "));
  return text.substr(0, text.find_last_not_of(' ') + 1);
}

// "PATH -> T", "PATH = T", "PATH =", "PATH/", "PATH fifo", "PATH absent":
// the path, and what show() must give for it.
std::pair<std::string, std::string> expectation(const std::string& step) {
  if (const size_t at = step.find(" -> "); at != std::string::npos)
    return {step.substr(0, at), "-> " + step.substr(at + 4)};
  if (const size_t at = step.find(" ="); at != std::string::npos)
    return {step.substr(0, at), "= " + step.substr(std::min(at + 3, step.size()))};
  if (step.ends_with("/")) return {step.substr(0, step.size() - 1), "/"};
  const size_t space = step.rfind(' ');
  return {step.substr(0, space), step.substr(space + 1)};
}

void run(const scenario& s) {
  sandbox box;
  set_up(s);
  bool started = false;
  for (size_t i = 0; i < s.steps.size(); ++i) {
    const std::string& step = s.steps[i];
    if (step.starts_with("start ")) {
      started = true;
      const run_result result = run_vell();
      EXPECT_EQ(result.status, std::stoi(step.substr(6))) << step;
      std::string got, want;
      for (const std::string& message : result.messages) got += without_error_text(message) + "\n";
      while (i + 1 < s.steps.size() && s.steps[i + 1].starts_with("| "))
        want += s.steps[++i].substr(2) + "\n";
      EXPECT_EQ(got, want) << step;
    } else if (step.starts_with("active ")) {
      const std::string dataset = step.substr(7);
      const bool system = dataset == "system";
      EXPECT_EQ(show("/var/db/timezone/zoneinfo"),
                "-> " + (system ? "/usr/share/zoneinfo.default"
                                : "/var/db/timezone/tz/" + dataset + "/zoneinfo"));
      EXPECT_EQ(show("/var/db/timezone/icutz"),
                system ? "absent" : "-> /var/db/timezone/tz/" + dataset + "/icutz");
    } else if (step == "usable") {
      EXPECT_EQ(unusable_links(), "");
    } else if (started && step.starts_with("/")) {
      auto [path, want] = expectation(step);
      if (const size_t mode = path.find(" ["); mode != std::string::npos) {
        struct stat st;
        EXPECT_EQ(lstat(path.substr(0, mode).c_str(), &st) == 0 ? st.st_mode & 07777 : 0,
                  std::stoul(path.substr(mode + 2), nullptr, 8)) << path;
        path.erase(mode);
      }
      EXPECT_EQ(show(path), want) << path;
    }
  }
}

class Scenario : public ::testing::TestWithParam<std::string> {};

TEST_P(Scenario, EndsAsWritten) {
  int count = 0;
  for (const scenario& s : read_scenarios()) {
    if (!s.name.starts_with(GetParam() + ":")) continue;
    SCOPED_TRACE(s.name);
    run(s);
    ++count;
  }
  EXPECT_GT(count, 0) << "no scenario in " << GetParam();
}

std::vector<std::string> files() {
  std::vector<std::string> names;
  for (const auto& entry : std::filesystem::directory_iterator(VELL_SCENARIOS))
    names.push_back(entry.path().filename());
  return names;
}

INSTANTIATE_TEST_SUITE_P(File, Scenario, ::testing::ValuesIn(files()), [](const auto& info) {
  return info.param.substr(0, info.param.find('.'));
});

}  // namespace
}  // namespace vell::testing
