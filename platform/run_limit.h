// vell's own bound on how long a start may take, so that no init needs a
// tool of its own (timeout(1) is missing from many minimal images) to keep a
// start from holding up the boot.
#ifndef VELL_PLATFORM_RUN_LIMIT_H_
#define VELL_PLATFORM_RUN_LIMIT_H_

namespace vell::platform {

/// A start still running `seconds` from now is ended by the kernel (SIGALRM,
/// whose default action ends the process), even if whoever started vell
/// ignored or blocked that signal. Never prints, never throws, and leaves
/// errno as it found it.
void limit_run_time(unsigned seconds);

}  // namespace vell::platform

#endif  // VELL_PLATFORM_RUN_LIMIT_H_
