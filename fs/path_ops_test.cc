// The failure messages of the path operations are checked wherever they
// surface (the local-time, legacy-link, ICU and start-up tables); what only
// shows here is the read limit and how exists() sees links.
#include "fs/path_ops.h"

#include <gtest/gtest.h>

#include "testing/sandbox.h"

namespace vell {
namespace {

using namespace vell::testing;

TEST(PathOps, ExistsFollowsLinksAndReadsAtMost1024Bytes) {
  sandbox box;
  const std::string exact(1024, 'a'), longer = std::string(1024, 'b') + "c";
  sandbox::lay_out({"/var/dir/", "/var/to_dir -> /var/dir", "/var/dangling -> /var/none", "/var/exact -> " + exact,
                    "/var/longer -> " + longer});
  EXPECT_TRUE(exists("/var/to_dir"));
  EXPECT_FALSE(exists("/var/dangling"));
  EXPECT_EQ(read_symlink("/var/exact"), exact);
  EXPECT_EQ(read_symlink("/var/longer"), longer.substr(0, 1024));
  EXPECT_EQ(read_symlink("/var/none"), "");
  remove("/var/to_dir");
  EXPECT_EQ(show("/var/dir"), "/");  // a link goes, never its target
}

}  // namespace
}  // namespace vell
