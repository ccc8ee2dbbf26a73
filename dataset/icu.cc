#include "dataset/icu.h"

#include <err.h>
#include <errno.h>
#include <fts.h>
#include <sys/stat.h>

#include <cstring>
#include <memory>

#include "dataset/pattern.h"
#include "fs/path_ops.h"
#include "fs/paths.h"
#include "fs/small_files.h"

namespace vell {
vell_icu::vell_icu(const std::string& dataset_path)
    : vell_dataset_component(dataset_path),
      directory_(dataset_path.empty() ? paths::system_icu : dataset_path + "/icutz") {
  if (dataset_path.empty()) {
    schema_ = read_first_word(directory_ + "/icutzformat.txt");
  } else {
    find_schema_in_directory();
  }
}

void vell_icu::find_schema_in_directory() {
  static const vell_regex pattern("icutz([0-9]+[lbe])\\.dat");  // compiled once per start
  char* const roots[] = {const_cast<char*>(directory_.c_str()), nullptr};
  // Closing the walk, however the loop ends, also returns to the directory it started in.
  const std::unique_ptr<FTS, decltype(&fts_close)> walk(
      fts_open(roots, FTS_COMFOLLOW | FTS_PHYSICAL | FTS_XDEV, nullptr), fts_close);
  if (!walk) {
    const int error = errno;
    warn("tz_icu::initialize: fts_open of %s failed, %s", directory_.c_str(), strerror(error));
    throw error;
  }
  // The walk's end and its failure are alike: whatever was found so far counts.
  for (FTSENT* entry; schema_.empty() && (entry = fts_read(walk.get())) != nullptr;) {
    // Nothing below the first level can count: the walk need not go there,
    // however large a tree the folder or a link in it leads to.
    if (entry->fts_level == 1 && entry->fts_info == FTS_D) fts_set(walk.get(), entry, FTS_SKIP);
    if (entry->fts_errno != 0 || entry->fts_level != 1 || entry->fts_info != FTS_F ||
        (entry->fts_statp->st_mode & S_IROTH) == 0)
      continue;
    std::cmatch match;
    if (std::regex_match(entry->fts_name, match, pattern)) schema_ = match[1].str();
  }
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
  try {
    remove(paths::icutz_link);
    remove(paths::legacy_icutz_link);
  } catch (...) {
    warn("unlink of ICU softlink failed");
  }
  if (dataset_path.empty()) return;  // the system's ICU data is used without a link
  create_symlink(directory_, paths::icutz_link);
}

}  // namespace vell
