#include "platform/confinement.h"

#include <errno.h>
#include <fcntl.h>
#include <gtest/gtest.h>
#include <linux/landlock.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdlib>
#include <string>

namespace vell::platform {
namespace {

// errno of creating `path` (0 when it could), in a child confined beneath
// `confined_to`, so that this test process stays free.
int create_when_confined(const std::string& confined_to, const std::string& path) {
  const pid_t child = fork();
  if (child == 0) {
    errno = EXDEV;
    confine_writes_beneath(confined_to.c_str());
    if (errno != EXDEV) _exit(200);  // the confinement must leave no trace in errno
    const int fd = open(path.c_str(), O_WRONLY | O_CREAT | O_CLOEXEC, 0644);
    _exit(fd >= 0 ? 0 : errno);
  }
  int status = 0;
  waitpid(child, &status, 0);
  return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

TEST(ConfineWritesBeneath, WritesOnlyBeneathTheDirectory) {
  if (syscall(SYS_landlock_create_ruleset, nullptr, 0, LANDLOCK_CREATE_RULESET_VERSION) < 1)
    GTEST_SKIP() << "this kernel (or emulator) has no Landlock: " << strerror(errno);
  char top[] = "/tmp/vell-confinement.XXXXXX";
  ASSERT_NE(mkdtemp(top), nullptr);
  const std::string inside = std::string(top) + "/db";
  ASSERT_EQ(mkdir(inside.c_str(), 0755), 0);
  const struct {
    std::string confined_to, path;
    int error;
  } cases[] = {
      {inside, inside + "/timezone", 0},
      {inside, std::string(top) + "/outside", EACCES},
      {inside, inside + "/../outside", EACCES},
      {std::string(top) + "/missing", std::string(top) + "/unconfined", 0},
  };
  for (const auto& c : cases)
    EXPECT_EQ(create_when_confined(c.confined_to, c.path), c.error) << c.path;
  std::system(("rm -rf " + std::string(top)).c_str());
}

}  // namespace
}  // namespace vell::platform
