// vell: run once at every start to point the time-zone links at usable data.
#include <err.h>
#include <linux/capability.h>

#include "driver/startup.h"
#include "fs/paths.h"
#include "platform/capabilities.h"
#include "platform/confinement.h"
#include "platform/no_new_privileges.h"
#include "platform/run_limit.h"
#include "platform/syscall_filter.h"

int main() {
  // Never holds up a boot, whatever starts it: the same bound as the unit's.
  vell::platform::limit_run_time(30);
  // Before any file-system work, whatever starts vell: whatever a start is
  // led to, it cannot write elsewhere, nor reach beyond what it needs.
  // No-new-privileges first, so that it holds on a kernel without Landlock or
  // seccomp; the filter last, since it refuses capset.
  vell::platform::forbid_new_privileges();
  vell::platform::confine_writes_beneath(vell::paths::writable_root);
  // Writing /var/db/timezone when it belongs to the updater's user.
  vell::platform::keep_only_capability(CAP_DAC_OVERRIDE);
  vell::platform::deny_unneeded_system_calls();
  try {
    return vell::run_startup();
  } catch (...) {
    // The links could not be brought into a usable state; boot goes on, but
    // the caller must see that this start failed.
    warn("Cannot repair time-zone links; giving up");
    return 1;
  }
}
