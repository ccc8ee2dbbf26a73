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

#include <fstream>
#include <sstream>
#include <string>
#include <vector>

#include "platform/capabilities.h"
#include "platform/syscall_filter.h"

namespace vell::platform {
namespace {

// A call with arguments that make it fail harmlessly should it get through.
struct call_case {
  const char* name;
  long number, a, b, c;
  int refused_with;  // 0: it must get through (any other result)
};

// In a child that confined itself as vell does: errno after confining (0 when
// left as it was), then each call's errno; and the child's /proc status,
// read once it ended, before it is reaped.
std::pair<std::vector<int>, std::string> run_confined(const std::vector<call_case>& calls) {
  int ends[2];
  if (pipe(ends) != 0) return {};
  const pid_t child = fork();
  if (child == 0) {
    errno = EXDEV;
    keep_only_capability(CAP_DAC_OVERRIDE);
    deny_unneeded_system_calls();
    std::vector<int> errors{errno == EXDEV ? 0 : errno};
    for (const call_case& c : calls) {
      errno = 0;
      errors.push_back(syscall(c.number, c.a, c.b, c.c) < 0 ? errno : 0);
    }
    const ssize_t size = errors.size() * sizeof(int);
    _exit(write(ends[1], errors.data(), size) == size ? 0 : 1);
  }
  close(ends[1]);
  std::vector<int> errors(calls.size() + 1, -1);
  const ssize_t got = read(ends[0], errors.data(), errors.size() * sizeof(int));
  close(ends[0]);
  if (got != ssize_t(errors.size() * sizeof(int))) errors.assign(errors.size(), -1);
  siginfo_t ended;
  waitid(P_PID, child, &ended, WEXITED | WNOWAIT);
  std::ostringstream status;
  status << std::ifstream("/proc/" + std::to_string(child) + "/status").rdbuf();
  waitpid(child, nullptr, 0);
  return {errors, status.str()};
}

std::string field(const std::string& status, const std::string& name) {
  const size_t at = status.find("\n" + name + ":");
  if (at == std::string::npos) return "";
  const size_t begin = status.find_first_not_of(" \t", at + name.size() + 2);
  return status.substr(begin, status.find('\n', begin) - begin);
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

TEST(SelfConfinement, KeepsOnlyDacOverride) {
  const auto [errors, status] = run_confined({});
  EXPECT_EQ(errors[0], 0) << "errno must be left as it was";
  // Root keeps exactly the one; anyone else, at most it.
  const unsigned long long dac_override = 1ull << CAP_DAC_OVERRIDE;
  for (const std::string set : {"CapEff", "CapPrm", "CapBnd", "CapInh", "CapAmb"}) {
    const unsigned long long held = std::stoull(field(status, set), nullptr, 16);
    EXPECT_EQ(held & ~dac_override, 0u) << set;
    if (geteuid() == 0 && set != "CapInh" && set != "CapAmb") {
      EXPECT_EQ(held, dac_override) << set;
    }
  }
}

TEST(SelfConfinement, RefusesWhatVellHasNoUseFor) {
  if (!kernel_takes_filters())
    GTEST_SKIP() << "this kernel (or emulator) takes no seccomp filter: " << strerror(errno);
  std::vector<call_case> calls = {
    {"mount", SYS_mount, 0, 0, 0, EPERM},
    {"init_module", SYS_init_module, 0, 0, 0, EPERM},
    // Denied calls at either end of a run of denied numbers (on x86-64),
    // and the allowed calls beside them.
    {"socket, alone", SYS_socket, -1, 0, 0, EPERM},
    {"connect, after it", SYS_connect, -1, 0, 0, 0},
    {"socketpair", SYS_socketpair, -1, 0, 0, EPERM},
    {"setsockopt, after it", SYS_setsockopt, -1, 0, 0, 0},
    {"fchmod, before fchown", SYS_fchmod, -1, 0, 0, 0},
    {"fchown", SYS_fchown, -1, 0, 0, EPERM},
    {"setuid", SYS_setuid, -1, 0, 0, EPERM},
    {"setgid, after it", SYS_setgid, -1, 0, 0, 0},
    {"capset", SYS_capset, 0, 0, 0, EPERM},
    {"getpriority, before setpriority", SYS_getpriority, 999, 0, 0, 0},
    {"setpriority", SYS_setpriority, 999, 0, 0, EPERM},
    {"sched_getparam, between two", SYS_sched_getparam, -1, 0, 0, 0},
    {"sched_setscheduler", SYS_sched_setscheduler, -1, 0, 0, EPERM},
    {"sched_getscheduler, after it", SYS_sched_getscheduler, -1, 0, 0, 0},
    {"chroot, end of a run", SYS_chroot, 0, 0, 0, EPERM},
    {"sync, before a run", SYS_sync, 0, 0, 0, 0},
    {"sched_getaffinity", SYS_sched_getaffinity, 0, 0, 0, 0},
    {"bpf", SYS_bpf, -1, 0, 0, EPERM},
    {"set_mempolicy_home_node, the last", SYS_set_mempolicy_home_node, 0, 0, 0, EPERM},
    // clone3 must look unknown, so that a C library falls back to clone;
    // clone is refused a new namespace only (flags it then finds invalid).
    {"clone3", SYS_clone3, 0, 0, 0, ENOSYS},
    {"clone, a new namespace", SYS_clone, CLONE_NEWNS | CLONE_FS, 0, 0, EPERM},
    {"clone, a new user namespace", SYS_clone, CLONE_NEWUSER | CLONE_THREAD, 0, 0, EPERM},
    {"clone, no namespace", SYS_clone, CLONE_THREAD, 0, 0, 0},
#if defined(__x86_64__)
    {"getpid through x32", 0x40000000 | SYS_getpid, 0, 0, 0, EPERM},
#endif
  };
  if (!filter_keeps_ptrace) calls.push_back({"ptrace", SYS_ptrace, 0, 0, 0, EPERM});
  const auto [errors, status] = run_confined(calls);
  EXPECT_EQ(field(status, "Seccomp"), "2");
  EXPECT_EQ(errors[0], 0) << "errno must be left as it was";
  for (size_t i = 0; i < calls.size(); ++i) {
    if (calls[i].refused_with) {
      EXPECT_EQ(errors[i + 1], calls[i].refused_with) << calls[i].name;
    } else {
      EXPECT_NE(errors[i + 1], EPERM) << calls[i].name;
    }
  }
}

}  // namespace
}  // namespace vell::platform
