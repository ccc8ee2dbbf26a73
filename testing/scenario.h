// Scenarios: whole starts of the real binary written as data. A file in
// testing/scenarios holds many; each begins with "device" (the sample device)
// or "bare" (empty trees), and the comment above it names it. Then:
//   ENTRY                 before the first start: laid out (sandbox.h notation);
//                         after it: what must stand there ("PATH absent" too)
//   links CURRENT LATEST  zoneinfo and icutz to a download, or zoneinfo alone
//                         to "system"; tz_latest to a download; "-" for none
//   start STATUS          one start, ending by itself with STATUS; it prints
//   | MESSAGE             exactly these lines, each without its error text
//   active DATASET        zoneinfo and icutz name DATASET (or "system")
//   usable                the links lead to usable data
//   faults, known POINT   read by the fault test: see fault_test.cc
// In paths and texts "@" stands for "/var/db/timezone/", "\n", "\0" and
// "\xHH" for bytes, and "{c*N}" for N times the character c.
#ifndef VELL_TESTING_SCENARIO_H_
#define VELL_TESTING_SCENARIO_H_

#include <ostream>
#include <string>
#include <vector>

namespace vell::testing {

struct scenario {
  std::string name;                // "file:line title"
  std::vector<std::string> steps;  // expanded, in order
};

inline void PrintTo(const scenario& s, std::ostream* out) { *out << s.name; }

/// Every scenario of every file in testing/scenarios.
std::vector<scenario> read_scenarios();

/// Lays out what `s` sets up before its first start.
void set_up(const scenario& s);

}  // namespace vell::testing

#endif  // VELL_TESTING_SCENARIO_H_
