// Keeps /var/db/timezone/localtime leading through the zoneinfo link.
#ifndef VELL_HOUSEKEEPING_LOCALTIME_H_
#define VELL_HOUSEKEEPING_LOCALTIME_H_

#include <string>

namespace vell {

enum class localtime_verdict { keep, rewrite, reset };

/// How check_localtime_link treats a link target, by byte prefixes (no
/// separator is required after them): a target under
/// "/var/db/timezone/zoneinfo" is kept; one under "/usr/share/zoneinfo" is
/// rewritten to the same rest under the first prefix, left in `corrected`
/// (and still reset when that does not exist); anything else is reset.
localtime_verdict localtime_rule(const std::string& target, std::string& corrected);

/// Leaves a target starting with "/var/db/timezone/zoneinfo" alone, rewrites
/// one starting with "/usr/share/zoneinfo" to the new prefix ("Correcting
/// localtime link to %s") when the result exists, and resets anything else to
/// the default zone ("localtime link invalid; resetting to %s"). Throws errno
/// as int only when creating the default link fails.
void check_localtime_link();

}  // namespace vell

#endif  // VELL_HOUSEKEEPING_LOCALTIME_H_
