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
// clone's flags are its first argument; their low word is where the flags are.
constexpr __u32 clone_flags =
    offsetof(seccomp_data, args[0]) + (__BYTE_ORDER__ == __ORDER_BIG_ENDIAN__ ? sizeof(__u32) : 0);

constexpr sock_filter statement(__u16 code, __u32 k) { return BPF_STMT(code, k); }
constexpr sock_filter jump(__u16 code, __u32 k, __u8 if_true, __u8 if_false) {
  return BPF_JUMP(code, k, if_true, if_false);
}
constexpr sock_filter allow = statement(BPF_RET | BPF_K, SECCOMP_RET_ALLOW);
constexpr sock_filter refuse = statement(BPF_RET | BPF_K, SECCOMP_RET_ERRNO | EPERM);

// The call numbers where the answer changes, from allowed (below the first)
// to refused and back: the denied calls as runs of consecutive numbers.
constexpr size_t call_count = std::size(denied);
constexpr std::array<long, call_count> sorted_calls = [] {
  std::array<long, call_count> calls{};
  for (size_t i = 0; i < call_count; ++i) {
    size_t j = i;
    for (; j > 0 && calls[j - 1] > denied[i]; --j) calls[j] = calls[j - 1];
    calls[j] = denied[i];
  }
  return calls;
}();
constexpr size_t change_count = [] {
  size_t runs = 0;
  for (size_t i = 0; i < call_count; ++i)
    runs += i == 0 || sorted_calls[i] != sorted_calls[i - 1] + 1;
  return 2 * runs;
}();
constexpr std::array<__u32, change_count> changes = [] {
  std::array<__u32, change_count> at{};
  size_t n = 0;
  for (size_t i = 0; i < call_count; ++i) {
    if (i == 0 || sorted_calls[i] != sorted_calls[i - 1] + 1) at[n++] = sorted_calls[i];
    if (i + 1 == call_count || sorted_calls[i + 1] != sorted_calls[i] + 1)
      at[n++] = sorted_calls[i] + 1;
  }
  return at;
}();

// Before the search: another architecture's calls (and on x86-64 those of
// the x32 ABI, which shares the architecture and sets this bit) are refused;
// clone3 passes its flags in memory that a filter cannot read, so it fails
// as unknown (a C library then falls back to clone); clone is refused with
// a flag for a new namespace.
constexpr sock_filter head[] = {
    statement(BPF_LD | BPF_W | BPF_ABS, offsetof(seccomp_data, arch)),
    jump(BPF_JMP | BPF_JEQ | BPF_K, VELL_AUDIT_ARCH, 1, 0),
    refuse,
    statement(BPF_LD | BPF_W | BPF_ABS, offsetof(seccomp_data, nr)),
#if defined(__x86_64__)
    jump(BPF_JMP | BPF_JGE | BPF_K, 0x40000000, 0, 1),
    refuse,
#endif
    jump(BPF_JMP | BPF_JEQ | BPF_K, SYS_clone3, 0, 1),
    statement(BPF_RET | BPF_K, SECCOMP_RET_ERRNO | ENOSYS),
    jump(BPF_JMP | BPF_JEQ | BPF_K, SYS_clone, 0, 4),
    statement(BPF_LD | BPF_W | BPF_ABS, clone_flags),
    jump(BPF_JMP | BPF_JSET | BPF_K, new_namespaces, 1, 0),
    allow,
    refuse,
    // The search expects the call number again.
    statement(BPF_LD | BPF_W | BPF_ABS, offsetof(seccomp_data, nr)),
};

// Then a binary search of the changes: the kernel runs a filter once for
// every call number when it is installed, to learn which calls it may let
// through without running it, and the install costs about 2 microseconds per
// instruction of a filter that lists every call; a search has half the
// instructions and runs a few of them.
constexpr size_t search_size = 2 * change_count + 1;
// Writes the search for a call number with at least `low` and fewer than
// `high` changes at or below it, from `at`; returns where it ended.
constexpr size_t search(std::array<sock_filter, search_size>& code, size_t at, size_t low,
                        size_t high) {
  if (low == high) {
    code[at] = low % 2 ? refuse : allow;
    return at + 1;
  }
  const size_t middle = low + (high - low) / 2;
  const size_t below = 2 * (middle - low) + 1;
  code[at] = jump(BPF_JMP | BPF_JGE | BPF_K, changes[middle], below, 0);
  return search(code, search(code, at + 1, low, middle), middle + 1, high);
}
constexpr std::array<sock_filter, std::size(head) + search_size> program = [] {
  std::array<sock_filter, search_size> tree{};
  search(tree, 0, 0, change_count);
  std::array<sock_filter, std::size(head) + search_size> all{};
  for (size_t i = 0; i < std::size(head); ++i) all[i] = head[i];
  for (size_t i = 0; i < search_size; ++i) all[std::size(head) + i] = tree[i];
  return all;
}();
static_assert(2 * (change_count / 2) + 1 <= 255,
              "a jump of the search reaches past 255 instructions");
#endif

}  // namespace

void deny_unneeded_system_calls() {
#ifdef VELL_AUDIT_ARCH
  const int saved_errno = errno;
  const sock_fprog bpf{.len = program.size(), .filter = const_cast<sock_filter*>(program.data())};
  if (prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0) == 0) prctl(PR_SET_SECCOMP, SECCOMP_MODE_FILTER, &bpf);
  errno = saved_errno;
#endif
}

}  // namespace vell::platform
