// Prints what each step by which vell confines itself costs, in the order
// vell takes them, each timed in fresh children (as root, the capability
// drop has 40 capabilities to drop; otherwise none).
//   vell_confinement_cost [RUNS]
#include <linux/capability.h>
#include <sys/wait.h>
#include <time.h>
#include <unistd.h>

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <vector>

#include "platform/capabilities.h"
#include "platform/confinement.h"
#include "platform/syscall_filter.h"

namespace {

long now_ns() {
  timespec t;
  clock_gettime(CLOCK_MONOTONIC, &t);
  return t.tv_sec * 1000000000L + t.tv_nsec;
}

constexpr int step_count = 3;
const char* const step_names[step_count] = {"Landlock (writes beneath one folder)",
                                            "capabilities (all but CAP_DAC_OVERRIDE)",
                                            "system-call filter"};

}  // namespace

int main(int argc, char** argv) {
  const int runs = argc > 1 ? std::atoi(argv[1]) : 200;
  std::vector<long> took[step_count];
  for (int run = 0; run < runs; ++run) {
    int ends[2];
    if (pipe(ends) != 0) return 1;
    if (fork() == 0) {
      long at[step_count + 1];
      at[0] = now_ns();
      vell::platform::confine_writes_beneath("/tmp");
      at[1] = now_ns();
      vell::platform::keep_only_capability(CAP_DAC_OVERRIDE);
      at[2] = now_ns();
      vell::platform::deny_unneeded_system_calls();
      at[3] = now_ns();
      _exit(write(ends[1], at, sizeof at) == sizeof at ? 0 : 1);
    }
    close(ends[1]);
    long at[step_count + 1];
    const bool got = read(ends[0], at, sizeof at) == sizeof at;
    close(ends[0]);
    wait(nullptr);
    if (!got) return 1;
    for (int step = 0; step < step_count; ++step) took[step].push_back(at[step + 1] - at[step]);
  }
  std::printf("\nconfining itself, median of %d fresh processes%s\n", runs,
              geteuid() == 0 ? "" : " (not root: no capabilities to drop)");
  for (int step = 0; step < step_count; ++step) {
    std::sort(took[step].begin(), took[step].end());
    std::printf("  %-42s %8.1f us\n", step_names[step], took[step][runs / 2] / 1000.0);
  }
  return 0;
}
