#include "dataset/zoneinfo.h"

#include <err.h>

#include <fstream>

#include "fs/path_ops.h"

namespace vell {

vell_zoneinfo::vell_zoneinfo(const std::string& dataset_path)
    : vell_dataset_component(dataset_path),
      directory_(dataset_path.empty() ? "/usr/share/zoneinfo.default" : dataset_path + "/zoneinfo") {
  read_version();
}

void vell_zoneinfo::read_version() {
  // A missing or blank file leaves the version empty; that is no failure.
  std::ifstream in(directory_ + "/+VERSION");
  in >> version_;
}

bool vell_zoneinfo::compatible_schema(const vell_dataset_component&) const { return true; }

void vell_zoneinfo::activate() const {
  const std::string link = "/var/db/timezone/zoneinfo";
  try {
    remove(link);
  } catch (...) {
    warn("Unlink of zoneinfo softlink failed");
  }
  create_symlink(directory_, link);
}

}  // namespace vell
