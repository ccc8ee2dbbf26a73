#include "platform/capabilities.h"

#include <errno.h>
#include <linux/capability.h>
#include <sys/syscall.h>
#include <unistd.h>

namespace vell::platform {

void keep_only_capability(int kept) {
  const int saved_errno = errno;
  __user_cap_header_struct header{.version = _LINUX_CAPABILITY_VERSION_3, .pid = 0};
  // The kernel lowers an ambient capability with its permitted or
  // inheritable one, so the three sets do for the fourth. No capget first:
  // when `kept` is not permitted, raising it fails, and none is kept.
  __user_cap_data_struct sets[_LINUX_CAPABILITY_U32S_3]{};
  sets[kept / 32].effective = sets[kept / 32].permitted = sets[kept / 32].inheritable =
      1u << (kept % 32);
  if (syscall(SYS_capset, &header, sets) != 0) {
    sets[kept / 32] = {};
    syscall(SYS_capset, &header, sets);
  }
  errno = saved_errno;
}

}  // namespace vell::platform
