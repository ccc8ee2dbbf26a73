// What vell-try judges a device by after its starts. The rules are written
// here afresh, not taken from vell, so that a fault in vell cannot pass them.
#ifndef VELL_TOOLS_VERDICT_H_
#define VELL_TOOLS_VERDICT_H_

#include <string>
#include <vector>

#include "tools/sandbox.h"

namespace vell::sandbox {

/// Every path a start may write, in the order vell-try's table shows them.
extern const std::vector<std::string> written_paths;

/// What stands at each of written_paths (what_stands).
std::vector<std::string> written_state();

/// "" when the links lead to usable data: zoneinfo names the system data or
/// a download with an ICU data file for the system's schema, icutz names that
/// download's icutz (and is absent with the system data), and localtime
/// leads through zoneinfo to a file that is there. Otherwise why not.
std::string unusable_links();

/// Every entry below the downloads and the system partition, with its type,
/// mode, size, time of change and link target: what no start may change.
std::string data_fingerprint();

/// The steps of the verdict an image pipeline gates on, in order.
inline constexpr int gate_stages = 3;
inline constexpr const char* gate_stage_names[gate_stages] = {
    "the last start ended with 0", "the links lead to usable data",
    "one more start changed nothing but the clean-up marker"};

/// That verdict, given how the last start ended: "" when it ended with 0, the
/// links lead to usable data and one more start of `vell` changes none of
/// written_paths but the clean-up marker (which every start deletes);
/// otherwise the first of these that failed, and why, with its number in
/// gate_stage_names in `*failed_stage` when given.
std::string gate(const std::string& vell, const start_result& last, int* failed_stage = nullptr);

}  // namespace vell::sandbox

#endif  // VELL_TOOLS_VERDICT_H_
