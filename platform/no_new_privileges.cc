#include "platform/no_new_privileges.h"

#include <errno.h>
#include <sys/prctl.h>

namespace vell::platform {

void forbid_new_privileges() {
  const int saved_errno = errno;
  prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0);
  errno = saved_errno;
}

}  // namespace vell::platform
