#include "dataset/icu.h"

#include <errno.h>

#include <memory>

#include <gtest/gtest.h>

#include "dataset/zoneinfo.h"
#include "testing/sandbox.h"

namespace vell {
namespace {

using testing::expect_messages;
using testing::messages_of;
using testing::sandbox;
using testing::show;

const std::string dataset = "/var/db/timezone/tz/2016b.1.0";
const std::string icutz = dataset + "/icutz/";
const std::string not_found = "No ICU schema found for " + dataset + ": *";

struct walk_case {
  const char* name;
  std::vector<std::string> layout;
  const char* schema;
};

TEST(IcuSchema, DownloadedDatasetWalk) {
  const walk_case cases[] = {
      {"readable data file", {icutz + "icutz44l.dat = x"}, "44l"},
      {"readable by others only", {icutz + "icutz44l.dat [0604] = x"}, "44l"},
      {"not readable by others", {icutz + "icutz44l.dat [0640] = x"}, ""},
      {"other letters and digits", {icutz + "icutz7b.dat = x"}, "7b"},
      {"three digits", {icutz + "icutz100e.dat = x"}, "100e"},
      {"names matching only in part",
       {icutz + "icutz44l.dat.bak = x", icutz + "xicutz44l.dat = x", icutz + "icutz.dat = x",
        icutz + "icutzl.dat = x", icutz + "icutz44x.dat = x", icutz + "ICUTZ44L.DAT = x",
        icutz + "icutz44lxdat = x"},
       ""},
      {"only in a subdirectory", {icutz + "sub/icutz44l.dat = x"}, ""},
      {"a link with a matching name", {icutz + "real = x", icutz + "icutz44l.dat -> real"}, ""},
      {"a directory with a matching name", {icutz + "icutz44l.dat/"}, ""},
      {"directory missing", {dataset + "/zoneinfo/"}, ""},
      {"icutz itself a link", {"/var/db/elsewhere/icutz44b.dat = x", dataset + "/icutz -> /var/db/elsewhere"},
       "44b"},
      {"non-matching files around a match",
       {icutz + "README = x", icutz + "icutz44l.dat = x", icutz + "sub/icutz45l.dat = x"}, "44l"},
  };
  for (const walk_case& c : cases) {
    SCOPED_TRACE(c.name);
    sandbox box;
    for (const std::string& entry : c.layout) sandbox::lay_out({entry});
    std::string schema = "unset";
    const auto messages = messages_of([&] { schema = vell_icu(dataset).schema(); });
    EXPECT_EQ(schema, c.schema);
    expect_messages(messages, *c.schema ? std::vector<std::string>{} : std::vector<std::string>{not_found});
  }
}

TEST(IcuSchema, SystemFormatFile) {
  const struct {
    const char* name;
    const char* layout;
    const char* schema;
  } cases[] = {
      {"first word", "/usr/share/icu/icutzformat.txt = \t44l\nignored", "44l"},
      {"taken as it stands", "/usr/share/icu/icutzformat.txt = ICU-anything", "ICU-anything"},
      {"only whitespace", "/usr/share/icu/icutzformat.txt =  \n ", ""},
      {"missing", "/usr/share/icu/", ""},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.name);
    sandbox box;
    sandbox::lay_out({c.layout});
    std::string schema = "unset";
    expect_messages(messages_of([&] { schema = vell_icu("").schema(); }), {});
    EXPECT_EQ(schema, c.schema);
  }
}

std::shared_ptr<vell_icu> system_icu_with(const std::string& schema) {
  sandbox::lay_out({"/usr/share/icu/icutzformat.txt = " + schema});
  return std::make_shared<vell_icu>("");
}

TEST(IcuSchema, CompatibleOnlyWithTheSameSchema) {
  const struct {
    const char* mine;
    const char* other;
    bool compatible;
  } cases[] = {{"44l", "44l", true}, {"44l", "44b", false}, {"44l", "4l", false},
               {"", "", true},       {"44l", "", false},    {"", "44l", false}};
  for (const auto& c : cases) {
    SCOPED_TRACE(std::string(c.mine) + " against " + c.other);
    sandbox box;
    const auto mine = system_icu_with(c.mine);
    const auto other = system_icu_with(c.other);
    expect_messages(messages_of([&] { EXPECT_EQ(mine->compatible_schema(*other), c.compatible); }), {});
  }
}

TEST(IcuSchema, AnotherKindOfComponentIsIncompatible) {
  sandbox box;
  const auto mine = system_icu_with("");
  const auto zoneinfo = std::make_shared<vell_zoneinfo>("");
  expect_messages(messages_of([&] { EXPECT_FALSE(mine->compatible_schema(*zoneinfo)); }),
                  {"vell_icu::compatible_schema: could not dynamic_cast other component: *"});
}

struct activate_case {
  const char* name;
  std::string dataset_path;
  std::vector<std::string> layout;
  int thrown;
  std::vector<std::string> messages;
  const char* icutz_after;
  const char* legacy_after;
};

TEST(IcuActivate, ReplacesTheLinks) {
  const std::string old_link = "-> /var/db/timezone/tz/2015a.1.0/icutz";
  const std::vector<std::string> both_links = {"/var/db/timezone/icutz " + old_link,
                                               "/var/db/icutz " + old_link};
  const std::vector<std::string> blocked = {"/var/db/timezone/icutz/", "/var/db/icutz " + old_link};
  const std::string cannot_remove = "remove: could not remove /var/db/timezone/icutz: Is a directory";
  const activate_case cases[] = {
      {"system dataset removes both", "", both_links, 0, {}, "absent", "absent"},
      {"downloaded dataset links its directory", dataset, both_links, 0, {}, "-> /var/db/timezone/tz/2016b.1.0/icutz",
       "absent"},
      {"downloaded dataset, no links before", dataset, {"/var/db/timezone/"}, 0, {},
       "-> /var/db/timezone/tz/2016b.1.0/icutz", "absent"},
      {"system dataset, directory in the way", "", blocked, 0,
       {cannot_remove, "unlink of ICU softlink failed: *"}, "/", old_link.c_str()},
      {"downloaded dataset, directory in the way", dataset, blocked, EEXIST,
       {cannot_remove, "unlink of ICU softlink failed: *",
        "create_symlink: from /var/db/timezone/icutz to /var/db/timezone/tz/2016b.1.0/icutz: File exists"},
       "/", old_link.c_str()},
  };
  for (const activate_case& c : cases) {
    SCOPED_TRACE(c.name);
    sandbox box;
    sandbox::lay_out({icutz + "icutz44l.dat = x"});
    for (const std::string& entry : c.layout) sandbox::lay_out({entry});
    const vell_icu icu(c.dataset_path);
    int thrown = 0;
    const auto messages = messages_of([&] {
      try {
        icu.activate();
      } catch (int error) {
        thrown = error;
      }
    });
    EXPECT_EQ(thrown, c.thrown);
    expect_messages(messages, c.messages);
    EXPECT_EQ(show("/var/db/timezone/icutz"), c.icutz_after);
    EXPECT_EQ(show("/var/db/icutz"), c.legacy_after);
  }
}

}  // namespace
}  // namespace vell
