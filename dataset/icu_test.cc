#include "dataset/icu.h"

#include <gtest/gtest.h>

#include "dataset/zoneinfo.h"
#include "testing/sandbox.h"

namespace vell {
namespace {

using namespace vell::testing;

TEST(IcuSchema, DownloadedDatasetWalk) {
  const std::string dataset = "/var/db/timezone/tz/2016b.1.0", icutz = dataset + "/icutz/";
  const struct {
    const char* name;
    std::vector<std::string> layout;
    const char* schema;
  } cases[] = {
      {"readable by others only", {icutz + "icutz44l.dat [0604] = x"}, "44l"},
      {"not readable by others", {icutz + "icutz44l.dat [0640] = x"}, ""},
      {"other digits and letters", {icutz + "icutz7b.dat = x"}, "7b"},
      {"names matching only in part",
       {icutz + "icutz44l.dat.bak = x", icutz + "xicutz44l.dat = x", icutz + "icutz.dat = x", icutz + "icutzl.dat = x",
        icutz + "icutz44x.dat = x", icutz + "ICUTZ44L.DAT = x", icutz + "icutz44lxdat = x"},
       ""},
      {"only in a subdirectory", {icutz + "sub/icutz44l.dat = x"}, ""},
      {"a link or a directory with a matching name",
       {icutz + "real = x", icutz + "icutz44l.dat -> real", icutz + "icutz45l.dat/"}, ""},
      {"directory missing", {dataset + "/zoneinfo/"}, ""},
      {"icutz itself a link", {"/var/db/elsewhere/icutz100e.dat = x", dataset + "/icutz -> /var/db/elsewhere"}, "100e"},
      {"a match among others", {icutz + "README = x", icutz + "icutz44l.dat = x", icutz + "sub/icutz45l.dat = x"}, "44l"},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.name);
    sandbox box;
    for (const std::string& entry : c.layout) sandbox::lay_out({entry});
    std::string schema = "unset";
    const auto messages = messages_of([&] { schema = vell_icu(dataset).schema(); });
    EXPECT_EQ(schema, c.schema);
    expect_messages(messages, *c.schema ? std::vector<std::string>{}
                                        : std::vector<std::string>{"No ICU schema found for " + dataset + ": *"});
  }
}

TEST(IcuSchema, CompatibleOnlyWithTheSameSchema) {
  const struct {
    const char *mine, *other;
    bool compatible;
  } cases[] = {{"44l", "44l", true}, {"44l", "4l", false}, {"", "", true}, {"", "44l", false}};
  auto system_icu_with = [](const std::string& schema) {
    sandbox::lay_out({"/usr/share/icu/icutzformat.txt = \t" + schema + "\n"});
    return std::make_shared<vell_icu>("");
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(std::string(c.mine) + " against " + c.other);
    sandbox box;
    const auto mine = system_icu_with(c.mine), other = system_icu_with(c.other);
    EXPECT_EQ(mine->schema(), c.mine);
    expect_messages(messages_of([&] { EXPECT_EQ(mine->compatible_schema(*other), c.compatible); }), {});
  }
  sandbox box;
  const vell_zoneinfo zoneinfo("");
  expect_messages(messages_of([&] { EXPECT_FALSE(system_icu_with("")->compatible_schema(zoneinfo)); }),
                  {"vell_icu::compatible_schema: could not dynamic_cast other component: *"});
}

}  // namespace
}  // namespace vell
