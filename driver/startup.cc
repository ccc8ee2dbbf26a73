#include "driver/startup.h"

#include <cstdio>

#include "housekeeping/localtime.h"

namespace vell {

int run_startup() {
  // Steps 1 and 2 (directory protection, legacy ICU link) are not built yet.
  std::remove("/var/db/timezone/needs_cleanup");
  std::remove("/var/db/icu");
  // Steps 5 to 9 (datasets, selection, promotion) are not built yet.
  check_localtime_link();
  return 0;
}

}  // namespace vell
