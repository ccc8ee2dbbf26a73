#include "platform/capabilities.h"

#include <errno.h>
#include <linux/capability.h>
#include <sys/prctl.h>
#include <sys/syscall.h>
#include <unistd.h>

namespace vell::platform {

void keep_only_capability(int kept) {
  const int saved_errno = errno;
  __user_cap_header_struct header{.version = _LINUX_CAPABILITY_VERSION_3, .pid = 0};
  __user_cap_data_struct sets[_LINUX_CAPABILITY_U32S_3]{};
  if (syscall(SYS_capget, &header, sets) != 0) {
    errno = saved_errno;
    return;
  }
  // The bounding set first, while CAP_SETPCAP is still there to allow it;
  // dropping past the kernel's last capability fails with EINVAL.
  if (sets[0].effective & (1u << CAP_SETPCAP)) {
    for (int cap = 0;; ++cap)
      if (cap != kept && prctl(PR_CAPBSET_DROP, cap, 0, 0, 0) != 0 && errno == EINVAL) break;
  }
  // The kernel lowers an ambient capability with its permitted or
  // inheritable one, so the three sets do for the fourth.
  for (int word = 0; word < _LINUX_CAPABILITY_U32S_3; ++word) {
    const __u32 mask = word == kept / 32 ? 1u << (kept % 32) : 0;
    sets[word].effective &= mask;
    sets[word].permitted &= mask;
    sets[word].inheritable &= mask;
  }
  syscall(SYS_capset, &header, sets);
  errno = saved_errno;
}

}  // namespace vell::platform
