#include "housekeeping/legacy_icu.h"

#include <err.h>

#include <string>

#include "fs/path_ops.h"

namespace vell {

void migrate_legacy_icu_link() {
  const std::string legacy = "/var/db/icutz";
  const std::string current = "/var/db/timezone/icutz";
  if (exists(legacy) && !exists(current)) {
    try {
      create_symlink(read_symlink(legacy), current);
    } catch (...) {
      warn("Could not migrate /var/db/icutz to /var/db/timezone/icutz");
    }
  }
  // Asked afresh: the legacy link goes whether or not the copy worked.
  if (exists(legacy)) {
    try {
      remove(legacy);
    } catch (...) {
      warn("Could not remove /var/db/icutz");
    }
  }
}

}  // namespace vell
