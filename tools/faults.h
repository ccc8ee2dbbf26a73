// The fault sweep: what a failed call or a power cut at each step of a start
// leaves behind. Every file-system call of the start, on the device's paths or
// on what it opened there, in turn fails with EIO, and separately the start
// is killed at that call; two clean starts follow, then the gate (verdict.h),
// and nothing below the downloads or on the system partition may change.
// A point is labelled "eio|kill CALL PATH", with " #N" from its second
// occurrence on; calls are named in their *at form, which every architecture
// has.
#ifndef VELL_TOOLS_FAULTS_H_
#define VELL_TOOLS_FAULTS_H_

#include <string>
#include <vector>

#include "tools/scenario.h"

namespace vell::sandbox {

/// strace's path on PATH; throws vell_try_error when there is none.
std::string find_strace();

/// Sweeps the first start of `scenario` with `vell`, under `strace`, and
/// prints how many points there were. Returns a check for each point and
/// fault, failing when the device was not as above after it and the scenario
/// does not list it as known, and one for each known point, failing when it
/// now holds.
std::vector<vell_check> sweep(const vell_scenario& scenario, const std::string& vell,
                              const std::string& strace);

}  // namespace vell::sandbox

#endif  // VELL_TOOLS_FAULTS_H_
