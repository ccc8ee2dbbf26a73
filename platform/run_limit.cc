#include "platform/run_limit.h"

#include <errno.h>
#include <signal.h>
#include <unistd.h>

namespace vell::platform {

void limit_run_time(unsigned seconds) {
  const int saved_errno = errno;
  // Ignored and blocked signals survive exec: an init may hand either on.
  signal(SIGALRM, SIG_DFL);
  sigset_t alarm_only;
  sigemptyset(&alarm_only);
  sigaddset(&alarm_only, SIGALRM);
  sigprocmask(SIG_UNBLOCK, &alarm_only, nullptr);
  alarm(seconds);
  errno = saved_errno;
}

}  // namespace vell::platform
