// vell's own drop of root's reach: of every capability it starts with, it
// keeps the one it needs, under every init, with or without a service
// manager that drops them first.
#ifndef VELL_PLATFORM_CAPABILITIES_H_
#define VELL_PLATFORM_CAPABILITIES_H_

namespace vell::platform {

/// From now on this process holds no capability but `kept` (a CAP_ number):
/// the others leave its effective, permitted, inheritable and so ambient
/// sets. The bounding set stays: under no-new-privileges (set first) no exec
/// gains what the permitted set lacks. When `kept` is not permitted, none is
/// kept. Never prints, never throws, and leaves errno as it found it.
void keep_only_capability(int kept);

}  // namespace vell::platform

#endif  // VELL_PLATFORM_CAPABILITIES_H_
