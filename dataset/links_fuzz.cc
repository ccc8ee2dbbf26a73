// Any bytes as the zoneinfo link's target. The system partition's one target
// gives ""; any other target is accepted exactly when the part before its
// last "/" passes the dataset path rule, and then that part is the result.
// A rejected target throws the int -1 and nothing else.
#include <cstddef>
#include <cstdint>
#include <string>

#include "dataset/dataset.h"
#include "dataset/links.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  const std::string target(reinterpret_cast<const char*>(data), size);
  const size_t last_slash = target.rfind('/');
  const std::string before_last_slash = last_slash == std::string::npos ? "" : target.substr(0, last_slash);
  const bool acceptable = vell::is_dataset_path(before_last_slash);
  std::string path;
  try {
    path = vell::dataset_path_of_link(target);
  } catch (int thrown) {
    if (thrown != -1 || acceptable || target == "/usr/share/zoneinfo.default") __builtin_trap();
    return 0;
  }
  if (path != (acceptable ? before_last_slash : "") || (path.empty() && target != "/usr/share/zoneinfo.default"))
    __builtin_trap();
  return 0;
}
