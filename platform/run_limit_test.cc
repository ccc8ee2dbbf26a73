#include "platform/run_limit.h"

#include <errno.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <thread>

namespace vell::platform {
namespace {

enum class handed_on { default_action, ignored, blocked };

// How a child that limits itself to one second and then waits forever ends:
// its wait status, or -1 when it still runs after three seconds.
int end_of_limited_child(handed_on alarm_signal) {
  const pid_t child = fork();
  if (child == 0) {
    if (alarm_signal == handed_on::ignored) signal(SIGALRM, SIG_IGN);
    if (alarm_signal == handed_on::blocked) {
      sigset_t alarm_only;
      sigemptyset(&alarm_only);
      sigaddset(&alarm_only, SIGALRM);
      sigprocmask(SIG_BLOCK, &alarm_only, nullptr);
    }
    errno = EXDEV;
    limit_run_time(1);
    if (errno != EXDEV) _exit(200);  // every message of a start ends with errno's text
    for (;;) pause();
  }
  for (int tenth = 0; tenth < 30; ++tenth) {
    int status = 0;
    if (waitpid(child, &status, WNOHANG) == child) return status;
    std::this_thread::sleep_for(std::chrono::milliseconds(100));
  }
  kill(child, SIGKILL);
  waitpid(child, nullptr, 0);
  return -1;
}

TEST(LimitRunTime, EndsTheStartWhateverTheCallerHandedOn) {
  const struct {
    const char* name;
    handed_on alarm_signal;
  } cases[] = {
      {"default action", handed_on::default_action},
      {"ignored by the caller", handed_on::ignored},
      {"blocked by the caller", handed_on::blocked},
  };
  for (const auto& c : cases) {
    const int status = end_of_limited_child(c.alarm_signal);
    EXPECT_TRUE(status != -1 && WIFSIGNALED(status) && WTERMSIG(status) == SIGALRM)
        << c.name << ": wait status " << status;
  }
}

}  // namespace
}  // namespace vell::platform
