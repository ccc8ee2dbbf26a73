#include "dataset/dataset.h"

#include <err.h>

#include <algorithm>
#include <stdexcept>
#include <string_view>

#include "dataset/icu.h"
#include "dataset/zoneinfo.h"
#include "fs/paths.h"

namespace vell {

bool is_dataset_path(const std::string& path) {
  return path.starts_with(paths::downloads) &&
         path.size() > std::string_view(paths::downloads).size();
}

vell_dataset::vell_dataset() { create_components(); }

vell_dataset::vell_dataset(const std::string& path) : path_(path) { create_components(); }

void vell_dataset::create_components() {
  // Made before the path is checked: even a rejected path has its version file read.
  auto zoneinfo = std::make_shared<vell_zoneinfo>(path_);
  if (path_.empty()) {
    version_text_ = zoneinfo->version() + ".1.0";
  } else if (is_dataset_path(path_)) {
    version_text_ = path_.substr(std::string_view(paths::downloads).size());
  } else {
    warn("vell_dataset::create_components: bad path %s", path_.c_str());
    throw std::invalid_argument("badpath");
  }
  parse_version(parsed_version_, version_text_);
  components_.push_back(std::move(zoneinfo));
  components_.push_back(std::make_shared<vell_icu>(path_));
}

bool vell_dataset::same_path(const vell_dataset& other) const { return path_ == other.path_; }

bool vell_dataset::compatible_with(const vell_dataset& other) const {
  const size_t common = std::min(components_.size(), other.components_.size());
  for (size_t i = 0; i < common; ++i) {
    if (!components_[i]->compatible_schema(*other.components_[i])) return false;
  }
  return components_.size() == other.components_.size();
}

void vell_dataset::activate() const {
  for (const auto& component : components_) component->activate();
}

bool operator>(const vell_dataset& a, const vell_dataset& b) { return a.version() > b.version(); }

}  // namespace vell
