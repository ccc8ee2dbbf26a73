#include "dataset/links.h"

#include <err.h>

#include "dataset/dataset.h"
#include "fs/path_ops.h"
#include "fs/paths.h"

namespace vell {

void reset_to_system() {
  const vell_dataset system;
  system.activate();
}

std::string read_latest_link() { return read_symlink(paths::latest_link); }

std::string current_dataset_path() {
  return dataset_path_of_link(read_symlink(paths::zoneinfo_link));
}

std::string dataset_path_of_link(const std::string& target) {
  if (target == paths::system_zoneinfo) return std::string();
  // The link names a folder inside the dataset: the dataset is what stands before the last "/".
  const size_t last_slash = target.rfind('/');
  if (last_slash != std::string::npos && is_dataset_path(target.substr(0, last_slash)))
    return target.substr(0, last_slash);
  warn("Bad zoneinfo link %s", target.c_str());
  throw -1;
}

}  // namespace vell
