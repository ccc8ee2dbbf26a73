// Moves the ICU link from its old place, /var/db/icutz, to /var/db/timezone/icutz.
#ifndef VELL_HOUSEKEEPING_LEGACY_ICU_H_
#define VELL_HOUSEKEEPING_LEGACY_ICU_H_

namespace vell {

/// When /var/db/icutz exists and /var/db/timezone/icutz does not (both
/// followed through links), copies the old link's target text to the new
/// link ("Could not migrate /var/db/icutz to /var/db/timezone/icutz" on
/// failure). Then removes /var/db/icutz if it still exists ("Could not
/// remove /var/db/icutz" on failure). Never throws on a file-system failure.
void migrate_legacy_icu_link();

}  // namespace vell

#endif  // VELL_HOUSEKEEPING_LEGACY_ICU_H_
