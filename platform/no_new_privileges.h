// The first of vell's own confinement steps: nothing it could be led to
// execute gains a privilege, whatever the init handed it.
#ifndef VELL_PLATFORM_NO_NEW_PRIVILEGES_H_
#define VELL_PLATFORM_NO_NEW_PRIVILEGES_H_

namespace vell::platform {

/// Sets no-new-privileges: an exec from now on gains no capability beyond
/// the permitted set and honours no set-user-ID bit or file capability, so
/// the bounding set need not be trimmed; Landlock and the filter then need
/// no CAP_SYS_ADMIN. Never prints, never throws, and leaves errno as it
/// found it.
void forbid_new_privileges();

}  // namespace vell::platform

#endif  // VELL_PLATFORM_NO_NEW_PRIVILEGES_H_
