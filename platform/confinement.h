// vell's own confinement of its writes, by the kernel's Landlock where the
// kernel has it (Linux 5.13 and later, when built in), so that it holds
// under every init, with or without a confining service manager.
#ifndef VELL_PLATFORM_CONFINEMENT_H_
#define VELL_PLATFORM_CONFINEMENT_H_

namespace vell::platform {

/// From now on this process may create, remove, rename, link, write and
/// truncate files only beneath the directory `dir`; reading stays as it was.
/// The kernel asks for no-new-privileges first (or CAP_SYS_ADMIN). Uses every write
/// right the running kernel's Landlock knows; with no Landlock, or when `dir`
/// cannot be opened, nothing changes. Never prints, never throws, and leaves
/// errno as it found it, since every message of a start ends with its text.
void confine_writes_beneath(const char* dir);

}  // namespace vell::platform

#endif  // VELL_PLATFORM_CONFINEMENT_H_
