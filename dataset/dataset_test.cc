#include "dataset/dataset.h"

#include <stdexcept>

#include <gtest/gtest.h>

#include "testing/sandbox.h"

namespace vell {
namespace {

using namespace vell::testing;

TEST(Dataset, PathRuleAndVersionString) {
  auto unparsable = [](const std::string& text) {
    return std::vector<std::string>{"Cannot parse version string " + text + ", results.size() = 0: *",
                                    "Cannot parse version string " + text + ": *"};
  };
  auto bad = [](const std::string& path) {
    return std::vector<std::string>{"vell_dataset::create_components: bad path " + path + ": *"};
  };
  const struct {
    std::string path;
    const char* version_text;  // "badpath" when the path is rejected
    std::vector<std::string> messages;
  } cases[] = {
      {"", "2016c.1.0", {}},
      {"/var/db/timezone/tz/2016a.1.0", "2016a.1.0", {}},
      {"/var/db/timezone/tz/2016a.1.0/", "2016a.1.0/", unparsable("2016a.1.0/")},  // its walk takes "//"
      {"/var/db/timezone/tz/x", "x", unparsable("x")},
      {"/var/db/timezone/tz/", "badpath", bad("/var/db/timezone/tz/")},
      {"/var/db/timezone/tz", "badpath", bad("/var/db/timezone/tz")},
      {"/var/db/timezone/TZ/2016a.1.0", "badpath", bad("/var/db/timezone/TZ/2016a.1.0")},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.path);
    sandbox box;
    lay_out_device();
    sandbox::lay_out({"/var/db/timezone/tz/x/icutz/icutz44l.dat = x"});
    std::string version_text;
    const auto messages = messages_of([&] {
      try {
        version_text = vell_dataset(c.path).version_string();
      } catch (const std::invalid_argument& e) {
        version_text = e.what();
      }
    });
    EXPECT_EQ(version_text, c.version_text);
    expect_messages(messages, c.messages);
  }
}

}  // namespace
}  // namespace vell
