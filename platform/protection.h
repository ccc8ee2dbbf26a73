// Data-protection classes exist only on the device's own OS. This is the one
// place that knows whether they are there; elsewhere they are accepted and do
// nothing, which is all vell needs of them.
#ifndef VELL_PLATFORM_PROTECTION_H_
#define VELL_PLATFORM_PROTECTION_H_

#include <sys/types.h>

namespace vell::platform {

/// The class whose files stay readable at all times, also before first unlock.
constexpr int protection_class_d = 4;

/// Gives the open file `fd` the data-protection class `protection_class`.
/// Returns 0 on success, -1 with errno set on failure.
int set_protection_class(int fd, int protection_class);

/// Opens `path` with `flags`; a file that this creates gets `mode` and the
/// data-protection class `protection_class`. Returns the descriptor, or a
/// negative value with errno set.
int open_protected(const char* path, int flags, int protection_class, mode_t mode);

}  // namespace vell::platform

#endif  // VELL_PLATFORM_PROTECTION_H_
