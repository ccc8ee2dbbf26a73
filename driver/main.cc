// vell: run once at every start to point the time-zone links at usable data.
#include <err.h>

#include "driver/startup.h"
#include "fs/paths.h"
#include "platform/confinement.h"
#include "platform/run_limit.h"

int main() {
  // Never holds up a boot, whatever starts it: the same bound as the unit's.
  vell::platform::limit_run_time(30);
  // Before any file-system work: whatever a start is led to, it cannot write elsewhere.
  vell::platform::confine_writes_beneath(vell::paths::writable_root);
  try {
    return vell::run_startup();
  } catch (...) {
    // The links could not be brought into a usable state; boot goes on, but
    // the caller must see that this start failed.
    warn("Cannot repair time-zone links; giving up");
    return 1;
  }
}
