// Prints what each step by which vell confines itself costs, in the order
// vell takes them, beside the same step at the least cost (the confined C
// floor's), each timed in fresh children as root.
//   vell_confinement_cost [RUNS]
#include <errno.h>
#include <linux/capability.h>
#include <sys/wait.h>
#include <time.h>
#include <unistd.h>

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <vector>

#include "bench/floor_confinement.h"
#include "platform/capabilities.h"
#include "platform/confinement.h"
#include "platform/no_new_privileges.h"
#include "platform/syscall_filter.h"

namespace {

long now_ns() {
  timespec t;
  clock_gettime(CLOCK_MONOTONIC, &t);
  return t.tv_sec * 1000000000L + t.tv_nsec;
}

constexpr int step_count = 4;
const char* const step_names[step_count] = {
    "no new privileges", "Landlock (writes beneath one folder)",
    "capabilities (all but CAP_DAC_OVERRIDE)", "system-call filter"};

// The steps of one fresh child, vell's or the floor's, in nanoseconds.
std::vector<long> steps_of_a_child(bool floor) {
  int ends[2];
  if (pipe(ends) != 0) std::exit(1);
  if (fork() == 0) {
    // A fresh child copies its thread's page at the first write; vell's
    // steps write errno, and a started vell has written it long before.
    errno = 0;
    long at[step_count + 1];
    at[0] = now_ns();
    floor ? floor_forbid_new_privileges() : vell::platform::forbid_new_privileges();
    at[1] = now_ns();
    floor ? floor_confine_writes_beneath("/tmp") : vell::platform::confine_writes_beneath("/tmp");
    at[2] = now_ns();
    floor ? floor_keep_dac_override() : vell::platform::keep_only_capability(CAP_DAC_OVERRIDE);
    at[3] = now_ns();
    floor ? floor_filter(vell::platform::filter_length())
          : vell::platform::deny_unneeded_system_calls();
    at[4] = now_ns();
    _exit(write(ends[1], at, sizeof at) == sizeof at ? 0 : 1);
  }
  close(ends[1]);
  long at[step_count + 1];
  const bool got = read(ends[0], at, sizeof at) == sizeof at;
  close(ends[0]);
  wait(nullptr);
  if (!got) std::exit(1);
  std::vector<long> took;
  for (int step = 0; step < step_count; ++step) took.push_back(at[step + 1] - at[step]);
  return took;
}

}  // namespace

int main(int argc, char** argv) {
  const int runs = argc > 1 ? std::atoi(argv[1]) : 200;
  // Interleaved, so that the machine's drift falls on both alike.
  std::vector<long> took[2][step_count];
  for (int run = 0; run < runs; ++run)
    for (int floor = 0; floor < 2; ++floor) {
      const std::vector<long> steps = steps_of_a_child(floor);
      for (int step = 0; step < step_count; ++step) took[floor][step].push_back(steps[step]);
    }
  std::printf("\nconfining itself, median of %d fresh processes%s\n  %-42s %10s %10s %8s\n", runs,
              geteuid() == 0 ? "" : " (not root: no capabilities to drop)", "step", "vell us",
              "floor us", "ratio");
  for (int step = 0; step < step_count; ++step) {
    double median[2];
    for (int floor = 0; floor < 2; ++floor) {
      std::sort(took[floor][step].begin(), took[floor][step].end());
      median[floor] = took[floor][step][runs / 2] / 1000.0;
    }
    std::printf("  %-42s %10.1f %10.1f %8.2f\n", step_names[step], median[0], median[1],
                median[0] / median[1]);
  }
  return 0;
}
