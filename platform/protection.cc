#include "platform/protection.h"

#include <fcntl.h>

namespace vell::platform {

#if defined(F_SETPROTECTIONCLASS)

int set_protection_class(int fd, int protection_class) {
  return fcntl(fd, F_SETPROTECTIONCLASS, protection_class);
}

int open_protected(const char* path, int flags, int protection_class, mode_t mode) {
  return open_dprotected_np(path, flags, protection_class, 0, mode);
}

#else

// Without protection classes every file is always readable, which is what
// class D asks for.
int set_protection_class(int, int) { return 0; }

int open_protected(const char* path, int flags, int, mode_t mode) {
  return open(path, flags, mode);
}

#endif

}  // namespace vell::platform
