#include <errno.h>
#include <fcntl.h>
#include <gtest/gtest.h>
#include <linux/capability.h>
#include <linux/filter.h>
#include <linux/seccomp.h>
#include <sched.h>
#include <sys/mount.h>
#include <sys/prctl.h>
#include <sys/ptrace.h>
#include <sys/socket.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

#include <fstream>
#include <functional>
#include <map>
#include <sstream>
#include <string>

#include "platform/capabilities.h"
#include "platform/syscall_filter.h"

namespace vell::platform {
namespace {

struct refusal_case {
  const char* name;
  std::function<long()> call;
  int error;  // errno after the call, 0 when it must work, any_but_eperm for a call let through
};
constexpr int any_but_eperm = -1;

// A raw call with arguments that make it fail harmlessly when let through.
refusal_case raw(const char* name, long number, long a, long b, long c, bool refused) {
  return {name, [=] { return syscall(number, a, b, c); }, refused ? EPERM : any_but_eperm};
}

// errno after each call, in a child that confined itself as vell does, and
// its /proc/self/status lines by name, so that this test process stays free.
struct child_report {
  std::map<std::string, int> errors;
  std::map<std::string, std::string> status;
};

child_report run_confined(const std::vector<refusal_case>& cases) {
  int pipe_ends[2];
  if (pipe(pipe_ends) != 0) return {};
  const pid_t child = fork();
  if (child == 0) {
    close(pipe_ends[0]);
    errno = EXDEV;
    keep_only_capability(CAP_DAC_OVERRIDE);
    deny_unneeded_system_calls();
    std::ostringstream report;
    report << "errno " << (errno == EXDEV ? 0 : errno) << "\n";
    for (const auto& c : cases) {
      errno = 0;
      report << c.name << " " << (c.call() < 0 ? errno : 0) << "\n";
    }
    std::ifstream status("/proc/self/status");
    for (std::string line; std::getline(status, line);) report << line << "\n";
    const std::string text = report.str();
    _exit(write(pipe_ends[1], text.data(), text.size()) == ssize_t(text.size()) ? 0 : 1);
  }
  close(pipe_ends[1]);
  std::string text;
  char buffer[4096];
  for (ssize_t n; (n = read(pipe_ends[0], buffer, sizeof buffer)) > 0;) text.append(buffer, n);
  close(pipe_ends[0]);
  waitpid(child, nullptr, 0);
  child_report report;
  std::istringstream lines(text);
  for (std::string line; std::getline(lines, line);) {
    const auto colon = line.find(':');
    if (colon != std::string::npos) {
      const auto value = line.find_first_not_of(" \t", colon + 1);
      report.status[line.substr(0, colon)] = value == std::string::npos ? "" : line.substr(value);
    } else {
      const auto space = line.rfind(' ');
      report.errors[line.substr(0, space)] = std::stoi(line.substr(space + 1));
    }
  }
  return report;
}

// Whether a child can install a filter at all, apart from the code under
// test: qemu-user refuses every filter, as do kernels without seccomp.
bool kernel_takes_filters() {
  const pid_t child = fork();
  if (child == 0) {
    sock_filter allow = BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ALLOW);
    const sock_fprog program{.len = 1, .filter = &allow};
    _exit(prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0) == 0 &&
                  prctl(PR_SET_SECCOMP, SECCOMP_MODE_FILTER, &program) == 0
              ? 0
              : 1);
  }
  int status = 0;
  waitpid(child, &status, 0);
  return WIFEXITED(status) && WEXITSTATUS(status) == 0;
}

TEST(SelfConfinement, KeepsOnlyDacOverride) {
  const child_report report = run_confined({});
  EXPECT_EQ(report.errors.at("errno"), 0) << "errno must be left as it was";
  // Root keeps exactly the one; anyone else keeps at most it.
  const unsigned long long dac_override = 1ull << CAP_DAC_OVERRIDE;
  for (const char* set : {"CapEff", "CapPrm", "CapInh", "CapBnd", "CapAmb"}) {
    const unsigned long long held = std::stoull(report.status.at(set), nullptr, 16);
    EXPECT_EQ(held & ~dac_override, 0u) << set;
    if (geteuid() == 0 && std::string(set) != "CapInh" && std::string(set) != "CapAmb")
      EXPECT_EQ(held, dac_override) << set;
  }
}

TEST(SelfConfinement, RefusesWhatVellHasNoUseFor) {
  if (!kernel_takes_filters())
    GTEST_SKIP() << "this kernel (or emulator) takes no seccomp filter: " << strerror(errno);
  char dir[] = "/tmp/vell-filter.XXXXXX";
  ASSERT_NE(mkdtemp(dir), nullptr);
  const std::string file = std::string(dir) + "/file";
  std::vector<refusal_case> cases = {
      {"mount", [&] { return mount("none", dir, "tmpfs", 0, nullptr); }, EPERM},
      {"init_module", [] { return syscall(SYS_init_module, nullptr, 0, ""); }, EPERM},
      {"socket", [] { return socket(AF_UNIX, SOCK_STREAM, 0); }, EPERM},
      {"unshare", [] { return unshare(CLONE_NEWNS); }, EPERM},
      {"settimeofday", [] { return syscall(SYS_settimeofday, nullptr, nullptr); }, EPERM},
      {"file work",
       [&] {
         const int fd = open(file.c_str(), O_RDWR | O_CREAT | O_CLOEXEC, 0644);
         const bool ok = fd >= 0 && write(fd, "x", 1) == 1 && lseek(fd, 0, SEEK_SET) == 0;
         char back = 0;
         const bool read_back = ok && read(fd, &back, 1) == 1 && back == 'x';
         if (fd >= 0) close(fd);
         return read_back && unlink(file.c_str()) == 0 ? 0L : -1L;
       },
       0},
      // Denied calls at either end of a run of denied numbers (on x86-64), and
      // the allowed calls beside them, which must pass.
      raw("socket, alone", SYS_socket, -1, 0, 0, true),
      raw("connect, after it", SYS_connect, -1, 0, 0, false),
      raw("socketpair", SYS_socketpair, -1, 0, 0, true),
      raw("setsockopt, after it", SYS_setsockopt, -1, 0, 0, false),
      raw("fchmod, before fchown", SYS_fchmod, -1, 0, 0, false),
      raw("fchown", SYS_fchown, -1, 0, 0, true),
      raw("setuid", SYS_setuid, -1, 0, 0, true),
      raw("setgid, after it", SYS_setgid, -1, 0, 0, false),
      raw("capset", SYS_capset, 0, 0, 0, true),
      raw("getpriority, before setpriority", SYS_getpriority, 999, 0, 0, false),
      raw("setpriority", SYS_setpriority, 999, 0, 0, true),
      raw("sched_setparam", SYS_sched_setparam, -1, 0, 0, true),
      raw("sched_getparam, between", SYS_sched_getparam, -1, 0, 0, false),
      raw("sched_setscheduler", SYS_sched_setscheduler, -1, 0, 0, true),
      raw("sched_getscheduler, after it", SYS_sched_getscheduler, -1, 0, 0, false),
      raw("chroot, end of a run", SYS_chroot, 0, 0, 0, true),
      raw("acct, start of a run", SYS_acct, 1, 0, 0, true),
      raw("sched_setaffinity", SYS_sched_setaffinity, 0, 0, 0, true),
      raw("sched_getaffinity, after it", SYS_sched_getaffinity, 0, 0, 0, false),
      raw("bpf", SYS_bpf, -1, 0, 0, true),
      raw("set_mempolicy_home_node, the last", SYS_set_mempolicy_home_node, 0, 0, 0, true),
  };
#if !defined(__SANITIZE_ADDRESS__) && !(defined(__has_feature) && __has_feature(address_sanitizer))
  // Builds with a leak check keep ptrace: the check stops the process's threads with it at exit.
  cases.push_back({"ptrace", [] { return ptrace(PTRACE_TRACEME, 0, nullptr, nullptr); }, EPERM});
#endif
  child_report report = run_confined(cases);
  rmdir(dir);
  EXPECT_EQ(report.status["Seccomp"], "2");
  EXPECT_EQ(report.errors.at("errno"), 0) << "errno must be left as it was";
  for (const auto& c : cases) {
    if (c.error == any_but_eperm)
      EXPECT_NE(report.errors.at(c.name), EPERM) << c.name;
    else
      EXPECT_EQ(report.errors.at(c.name), c.error) << c.name;
  }
}

}  // namespace
}  // namespace vell::platform
