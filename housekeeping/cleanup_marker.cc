#include "housekeeping/cleanup_marker.h"

#include <err.h>

#include "fs/paths.h"
#include "fs/small_files.h"
#include "platform/protection.h"

namespace vell {

void mark_needs_cleanup() {
  if (!touch_own_file(paths::cleanup_marker, platform::protection_class_d))
    warn("Cannot touch file %s", paths::cleanup_marker);
}

}  // namespace vell
