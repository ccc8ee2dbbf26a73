#include "housekeeping/localtime.h"

#include <err.h>

#include <cstdio>
#include <string>

#include "fs/path_ops.h"

namespace vell {
namespace {

constexpr char localtime_link[] = "/var/db/timezone/localtime";
constexpr char zoneinfo_prefix[] = "/var/db/timezone/zoneinfo";
constexpr char old_prefix[] = "/usr/share/zoneinfo";
constexpr char default_zone[] = "America/Los_Angeles";
// Fixed on its own rather than joined, so the reset never depends on anything.
constexpr char default_target[] = "/var/db/timezone/zoneinfo/America/Los_Angeles";

// Byte prefix test; no separator is required after the prefix.
bool starts_with(const std::string& text, const std::string& prefix) {
  return text.compare(0, prefix.size(), prefix) == 0 && text.size() >= prefix.size();
}

void rewrite_or_throw() {
  std::string corrected;
  const localtime_verdict verdict = localtime_rule(read_symlink(localtime_link), corrected);
  if (verdict == localtime_verdict::keep) return;
  if (verdict == localtime_verdict::reset) throw -1;
  warn("Correcting localtime link to %s", corrected.c_str());
  if (!exists(corrected)) throw -1;
  std::remove(localtime_link);
  create_symlink(corrected, localtime_link);
}

}  // namespace

localtime_verdict localtime_rule(const std::string& target, std::string& corrected) {
  if (starts_with(target, zoneinfo_prefix)) return localtime_verdict::keep;
  if (!starts_with(target, old_prefix)) return localtime_verdict::reset;
  corrected = zoneinfo_prefix + target.substr(sizeof old_prefix - 1);
  return localtime_verdict::rewrite;
}

void check_localtime_link() {
  try {
    rewrite_or_throw();
  } catch (...) {
    warn("localtime link invalid; resetting to %s", default_zone);
    std::remove(localtime_link);
    create_symlink(default_target, localtime_link);
  }
}

}  // namespace vell
