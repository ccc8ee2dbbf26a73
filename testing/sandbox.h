// Test support: a private file tree over /var and /usr/share for each case,
// so that vell's fixed absolute paths can be exercised without touching the
// host, and the scenarios played in it. Nothing here is used by vell itself.
//
// A scenario is whole starts of the real binary written as data, in a file of
// testing/scenarios. Each begins with "device [CURRENT LATEST]": the sample
// device below, with zoneinfo and icutz linked to the download CURRENT (or
// zoneinfo alone to "system") and tz_latest to the download LATEST ("-" for
// no link). The comment above it names it. Then, one step a line:
//   ENTRY                 before the first start: laid out (notation of lay_out);
//                         after it: what must stand there ("PATH absent" too)
//   start STATUS          one start, ending by itself with STATUS; it prints
//   | MESSAGE             exactly these lines, each without its error text
//   active DATASET        zoneinfo and icutz name DATASET (or "system")
//   faults, known POINT   read by the fault test: see driver/fault_test.cc
// "@" stands for "/var/db/timezone/", and "{c*N}" for N times the character c.
#ifndef VELL_TESTING_SANDBOX_H_
#define VELL_TESTING_SANDBOX_H_

#include <ostream>
#include <string>
#include <vector>

namespace vell::testing {

/// Fresh, empty tmpfs over /var and /usr/share for the object's lifetime.
/// The first sandbox of a process moves the process into a private mount
/// namespace (plus a user namespace when not root) with read-only tmpfs
/// guards beneath, so a stray write can never reach the host. Throws
/// std::runtime_error, failing the test, when any of that is impossible.
class sandbox {
 public:
  sandbox();
  ~sandbox();
  sandbox(const sandbox&) = delete;
  sandbox& operator=(const sandbox&) = delete;
};

/// Creates one entry, parents as needed, replacing a file or link there:
/// "PATH/" a directory, "PATH -> TARGET" a symbolic link, "PATH => FILE" a
/// further hard link, "PATH = TEXT" or "PATH [0640] = TEXT" a file, "PATH fifo"
/// a FIFO, "PATH absent" nothing. Paths hold no blanks.
void lay_out(const std::string& entry);

/// What stands at `path`, in the notation of lay_out; with the mode when
/// `with_mode`.
std::string entry_at(const std::string& path, bool with_mode = false);

/// The sample device: system data 2016c (its "+VERSION" holds two words),
/// ICU schema 44l; downloads 2016a.1.0, 2016b.1.0, 2016d.1.0, 2016e.1.0 for
/// 44l and 2017a.1.0 for 44b; a local-time link of the present form; a stale
/// marker, /var/db/icu and the record "2015z.1.0_2016a.1.0".
void lay_out_device();

struct run_result {
  int status;                         // exit status, or 128 + signal number
  std::vector<std::string> messages;  // stderr lines without "vell: "
};

/// Runs the real vell binary with no arguments and an empty environment,
/// after `wrapper` (such as strace and its arguments) when given. A start
/// that takes over 5 seconds is killed by SIGALRM, so a hang fails its case.
run_result run_vell(const std::vector<std::string>& wrapper = {});

struct scenario {
  std::string name;                // "file:line title"
  std::vector<std::string> steps;  // with "@" and "{c*N}" expanded
};
inline void PrintTo(const scenario& s, std::ostream* out) { *out << s.name; }

/// Every scenario of every file in testing/scenarios.
std::vector<scenario> read_scenarios();

/// Lays out the scenario's tree, then runs its starts and checks each step
/// (as gtest expectations); with `set_up_only`, stops at the first start.
void play(const scenario& s, bool set_up_only = false);

}  // namespace vell::testing

#endif  // VELL_TESTING_SANDBOX_H_
