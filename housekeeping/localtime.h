// Keeps /var/db/timezone/localtime leading through the zoneinfo link.
#ifndef VELL_HOUSEKEEPING_LOCALTIME_H_
#define VELL_HOUSEKEEPING_LOCALTIME_H_

namespace vell {

/// Leaves a target starting with "/var/db/timezone/zoneinfo" alone, rewrites
/// one starting with "/usr/share/zoneinfo" to the new prefix ("Correcting
/// localtime link to %s") when the result exists, and resets anything else to
/// the default zone ("localtime link invalid; resetting to %s"). Throws errno
/// as int only when creating the default link fails.
void check_localtime_link();

}  // namespace vell

#endif  // VELL_HOUSEKEEPING_LOCALTIME_H_
