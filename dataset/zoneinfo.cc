#include "dataset/zoneinfo.h"

#include <err.h>

#include "fs/path_ops.h"
#include "fs/paths.h"
#include "fs/small_files.h"

namespace vell {

vell_zoneinfo::vell_zoneinfo(const std::string& dataset_path)
    : vell_dataset_component(dataset_path),
      directory_(dataset_path.empty() ? paths::system_zoneinfo : dataset_path + "/zoneinfo"),
      // A missing, blank or unreadable file leaves the version empty; that is no failure.
      version_(read_first_word(directory_ + "/+VERSION")) {}

bool vell_zoneinfo::compatible_schema(const vell_dataset_component&) const { return true; }

void vell_zoneinfo::activate() const {
  try {
    remove(paths::zoneinfo_link);
  } catch (...) {
    warn("Unlink of zoneinfo softlink failed");
  }
  create_symlink(directory_, paths::zoneinfo_link);
}

}  // namespace vell
