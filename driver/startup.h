// One start of the device: the fixed sequence of steps that vell's main runs.
#ifndef VELL_DRIVER_STARTUP_H_
#define VELL_DRIVER_STARTUP_H_

namespace vell {

/// Runs every step of one start in order and returns 0. Failures of the
/// dataset work fall back to the system partition inside; anything that
/// escapes (the local-time repair, the last reset) leaves as an exception and
/// the remaining steps are not performed.
int run_startup();

}  // namespace vell

#endif  // VELL_DRIVER_STARTUP_H_
