#include "platform/syscall_filter.h"

#include <errno.h>
#include <linux/audit.h>
#include <linux/filter.h>
#include <linux/seccomp.h>
#include <sched.h>
#include <stddef.h>
#include <sys/prctl.h>
#include <sys/syscall.h>

#include <array>
#include <iterator>
#include <utility>

#if defined(__x86_64__)
#define VELL_AUDIT_ARCH AUDIT_ARCH_X86_64
#elif defined(__aarch64__)
#define VELL_AUDIT_ARCH AUDIT_ARCH_AARCH64
#elif defined(__arm__) && __BYTE_ORDER__ == __ORDER_LITTLE_ENDIAN__
#define VELL_AUDIT_ARCH AUDIT_ARCH_ARM
#endif

namespace vell::platform {
namespace {

#ifdef VELL_AUDIT_ARCH
// The groups a service manager calls @clock, @cpu-emulation, @debug,
// @module, @mount, @obsolete, @privileged, @raw-io, @reboot, @resources and
// @swap, as this architecture has them, and sockets, namespaces, keyrings
// and bpf.
constexpr long denied[] = {
    SYS_acct,
    SYS_add_key,
    SYS_adjtimex,
    SYS_bpf,
    SYS_capset,
    SYS_chroot,
    SYS_clock_adjtime,
    SYS_clock_settime,
    SYS_delete_module,
    SYS_fanotify_init,
    SYS_fanotify_mark,
    SYS_fchown,
    SYS_fchownat,
    SYS_finit_module,
    SYS_fsconfig,
    SYS_fsmount,
    SYS_fsopen,
    SYS_fspick,
    SYS_init_module,
    SYS_ioprio_set,
    SYS_kexec_file_load,
    SYS_kexec_load,
    SYS_keyctl,
    SYS_lookup_dcookie,
    SYS_mbind,
    SYS_migrate_pages,
    SYS_mount,
    SYS_mount_setattr,
    SYS_move_mount,
    SYS_move_pages,
    SYS_nfsservctl,
    SYS_open_by_handle_at,
    SYS_open_tree,
    SYS_perf_event_open,
    SYS_pidfd_getfd,
    SYS_pivot_root,
    SYS_quotactl,
    SYS_quotactl_fd,
    SYS_reboot,
    SYS_request_key,
    SYS_sched_setaffinity,
    SYS_sched_setattr,
    SYS_sched_setparam,
    SYS_sched_setscheduler,
    SYS_set_mempolicy,
    SYS_set_mempolicy_home_node,
    SYS_setdomainname,
    SYS_setfsuid,
    SYS_setgroups,
    SYS_sethostname,
    SYS_setns,
    SYS_setpriority,
    SYS_setresuid,
    SYS_setreuid,
    SYS_setrlimit,
    SYS_settimeofday,
    SYS_setuid,
    SYS_socket,
    SYS_socketpair,
    SYS_swapoff,
    SYS_swapon,
    SYS_umount2,
    SYS_unshare,
    SYS_vhangup,
#ifndef VELL_LEAK_CHECK_AT_EXIT
    SYS_ptrace,
#endif
#if defined(__x86_64__)
    SYS__sysctl,
    SYS_afs_syscall,
    SYS_chown,
    SYS_create_module,
    SYS_get_kernel_syms,
    SYS_getpmsg,
    SYS_ioperm,
    SYS_iopl,
    SYS_lchown,
    SYS_modify_ldt,
    SYS_putpmsg,
    SYS_query_module,
    SYS_security,
    SYS_sysfs,
    SYS_tuxcall,
    SYS_uselib,
    SYS_ustat,
    SYS_vserver,
#elif defined(__arm__)
    SYS__sysctl,
    SYS_bdflush,
    SYS_chown,
    SYS_chown32,
    SYS_clock_adjtime64,
    SYS_clock_settime64,
    SYS_fchown32,
    SYS_lchown,
    SYS_lchown32,
    SYS_nice,
    SYS_pciconfig_iobase,
    SYS_pciconfig_read,
    SYS_pciconfig_write,
    SYS_setfsuid32,
    SYS_setgroups32,
    SYS_setresuid32,
    SYS_setreuid32,
    SYS_setuid32,
    SYS_sysfs,
    SYS_uselib,
    SYS_ustat,
    SYS_vserver,
#endif
};

constexpr __u32 new_namespaces = CLONE_NEWNS | CLONE_NEWCGROUP | CLONE_NEWUTS | CLONE_NEWIPC |
                                 CLONE_NEWUSER | CLONE_NEWPID | CLONE_NEWNET;
// A filter reads arguments a 32-bit word at a time.
constexpr __u32 low_word = __BYTE_ORDER__ == __ORDER_BIG_ENDIAN__ ? sizeof(__u32) : 0;
// clone's flags are its first argument; their low word is where the flags are.
constexpr __u32 clone_flags = offsetof(seccomp_data, args[0]) + low_word;

// prlimit64's third argument points at the new limit, null when it only reads.
constexpr __u32 new_limit_low = offsetof(seccomp_data, args[2]) + low_word;
constexpr __u32 new_limit_high = offsetof(seccomp_data, args[2]) + sizeof(__u32) - low_word;

// What the filter does with a call number. clone3 passes its flags in memory
// that a filter cannot read, so it fails as unknown (a C library then falls
// back to clone); clone is refused with a flag for a new namespace; prlimit64,
// through which the C library sets limits, is refused a new limit.
enum answer : unsigned char { allow, refuse, unknown, check_clone_flags, check_new_limit };

struct call {
  long number;
  answer says;
};
constexpr call checked[] = {
    {SYS_clone3, unknown}, {SYS_clone, check_clone_flags}, {SYS_prlimit64, check_new_limit}};

// The call numbers as intervals of one answer each, in order: interval i
// holds the numbers from start[i] up to the next start.
constexpr size_t call_count = std::size(denied) + std::size(checked);
struct interval_table {
  std::array<__u32, 2 * call_count + 2> start{};
  std::array<answer, 2 * call_count + 2> says{};
  size_t count = 0;
  constexpr void add(__u32 from, answer a) {
    if (count > 0 && start[count - 1] == from) --count;  // an empty interval
    if (count > 0 && says[count - 1] == a) return;
    start[count] = from;
    says[count++] = a;
  }
};
constexpr interval_table intervals = [] {
  std::array<call, call_count> calls{};
  for (size_t i = 0; i < std::size(denied); ++i) calls[i] = {denied[i], refuse};
  for (size_t i = 0; i < std::size(checked); ++i) calls[std::size(denied) + i] = checked[i];
  for (size_t i = 1; i < calls.size(); ++i)
    for (size_t j = i; j > 0 && calls[j - 1].number > calls[j].number; --j)
      std::swap(calls[j - 1], calls[j]);
  interval_table table;
  table.add(0, allow);
  for (const call& c : calls) {
    table.add(c.number, c.says);
    table.add(c.number + 1, allow);
  }
#if defined(__x86_64__)
  // The x32 ABI shares the architecture and sets this bit of the number.
  table.add(0x40000000, refuse);
#endif
  return table;
}();
static_assert(intervals.count >= 2);

constexpr sock_filter statement(__u16 code, __u32 k) { return BPF_STMT(code, k); }
constexpr __u8 distance(size_t from, size_t to) {
  if (to <= from || to - from - 1 > 255) throw "a jump of the filter reaches past 255 instructions";
  return to - from - 1;
}

// The kernel runs a filter once for every call number when it is installed,
// to learn which calls it may let through without running it again; that
// run, and the filter's size, are most of what installing costs. So the
// filter checks the architecture and then searches the intervals, its
// branches jumping to shared answers at its end: a few instructions run per
// number.
constexpr size_t search_at = 3;
constexpr size_t answers_at = search_at + intervals.count - 1;
constexpr size_t where(answer a) {
  switch (a) {
    case check_new_limit:
      return answers_at;
    case check_clone_flags:
      return answers_at + 4;
    case refuse:
      return answers_at + 6;
    case allow:
      return answers_at + 7;
    case unknown:
      return answers_at + 8;
  }
  return 0;
}
using program_code = std::array<sock_filter, answers_at + 9>;
// Writes the search of intervals low to high (not included) at `at`;
// returns where it ended.
constexpr size_t search(program_code& code, size_t at, size_t low, size_t high) {
  const size_t middle = low + (high - low) / 2;
  size_t next = at + 1;
  const size_t below = middle - low == 1 ? where(intervals.says[low]) : next;
  if (middle - low > 1) next = search(code, next, low, middle);
  const size_t above = high - middle == 1 ? where(intervals.says[middle]) : next;
  if (high - middle > 1) next = search(code, next, middle, high);
  code[at] = BPF_JUMP(BPF_JMP | BPF_JGE | BPF_K, intervals.start[middle], distance(at, above),
                      distance(at, below));
  return next;
}
constexpr program_code program = [] {
  program_code code{};
  code[0] = statement(BPF_LD | BPF_W | BPF_ABS, offsetof(seccomp_data, arch));
  code[1] = BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, VELL_AUDIT_ARCH, 0, distance(1, where(refuse)));
  code[2] = statement(BPF_LD | BPF_W | BPF_ABS, offsetof(seccomp_data, nr));
  if (search(code, search_at, 0, intervals.count) != answers_at) throw "the search is misplaced";
  const size_t refused = where(refuse), allowed = where(allow);
  code[answers_at] = statement(BPF_LD | BPF_W | BPF_ABS, new_limit_low);
  code[answers_at + 1] =
      BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, 0, 0, distance(answers_at + 1, refused));
  code[answers_at + 2] = statement(BPF_LD | BPF_W | BPF_ABS, new_limit_high);
  code[answers_at + 3] = BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, 0, distance(answers_at + 3, allowed),
                                  distance(answers_at + 3, refused));
  code[answers_at + 4] = statement(BPF_LD | BPF_W | BPF_ABS, clone_flags);
  code[answers_at + 5] = BPF_JUMP(BPF_JMP | BPF_JSET | BPF_K, new_namespaces, 0, 1);
  code[refused] = statement(BPF_RET | BPF_K, SECCOMP_RET_ERRNO | EPERM);
  code[allowed] = statement(BPF_RET | BPF_K, SECCOMP_RET_ALLOW);
  code[where(unknown)] = statement(BPF_RET | BPF_K, SECCOMP_RET_ERRNO | ENOSYS);
  return code;
}();
#endif

}  // namespace

void deny_unneeded_system_calls() {
#ifdef VELL_AUDIT_ARCH
  const int saved_errno = errno;
  const sock_fprog bpf{.len = program.size(), .filter = const_cast<sock_filter*>(program.data())};
  prctl(PR_SET_SECCOMP, SECCOMP_MODE_FILTER, &bpf);
  errno = saved_errno;
#endif
}

unsigned filter_length() {
#ifdef VELL_AUDIT_ARCH
  return program.size();
#else
  return 0;
#endif
}

}  // namespace vell::platform
