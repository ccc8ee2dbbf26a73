// Any bytes as the local-time link's target: a rewritten target keeps the
// old one's rest under the new prefix and is itself kept by the next start.
#include <cstddef>
#include <cstdint>
#include <string>

#include "housekeeping/localtime.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  const std::string target(reinterpret_cast<const char*>(data), size);
  const std::string new_prefix = "/var/db/timezone/zoneinfo", old_prefix = "/usr/share/zoneinfo";
  std::string corrected, again;
  switch (vell::localtime_rule(target, corrected)) {
    case vell::localtime_verdict::keep:
      if (!target.starts_with(new_prefix)) __builtin_trap();
      break;
    case vell::localtime_verdict::rewrite:
      if (!target.starts_with(old_prefix) || corrected != new_prefix + target.substr(old_prefix.size()) ||
          vell::localtime_rule(corrected, again) != vell::localtime_verdict::keep)
        __builtin_trap();
      break;
    case vell::localtime_verdict::reset:
      if (target.starts_with(new_prefix) || target.starts_with(old_prefix)) __builtin_trap();
      break;
  }
  return 0;
}
