#include "platform/confinement.h"

#include <errno.h>
#include <fcntl.h>
#include <linux/landlock.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <cstdint>

// Truncation became a right of its own in Landlock's third version.
#ifndef LANDLOCK_ACCESS_FS_TRUNCATE
#define LANDLOCK_ACCESS_FS_TRUNCATE (1ULL << 14)
#endif

namespace vell::platform {

void confine_writes_beneath(const char* dir) {
  const int saved_errno = errno;
  const long abi =
      syscall(SYS_landlock_create_ruleset, nullptr, 0, LANDLOCK_CREATE_RULESET_VERSION);
  std::uint64_t writes = LANDLOCK_ACCESS_FS_WRITE_FILE | LANDLOCK_ACCESS_FS_REMOVE_DIR |
                         LANDLOCK_ACCESS_FS_REMOVE_FILE | LANDLOCK_ACCESS_FS_MAKE_CHAR |
                         LANDLOCK_ACCESS_FS_MAKE_DIR | LANDLOCK_ACCESS_FS_MAKE_REG |
                         LANDLOCK_ACCESS_FS_MAKE_SOCK | LANDLOCK_ACCESS_FS_MAKE_FIFO |
                         LANDLOCK_ACCESS_FS_MAKE_BLOCK | LANDLOCK_ACCESS_FS_MAKE_SYM;
  if (abi >= 2) writes |= LANDLOCK_ACCESS_FS_REFER;
  if (abi >= 3) writes |= LANDLOCK_ACCESS_FS_TRUNCATE;
  // Without the directory every write fails anyway, and must fail as before.
  const int beneath = abi < 1 ? -1 : open(dir, O_PATH | O_DIRECTORY | O_CLOEXEC);
  if (beneath >= 0) {
    const landlock_ruleset_attr ruleset{.handled_access_fs = writes};
    const int rules = syscall(SYS_landlock_create_ruleset, &ruleset, sizeof ruleset, 0);
    const landlock_path_beneath_attr rule{.allowed_access = writes, .parent_fd = beneath};
    if (rules >= 0 &&
        syscall(SYS_landlock_add_rule, rules, LANDLOCK_RULE_PATH_BENEATH, &rule, 0) == 0)
      syscall(SYS_landlock_restrict_self, rules, 0);
    if (rules >= 0) close(rules);
    close(beneath);
  }
  errno = saved_errno;
}

}  // namespace vell::platform
