// Any bytes as the zoneinfo link's target: a derived dataset path is either
// the system partition's (only for its one target) or a path that the dataset
// path rule accepts and that the target continues with "/".
#include <cstddef>
#include <cstdint>
#include <string>

#include "dataset/dataset.h"
#include "dataset/links.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  const std::string target(reinterpret_cast<const char*>(data), size);
  std::string path;
  try {
    path = vell::dataset_path_of_link(target);
  } catch (int) {
    return 0;
  }
  if (path.empty()) {
    if (target != "/usr/share/zoneinfo.default") __builtin_trap();
    return 0;
  }
  if (!vell::is_dataset_path(path) || !target.starts_with(path + "/")) __builtin_trap();
  return 0;
}
