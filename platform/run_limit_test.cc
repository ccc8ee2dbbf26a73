#include "platform/run_limit.h"

#include <errno.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

namespace vell::platform {
namespace {

// A child limits itself to one second and then waits forever, with SIGALRM
// as its caller handed it on: left alone, ignored or blocked. It must end by
// SIGALRM within three seconds, errno left as it was.
TEST(LimitRunTime, EndsTheStartWhateverTheCallerHandedOn) {
  for (const char* handed_on : {"left alone", "ignored", "blocked"}) {
    const pid_t child = fork();
    if (child == 0) {
      sigset_t alarm_only;
      sigemptyset(&alarm_only);
      sigaddset(&alarm_only, SIGALRM);
      if (handed_on[0] == 'i') signal(SIGALRM, SIG_IGN);
      if (handed_on[0] == 'b') sigprocmask(SIG_BLOCK, &alarm_only, nullptr);
      errno = EXDEV;
      limit_run_time(1);
      if (errno != EXDEV) _exit(200);  // every message of a start ends with errno's text
      for (;;) pause();
    }
    int status = 0;
    for (int tenth = 0; tenth < 30 && waitpid(child, &status, WNOHANG) != child; ++tenth)
      usleep(100000);
    if (status == 0) {  // still running
      kill(child, SIGKILL);
      waitpid(child, nullptr, 0);
    }
    EXPECT_TRUE(WIFSIGNALED(status) && WTERMSIG(status) == SIGALRM)
        << "SIGALRM " << handed_on << ": wait status " << status;
  }
}

}  // namespace
}  // namespace vell::platform
