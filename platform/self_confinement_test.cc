#include <errno.h>
#include <gtest/gtest.h>
#include <linux/capability.h>
#include <linux/filter.h>
#include <linux/seccomp.h>
#include <sched.h>
#include <sys/mount.h>
#include <sys/prctl.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <vector>

#include "platform/capabilities.h"
#include "platform/syscall_filter.h"

namespace vell::platform {
namespace {

// A call whose argument makes it fail harmlessly should it get through.
struct call_case {
  const char* name;
  long number, argument;
  int refused_with;  // 0: it must get through (any other result)
};

// In a child confined as vell confines itself, each call's errno against its
// case: mismatches are printed and counted in the exit status, as is errno
// not left as it was. That only CAP_DAC_OVERRIDE is left is checked at every
// boot, on vell's own /proc status.
int mismatches_when_confined(const std::vector<call_case>& calls) {
  const pid_t child = fork();
  if (child == 0) {
    errno = EXDEV;
    keep_only_capability(CAP_DAC_OVERRIDE);
    deny_unneeded_system_calls();
    int mismatches = errno != EXDEV;
    for (const call_case& c : calls) {
      errno = 0;
      const int error = syscall(c.number, c.argument, 0, 0) < 0 ? errno : 0;
      if (c.refused_with ? error != c.refused_with : error == EPERM) {
        std::fprintf(stderr, "%s: errno %d\n", c.name, error);
        ++mismatches;
      }
    }
    _exit(mismatches);
  }
  int status = 0;
  waitpid(child, &status, 0);
  return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

// Whether a child can install a filter at all, apart from the code under
// test: qemu-user takes none, nor does a kernel without seccomp.
bool kernel_takes_filters() {
  const pid_t child = fork();
  if (child == 0) {
    sock_filter allow = BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ALLOW);
    const sock_fprog program{.len = 1, .filter = &allow};
    _exit(prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0) || prctl(PR_SET_SECCOMP, 2, &program));
  }
  int status = 0;
  waitpid(child, &status, 0);
  return WIFEXITED(status) && WEXITSTATUS(status) == 0;
}

TEST(SelfConfinement, RefusesWhatVellHasNoUseFor) {
  if (!kernel_takes_filters())
    GTEST_SKIP() << "this kernel (or emulator) takes no seccomp filter: " << strerror(errno);
  // Denied calls at either end of a run of denied numbers (on x86-64), and
  // the allowed calls beside them; clone3 must look unknown, so that a C
  // library falls back to clone, which is refused a new namespace only.
  std::vector<call_case> calls = {
    {"mount", SYS_mount, 0, EPERM},
    {"socket, alone", SYS_socket, -1, EPERM},
    {"connect, after it", SYS_connect, -1, 0},
    {"fchmod, before fchown", SYS_fchmod, -1, 0},
    {"fchown", SYS_fchown, -1, EPERM},
    {"setuid", SYS_setuid, -1, EPERM},
    {"setgid, after it", SYS_setgid, -1, 0},
    {"sched_getparam, between two", SYS_sched_getparam, -1, 0},
    {"sched_setscheduler", SYS_sched_setscheduler, -1, EPERM},
    {"chroot, end of a run", SYS_chroot, 0, EPERM},
    {"sync, before a run", SYS_sync, 0, 0},
    {"set_mempolicy_home_node, the last", SYS_set_mempolicy_home_node, 0, EPERM},
    {"clone3", SYS_clone3, 0, ENOSYS},
    {"clone, a new namespace", SYS_clone, CLONE_NEWNS | CLONE_FS, EPERM},
    {"clone, a new user namespace", SYS_clone, CLONE_NEWUSER | CLONE_THREAD, EPERM},
    {"clone, no namespace", SYS_clone, CLONE_THREAD, 0},
#if defined(__x86_64__)
    {"getpid through x32", 0x40000000 | SYS_getpid, 0, EPERM},
#endif
  };
  if (!filter_keeps_ptrace) calls.push_back({"ptrace", SYS_ptrace, 0, EPERM});
  EXPECT_EQ(mismatches_when_confined(calls), 0);
}

}  // namespace
}  // namespace vell::platform
