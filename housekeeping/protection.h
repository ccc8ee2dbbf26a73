// Keeps the data directories readable at all times.
#ifndef VELL_HOUSEKEEPING_PROTECTION_H_
#define VELL_HOUSEKEEPING_PROTECTION_H_

#include <string>

namespace vell {

/// Gives the directory at `path` protection class 4. A directory that cannot
/// be opened, or a refused class, is passed over silently.
void set_directory_protection(const std::string& path);

/// set_directory_protection on "/var/db/timezone/", then "/var/db/timezone/tz/".
void protect_data_directories();

}  // namespace vell

#endif  // VELL_HOUSEKEEPING_PROTECTION_H_
