#include "dataset/icu.h"

#include <err.h>
#include <errno.h>
#include <fts.h>
#include <sys/stat.h>

#include <cstring>
#include <fstream>
#include <regex>

#include "fs/path_ops.h"

namespace vell {

vell_icu::vell_icu(const std::string& dataset_path)
    : vell_dataset_component(dataset_path),
      directory_(dataset_path.empty() ? "/usr/share/icu" : dataset_path + "/icutz") {
  initialize();
}

void vell_icu::initialize() {
  if (!dataset_path.empty()) {
    find_schema_in_directory();
    return;
  }
  std::ifstream in(directory_ + "/icutzformat.txt");
  in >> schema_;
}

void vell_icu::find_schema_in_directory() {
  const std::regex pattern("icutz([0-9]+[lbe])\\.dat");
  char* const paths[] = {const_cast<char*>(directory_.c_str()), nullptr};
  FTS* walk = fts_open(paths, FTS_COMFOLLOW | FTS_PHYSICAL | FTS_XDEV, nullptr);
  if (walk == nullptr) {
    const int error = errno;
    warn("tz_icu::initialize: fts_open of %s failed, %s", directory_.c_str(), strerror(error));
    throw error;
  }
  // The walk's end and its failure are alike: whatever was found so far counts.
  for (FTSENT* entry; (entry = fts_read(walk)) != nullptr;) {
    if (!schema_.empty()) break;  // the first match wins
    if (entry->fts_errno != 0 || entry->fts_level != 1 || entry->fts_namelen == 0 ||
        entry->fts_info != FTS_F || (entry->fts_statp->st_mode & S_IROTH) == 0)
      continue;
    std::cmatch match;
    if (std::regex_match(entry->fts_name, match, pattern) && match.size() == 2) schema_ = match[1].str();
  }
  fts_close(walk);
  if (schema_.empty()) warn("No ICU schema found for %s", dataset_path.c_str());
}

bool vell_icu::compatible_schema(const vell_dataset_component& other) const {
  const auto* other_icu = dynamic_cast<const vell_icu*>(&other);
  if (other_icu == nullptr) {
    warn("vell_icu::compatible_schema: could not dynamic_cast other component");
    return false;
  }
  return schema_ == other_icu->schema_;
}

void vell_icu::activate() const {
  const std::string link = "/var/db/timezone/icutz";
  try {
    remove(link);
    remove("/var/db/icutz");
  } catch (...) {
    warn("unlink of ICU softlink failed");
  }
  if (dataset_path.empty()) return;  // the system's ICU data is used without a link
  create_symlink(directory_, link);
}

}  // namespace vell
