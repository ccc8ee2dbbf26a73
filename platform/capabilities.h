// vell's own drop of root's reach: of every capability it starts with, it
// keeps the one it needs, under every init, with or without a service
// manager that drops them first.
#ifndef VELL_PLATFORM_CAPABILITIES_H_
#define VELL_PLATFORM_CAPABILITIES_H_

namespace vell::platform {

/// From now on this process holds no capability but `kept` (a CAP_ number):
/// the others leave its bounding set (where it may still change that set),
/// and its effective, permitted, inheritable and so ambient sets. Never
/// prints, never throws, and leaves errno as it found it; what the process
/// may not change stays as it was.
void keep_only_capability(int kept);

}  // namespace vell::platform

#endif  // VELL_PLATFORM_CAPABILITIES_H_
