#include "fs/path_ops.h"

#include <errno.h>

#include <gtest/gtest.h>

#include "testing/sandbox.h"

namespace vell {
namespace {

using testing::expect_messages;
using testing::messages_of;
using testing::sandbox;
using testing::show;

// The errno an operation threw, or 0.
int thrown_by(const std::function<void()>& fn, std::vector<std::string>* messages) {
  int thrown = 0;
  *messages = messages_of([&] {
    try {
      fn();
    } catch (int error) {
      thrown = error;
    }
  });
  return thrown;
}

struct op_case {
  const char* name;
  std::function<void()> op;
  int thrown;
  std::vector<std::string> messages;
  const char* path;   // checked afterwards
  const char* after;  // what show() must give there
};

TEST(PathOps, FailuresAndAbsence) {
  const std::string long_target(1024, 'x');
  const op_case cases[] = {
      {"remove of a missing path is silent", [] { remove("/var/none"); }, 0, {}, "/var/none", "absent"},
      {"remove of a directory fails", [] { remove("/var/dir"); }, EISDIR,
       {"remove: could not remove /var/dir: Is a directory"}, "/var/dir", "/"},
      {"remove of a link leaves its target", [] { remove("/var/link"); }, 0, {}, "/var/file", "= data"},
      {"read_symlink of a regular file", [] { read_symlink("/var/file"); }, EINVAL,
       {"read_symlink: /var/file: Invalid argument"}, "/var/file", "= data"},
      {"read_symlink of a directory", [] { read_symlink("/var/dir"); }, EINVAL,
       {"read_symlink: /var/dir: Invalid argument"}, "/var/dir", "/"},
      {"create_symlink onto a dangling link", [] { create_symlink("/new", "/var/dangling"); }, EEXIST,
       {"create_symlink: from /var/dangling to /new: File exists"}, "/var/dangling", "-> /var/none"},
      {"create_symlink to a missing target", [] { create_symlink("/nowhere", "/var/fresh"); }, 0, {},
       "/var/fresh", "-> /nowhere"},
      {"create_symlink in a missing directory", [] { create_symlink("/x", "/var/no/link"); }, ENOENT,
       {"create_symlink: from /var/no/link to /x: No such file or directory"}, "/var/no", "absent"},
  };
  for (const op_case& c : cases) {
    SCOPED_TRACE(c.name);
    sandbox box;
    sandbox::lay_out({"/var/dir/", "/var/file = data", "/var/link -> /var/file", "/var/dangling -> /var/none"});
    std::vector<std::string> messages;
    EXPECT_EQ(thrown_by(c.op, &messages), c.thrown);
    expect_messages(messages, c.messages);
    EXPECT_EQ(show(c.path), c.after);
  }
}

TEST(PathOps, ExistsFollowsLinks) {
  sandbox box;
  sandbox::lay_out({"/var/dir/", "/var/to_dir -> /var/dir", "/var/dangling -> /var/none"});
  EXPECT_TRUE(exists("/var/to_dir"));
  EXPECT_FALSE(exists("/var/dangling"));
  EXPECT_FALSE(exists("/var/none"));
  EXPECT_FALSE(exists(""));
}

TEST(PathOps, ReadSymlinkReadsAtMost1024Bytes) {
  sandbox box;
  const std::string exact(1024, 'a');
  const std::string longer = std::string(1024, 'b') + "c";
  sandbox::lay_out({"/var/exact -> " + exact, "/var/longer -> " + longer});
  std::vector<std::string> messages = messages_of([&] {
    EXPECT_EQ(read_symlink("/var/exact"), exact);
    EXPECT_EQ(read_symlink("/var/longer"), longer.substr(0, 1024));
    EXPECT_EQ(read_symlink("/var/none"), "");
  });
  expect_messages(messages, {});
}

}  // namespace
}  // namespace vell
