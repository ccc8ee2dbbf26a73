#include "housekeeping/cleanup_marker.h"

#include <err.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include "platform/protection.h"

namespace vell {

void mark_needs_cleanup() {
  const char path[] = "/var/db/timezone/needs_cleanup";
  // Neither O_TRUNC nor O_EXCL: an existing marker is kept as it is.
  const int fd = platform::open_protected(path, O_CREAT | O_RDWR, platform::protection_class_d, 0666);
  bool failed = fd < 0;
  if (!failed) {
    struct stat status;
    failed = fstat(fd, &status) != 0;
    failed = close(fd) != 0 || failed;
  }
  if (failed) warn("Cannot touch file %s", path);
}

}  // namespace vell
