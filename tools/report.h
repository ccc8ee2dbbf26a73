// What vell-try checked, for its "vell-try: fail:" lines and for a JUnit
// report that CI systems read.
#ifndef VELL_TOOLS_REPORT_H_
#define VELL_TOOLS_REPORT_H_

#include <string>
#include <vector>

namespace vell::sandbox {

/// One check: a scenario's expectation, a step of the gate, or a fault point.
struct vell_check {
  std::string suite;                  // the scenario ("FILE:LINE title") or the image
  std::string name;                   // what was checked
  std::vector<std::string> failures;  // the words of its fail lines; none when it held
  bool skipped = false;               // not checked: an earlier step of the gate failed
};

/// Every failure of `checks`, in order, as vell-try prints them after "vell-try: fail: ".
std::vector<std::string> failures_of(const std::vector<vell_check>& checks);

/// Writes `checks` to `path` as JUnit XML: a testsuite per suite, in the order
/// met, a testcase per check, its failure carrying the words of its fail
/// lines. Throws vell_try_error when the file cannot be written.
void write_junit(const std::string& path, const std::vector<vell_check>& checks);

}  // namespace vell::sandbox

#endif  // VELL_TOOLS_REPORT_H_
