// Scenarios: device states and the starts run on them, written as text, with
// what must hold after each start. A file holds one or more; each begins at a
// "device" line, and the comment above it names it. One step a line:
//   device [CURRENT LATEST]  the small built-in device (see sample_device)
//   ENTRY                    before the first start: laid out (notation.h);
//                            after it: what must stand there
//   start [STATUS]           one start; with STATUS, it must end so and
//   | MESSAGE                print exactly these lines, without "vell: " and
//                            without the error text after the last ": "
//   active DATASET           zoneinfo and icutz name DATASET ("system": the
//                            system data, and no icutz)
//   verdict REASON           the gate is expected to fail, for this reason
//   limit SECONDS            before the first start: each start is killed
//                            after SECONDS (1 to 60) instead of 5
//   faults                   --faults sweeps this scenario's first start
//   known eio|kill CALL PATH [#N]  a fault point expected to leave the
//                            device unusable (faults.h)
// Lines starting with "#" are comments.
#ifndef VELL_TOOLS_SCENARIO_H_
#define VELL_TOOLS_SCENARIO_H_

#include <string>
#include <vector>

#include "tools/report.h"
#include "tools/sandbox.h"

namespace vell::sandbox {

struct vell_step {
  std::string where;  // "FILE:LINE"
  std::string text;   // "@" and "{c*N}" written out
};

struct vell_scenario {
  std::string where;                             // "FILE:LINE" of its device line, or the image
  std::string title;                             // the comment naming it
  std::string image;                             // the image directory it runs on, or ""
  std::vector<std::string> device;               // the entries laid out before the first start
  std::vector<std::string> device_where;         // "FILE:LINE" of each
  std::vector<vell_step> steps;                  // from the first start on
  int limit_seconds = start_time_limit_seconds;  // for each of its starts
  bool faults = false;
  std::vector<vell_step> known;  // "eio|kill CALL PATH [#N]"
};

/// The scenarios of a file. One without a start gets `starts` plain starts.
/// Throws vell_try_error naming FILE:LINE for a line it cannot read.
std::vector<vell_scenario> read_scenarios(const std::string& file, int starts);

/// `starts` plain starts on an image directory.
vell_scenario image_scenario(const std::string& image, int starts);

struct vell_try_options {
  std::string vell;  // the binary to run
  std::string then;  // a shell command run after the last start, or ""
};

/// Lays out the scenario, runs its starts with vell's messages and a table of
/// what each start changed on standard output, then `then`, then checks the
/// gate (verdict.h). Returns a check for each expectation, in the file's
/// order, and for each step of the gate when no verdict line stands in for
/// them; their failures say what did not hold ("WHERE: ...").
std::vector<vell_check> play(const vell_scenario& scenario, const vell_try_options& options);

}  // namespace vell::sandbox

#endif  // VELL_TOOLS_SCENARIO_H_
