#define _GNU_SOURCE /* O_PATH */
#include "bench/floor_confinement.h"

#include <fcntl.h>
#include <linux/audit.h>
#include <linux/capability.h>
#include <linux/filter.h>
#include <linux/landlock.h>
#include <linux/seccomp.h>
#include <stddef.h>
#include <sys/prctl.h>
#include <sys/syscall.h>
#include <unistd.h>

void floor_forbid_new_privileges(void) { prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0); }

void floor_confine_writes_beneath(const char* dir) {
  /* The rights of Landlock's second version, which every kernel with it has
   * since 5.19; what a ruleset costs does not depend on them. */
  const __u64 writes =
      LANDLOCK_ACCESS_FS_WRITE_FILE | LANDLOCK_ACCESS_FS_REMOVE_DIR |
      LANDLOCK_ACCESS_FS_REMOVE_FILE | LANDLOCK_ACCESS_FS_MAKE_CHAR | LANDLOCK_ACCESS_FS_MAKE_DIR |
      LANDLOCK_ACCESS_FS_MAKE_REG | LANDLOCK_ACCESS_FS_MAKE_SOCK | LANDLOCK_ACCESS_FS_MAKE_FIFO |
      LANDLOCK_ACCESS_FS_MAKE_BLOCK | LANDLOCK_ACCESS_FS_MAKE_SYM | LANDLOCK_ACCESS_FS_REFER;
  const struct landlock_ruleset_attr ruleset = {.handled_access_fs = writes};
  const int beneath = open(dir, O_PATH | O_DIRECTORY | O_CLOEXEC);
  const int rules = syscall(SYS_landlock_create_ruleset, &ruleset, sizeof ruleset, 0);
  const struct landlock_path_beneath_attr rule = {.allowed_access = writes, .parent_fd = beneath};
  syscall(SYS_landlock_add_rule, rules, LANDLOCK_RULE_PATH_BENEATH, &rule, 0);
  syscall(SYS_landlock_restrict_self, rules, 0);
  close(rules);
  close(beneath);
}

void floor_keep_dac_override(void) {
  struct __user_cap_header_struct header = {.version = _LINUX_CAPABILITY_VERSION_3, .pid = 0};
  struct __user_cap_data_struct sets[_LINUX_CAPABILITY_U32S_3] = {0};
  sets[0].effective = sets[0].permitted = 1u << CAP_DAC_OVERRIDE;
  syscall(SYS_capset, &header, sets);
}

enum { max_length = 512 };
static struct sock_filter code[max_length];

#if defined(__x86_64__)
#define FLOOR_AUDIT_ARCH AUDIT_ARCH_X86_64
#elif defined(__aarch64__)
#define FLOOR_AUDIT_ARCH AUDIT_ARCH_AARCH64
#else
#define FLOOR_AUDIT_ARCH AUDIT_ARCH_ARM
#endif

/* Interval i starts at 1000 + i (the first at 0): allowed and refused in
 * turn, the first allowed, so that only numbers no kernel has are refused. */
static unsigned answer(unsigned interval, unsigned refused) { return refused + !(interval & 1); }

/* Writes the search of intervals low to high (not included) at `at`;
 * returns where it ended. */
static unsigned search(unsigned at, unsigned low, unsigned high, unsigned refused) {
  const unsigned middle = low + (high - low) / 2;
  unsigned next = at + 1;
  const unsigned below = middle - low == 1 ? answer(low, refused) : next;
  if (middle - low > 1) next = search(next, low, middle, refused);
  const unsigned above = high - middle == 1 ? answer(middle, refused) : next;
  if (high - middle > 1) next = search(next, middle, high, refused);
  code[at] = (struct sock_filter)BPF_JUMP(BPF_JMP | BPF_JGE | BPF_K, 1000 + middle, above - at - 1,
                                          below - at - 1);
  return next;
}

void floor_filter(unsigned length) {
  if (length < 8 || length > max_length) return;
  /* Three instructions ahead of the search, two answers after it. */
  const unsigned intervals = length - 4, refused = length - 2;
  code[0] =
      (struct sock_filter)BPF_STMT(BPF_LD | BPF_W | BPF_ABS, offsetof(struct seccomp_data, arch));
  code[1] =
      (struct sock_filter)BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, FLOOR_AUDIT_ARCH, 0, refused - 2);
  code[2] =
      (struct sock_filter)BPF_STMT(BPF_LD | BPF_W | BPF_ABS, offsetof(struct seccomp_data, nr));
  search(3, 0, intervals, refused);
  code[refused] = (struct sock_filter)BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ERRNO | 1);
  code[refused + 1] = (struct sock_filter)BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ALLOW);
  const struct sock_fprog program = {.len = length, .filter = code};
  prctl(PR_SET_SECCOMP, SECCOMP_MODE_FILTER, &program);
}
