#include "dataset/links.h"

#include <err.h>

#include "dataset/dataset.h"
#include "fs/path_ops.h"

namespace vell {

void reset_to_system() {
  const vell_dataset system;
  system.activate();
}

std::string read_latest_link() { return read_symlink("/var/db/timezone/tz_latest"); }

std::string current_dataset_path() { return dataset_path_of_link(read_symlink("/var/db/timezone/zoneinfo")); }

std::string dataset_path_of_link(const std::string& target) {
  const std::string prefix = "/var/db/timezone/tz/";
  if (target.size() > prefix.size() && target.compare(0, prefix.size(), prefix) == 0) {
    // At least one byte must stand between the prefix and the last "/".
    const size_t last_slash = target.rfind('/');
    if (last_slash > prefix.size()) return target.substr(0, last_slash);
  } else if (target == "/usr/share/zoneinfo.default") {
    return std::string();
  }
  warn("Bad zoneinfo link %s", target.c_str());
  throw -1;
}

}  // namespace vell
