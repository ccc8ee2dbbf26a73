#include "housekeeping/localtime.h"

#include <err.h>

#include <string>
#include <string_view>

#include "fs/path_ops.h"
#include "fs/paths.h"

namespace vell {
namespace {

void rewrite_or_throw() {
  std::string corrected;
  const localtime_verdict verdict = localtime_rule(read_symlink(paths::localtime_link), corrected);
  if (verdict == localtime_verdict::keep) return;
  if (verdict == localtime_verdict::reset) throw -1;
  warn("Correcting localtime link to %s", corrected.c_str());
  if (!exists(corrected)) throw -1;
  remove_quietly(paths::localtime_link);
  create_symlink(corrected, paths::localtime_link);
}

}  // namespace

localtime_verdict localtime_rule(const std::string& target, std::string& corrected) {
  // Byte prefixes: no separator is required after them.
  if (target.starts_with(paths::zoneinfo_link)) return localtime_verdict::keep;
  if (!target.starts_with(paths::old_zoneinfo)) return localtime_verdict::reset;
  corrected = paths::zoneinfo_link + target.substr(std::string_view(paths::old_zoneinfo).size());
  return localtime_verdict::rewrite;
}

void check_localtime_link() {
  try {
    rewrite_or_throw();
  } catch (...) {
    warn("localtime link invalid; resetting to %s", paths::default_zone);
    remove_quietly(paths::localtime_link);
    create_symlink(paths::default_localtime_target, paths::localtime_link);
  }
}

}  // namespace vell
