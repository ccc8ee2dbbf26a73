#include <errno.h>
#include <fcntl.h>
#include <gtest/gtest.h>
#include <linux/capability.h>
#include <linux/landlock.h>
#include <sched.h>
#include <signal.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

#include <array>
#include <cstdio>
#include <cstdlib>
#include <string>
#include <vector>

#include "platform/capabilities.h"
#include "platform/confinement.h"
#include "platform/no_new_privileges.h"
#include "platform/run_limit.h"
#include "platform/syscall_filter.h"

namespace vell::platform {
namespace {

// A call whose arguments make it fail harmlessly should it get through.
struct call_case {
  const char* name;
  long number;
  std::array<long, 3> arguments;
  int refused_with;  // 0: neither the filter nor Landlock may refuse it
};

// A child bounds itself as vell's main does, in its order: its run time
// (SIGALRM ignored and blocked by its caller), no new privileges, its writes
// beneath `inside` (after a confinement beneath a missing folder, which must
// change nothing), its capabilities, its system calls. It tries each call and
// each call of another ABI, prints each result that differs from its case and
// exits with their count (errno not left as it was counts too); with none it
// waits, and SIGALRM must end it. Returns the wait status. That only
// CAP_DAC_OVERRIDE is left is checked at every boot, on vell's own /proc status.
int bounded_child(const std::string& inside, const std::vector<call_case>& calls) {
  const pid_t child = fork();
  if (child == 0) {
    sigset_t alarm_only;
    sigemptyset(&alarm_only);
    sigaddset(&alarm_only, SIGALRM);
    sigprocmask(SIG_BLOCK, &alarm_only, nullptr);
    signal(SIGALRM, SIG_IGN);
    errno = EXDEV;
    limit_run_time(1);
    forbid_new_privileges();
    confine_writes_beneath((inside + "/missing").c_str());
    confine_writes_beneath(inside.c_str());
    keep_only_capability(CAP_DAC_OVERRIDE);
    deny_unneeded_system_calls();
    int mismatches = errno != EXDEV;
    for (const call_case& c : calls) {
      errno = 0;
      const auto [first, second, third] = c.arguments;
      const int error = syscall(c.number, first, second, third, 0) < 0 ? errno : 0;
      if (c.refused_with ? error != c.refused_with : error == EPERM || error == EACCES) {
        std::fprintf(stderr, "%s: errno %d\n", c.name, error);
        ++mismatches;
      }
    }
#if defined(__x86_64__)
    // An i386 call: the kernel looks its number up in that architecture's
    // table, where 20 is getpid (writev here), so the filter must refuse by
    // the architecture.
    long result;
    asm volatile("int $0x80" : "=a"(result) : "0"(20L) : "r8", "r9", "r10", "r11", "memory");
    if (result != -EPERM) {
      std::fprintf(stderr, "getpid through int 0x80: %ld\n", result);
      ++mismatches;
    }
#endif
#ifdef VELL_AARCH32_PROGRAM
    // The same for an AArch32 program, which ends by SIGILL when refused.
    if (const pid_t program = fork(); program == 0) {
      execl(VELL_AARCH32_PROGRAM, VELL_AARCH32_PROGRAM, nullptr);
      _exit(127);
    } else if (int status = 0; waitpid(program, &status, 0) != program || !WIFSIGNALED(status) ||
                               WTERMSIG(status) != SIGILL) {
      std::fprintf(stderr, "getpid of an AArch32 program: wait status %d\n", status);
      ++mismatches;
    }
#endif
    if (mismatches) _exit(mismatches);
    for (;;) pause();
  }
  int status = 0;
  for (int tenth = 0; tenth < 30 && waitpid(child, &status, WNOHANG) != child; ++tenth)
    usleep(100000);
  if (status == 0) {  // still running
    kill(child, SIGKILL);
    waitpid(child, nullptr, 0);
  }
  return status;
}

// Every kernel the suite runs on has Landlock and seccomp, the ARM ones too
// (their presets run in an emulated machine): a missing one fails here.
TEST(SelfConfinement, BoundsAStartAsVellDoes) {
  char top[] = "/tmp/vell-confinement.XXXXXX";
  ASSERT_NE(mkdtemp(top), nullptr);
  const std::string inside = std::string(top) + "/db";
  ASSERT_EQ(mkdir(inside.c_str(), 0755), 0);
  // Denied calls at either end of a run of denied numbers (on x86-64), and
  // the allowed calls beside them; clone3 must look unknown, so that a C
  // library falls back to clone, which is refused a new namespace only.
  // prlimit64 is refused a new limit in either word of its pointer, and
  // may read one. Files may be created only inside, and truncated only
  // there where Landlock has that right (from its third version on).
  rlimit limit{};
  const std::string made = inside + "/timezone", beside = std::string(top) + "/beside",
                    dot_dot = inside + "/../through-dot-dot", kept = std::string(top) + "/kept";
  ASSERT_EQ(close(open(kept.c_str(), O_WRONLY | O_CREAT | O_CLOEXEC, 0644)), 0);
  const long abi =
      syscall(SYS_landlock_create_ruleset, nullptr, 0, LANDLOCK_CREATE_RULESET_VERSION);
  const long create = O_WRONLY | O_CREAT | O_CLOEXEC;
  auto at = [](const std::string& path) { return reinterpret_cast<long>(path.c_str()); };
  std::vector<call_case> calls = {
    {"create inside", SYS_openat, {AT_FDCWD, at(made), create}, 0},
    {"create beside", SYS_openat, {AT_FDCWD, at(beside), create}, EACCES},
    {"create through ..", SYS_openat, {AT_FDCWD, at(dot_dot), create}, EACCES},
    {"truncate beside", SYS_truncate, {at(kept), 0}, abi >= 3 ? EACCES : 0},
    {"mount", SYS_mount, {0}, EPERM},
    {"socket, alone", SYS_socket, {-1}, EPERM},
    {"connect, after it", SYS_connect, {-1}, 0},
    {"fchmod, before fchown", SYS_fchmod, {-1}, 0},
    {"fchown", SYS_fchown, {-1}, EPERM},
    {"setuid", SYS_setuid, {-1}, EPERM},
    {"setgid, after it", SYS_setgid, {-1}, 0},
    {"sched_getparam, between two", SYS_sched_getparam, {-1}, 0},
    {"sched_setscheduler", SYS_sched_setscheduler, {-1}, EPERM},
    {"chroot, end of a run", SYS_chroot, {0}, EPERM},
    {"sync, before a run", SYS_sync, {0}, 0},
    {"set_mempolicy_home_node, the last", SYS_set_mempolicy_home_node, {0}, EPERM},
    {"clone3", SYS_clone3, {0}, ENOSYS},
    {"clone, a new namespace", SYS_clone, {CLONE_NEWNS | CLONE_FS}, EPERM},
    {"clone, a new user namespace", SYS_clone, {CLONE_NEWUSER | CLONE_THREAD}, EPERM},
    {"clone, no namespace", SYS_clone, {CLONE_THREAD}, 0},
    {"prlimit64, setting a limit",
     SYS_prlimit64,
     {-1, RLIMIT_NOFILE, reinterpret_cast<long>(&limit)},
     EPERM},
    {"prlimit64, reading a limit", SYS_prlimit64, {0, RLIMIT_NOFILE, 0}, 0},
#if defined(__x86_64__)
    {"prlimit64, a limit above 4 GiB", SYS_prlimit64, {-1, RLIMIT_NOFILE, 1L << 32}, EPERM},
    {"getpid through x32", 0x40000000 | SYS_getpid, {0}, EPERM},
#endif
  };
  if (!filter_keeps_ptrace) calls.push_back({"ptrace", SYS_ptrace, {0}, EPERM});
  const int status = bounded_child(inside, calls);
  EXPECT_TRUE(WIFSIGNALED(status) && WTERMSIG(status) == SIGALRM) << "wait status " << status;
  std::system(("rm -rf " + std::string(top)).c_str());
}

}  // namespace
}  // namespace vell::platform
