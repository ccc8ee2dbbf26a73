#include "housekeeping/cleanup_marker.h"

#include <err.h>
#include <unistd.h>

#include "fs/paths.h"
#include "fs/small_files.h"
#include "platform/protection.h"

namespace vell {

void mark_needs_cleanup() {
  // Never truncated: an existing marker is kept as it is.
  const int fd = open_own_file(paths::cleanup_marker, platform::protection_class_d, 0666);
  if (fd < 0 || close(fd) != 0) warn("Cannot touch file %s", paths::cleanup_marker);
}

}  // namespace vell
