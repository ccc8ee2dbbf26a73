// vell's own system-call filter (seccomp), so that under every init a fault
// in vell, or what the updater's folder leads it to, cannot reach what vell
// has no use for.
#ifndef VELL_PLATFORM_SYSCALL_FILTER_H_
#define VELL_PLATFORM_SYSCALL_FILTER_H_

// A leak sanitizer stops the process's threads with ptrace for its check at
// exit, so builds with one keep that call.
#if defined(__SANITIZE_ADDRESS__)
#define VELL_LEAK_CHECK_AT_EXIT 1
#elif defined(__has_feature)
#if __has_feature(address_sanitizer) || __has_feature(leak_sanitizer)
#define VELL_LEAK_CHECK_AT_EXIT 1
#endif
#endif

namespace vell::platform {

#ifdef VELL_LEAK_CHECK_AT_EXIT
inline constexpr bool filter_keeps_ptrace = true;
#else
inline constexpr bool filter_keeps_ptrace = false;
#endif

/// From now on these system calls fail with EPERM in this process: loading
/// modules, mounting, rebooting and kexec, swap, setting clocks, raw I/O,
/// privileged calls (changing users, groups, owners, capabilities, host
/// names, accounting, quotas), debugging (ptrace, but for builds with a leak
/// sanitizer, whose check at exit needs it) and performance events, obsolete
/// calls, resource limits and scheduling, CPU emulation, creating sockets,
/// new namespaces, keyrings and bpf; and every system call of a foreign
/// architecture (x32 and i386 on x86-64, AArch32 on arm64). A deny-list, so that no library or
/// error path meets a refusal it did not expect. The kernel asks for
/// no-new-privileges first (or CAP_SYS_ADMIN). Where the kernel has no
/// seccomp, or on an architecture vell does not know, nothing changes. Never
/// prints, never throws, and leaves errno as it found it.
void deny_unneeded_system_calls();

/// How many instructions that filter has, 0 where there is none: the
/// benchmark's confined floor installs one as long.
unsigned filter_length();

}  // namespace vell::platform

#endif  // VELL_PLATFORM_SYSCALL_FILTER_H_
