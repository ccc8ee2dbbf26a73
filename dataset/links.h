// The links that name datasets: zoneinfo (the current one) and tz_latest
// (the newest download), and the reset of every link to the system partition.
#ifndef VELL_DATASET_LINKS_H_
#define VELL_DATASET_LINKS_H_

#include <string>

namespace vell {

/// Points every component's link at the system partition's data.
/// Construction and activation failures pass through.
void reset_to_system();

/// The target of /var/db/timezone/tz_latest, unchecked; "" when absent.
std::string read_latest_link();

/// The dataset directory that /var/db/timezone/zoneinfo names, by
/// dataset_path_of_link; a missing link is a bad one.
std::string current_dataset_path();

/// "/var/db/timezone/tz/D/anything" gives "/var/db/timezone/tz/D" (D not
/// empty, cut at the last "/"); "/usr/share/zoneinfo.default" gives "".
/// Anything else prints "Bad zoneinfo link %s" and throws the int -1.
std::string dataset_path_of_link(const std::string& target);

}  // namespace vell

#endif  // VELL_DATASET_LINKS_H_
