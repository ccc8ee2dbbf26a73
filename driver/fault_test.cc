// Faults at every file-system call of five typical starts: each call in turn
// fails with EIO, or the process is killed there. Three clean starts later
// the links must lead to usable data again, the starts must have reached a
// fixed point, and no downloaded or system data may have changed. The few
// points where that cannot hold are listed, so that a new one fails.
#include <signal.h>

#include <cstdio>
#include <fstream>
#include <map>
#include <set>
#include <sstream>

#include <gtest/gtest.h>

#include "testing/sandbox.h"

namespace vell {
namespace {

using namespace vell::testing;

struct start_case {
  const char* name;
  std::string current, latest;  // as lay_out_links takes them
  std::vector<std::string> more;
  // "fault call first-path-argument": the points after which the starts
  // cannot repair the links, because a link is replaced in two steps and a
  // kept dataset is never activated again.
  std::set<std::string> known;
};

void PrintTo(const start_case& start, std::ostream* out) { *out << start.name; }

const start_case starts[] = {
    {"first_start", "", "2016d.1.0", {},
     {"kill unlink /var/db/timezone/icutz #2", "kill unlink /var/db/icutz #2",
      "kill symlink /var/db/timezone/tz/2016d.1.0/icutz"}},
    {"promotion", "2016d.1.0", "2016e.1.0", {},
     {"kill unlink /var/db/timezone/icutz", "kill unlink /var/db/icutz",
      "kill symlink /var/db/timezone/tz/2016e.1.0/icutz"}},
    {"steady", "2016e.1.0", "2016e.1.0", {}, {}},
    // The reset swallows a failed removal of the ICU link, so an EIO leaves it too.
    {"incompatible_reset", "2017a.1.0", "2017a.1.0", {},
     {"kill unlink /var/db/timezone/icutz", "eio unlink /var/db/timezone/icutz"}},
    {"old_localtime_form", "2016e.1.0", "2016e.1.0",
     {"/var/db/timezone/localtime -> /usr/share/zoneinfo/America/Los_Angeles"}, {}},
};

void lay_out(const start_case& start) {
  lay_out_device();
  lay_out_links(start.current, start.latest);
  for (const std::string& entry : start.more) sandbox::lay_out({entry});
}

// A place to inject: the n-th call of `name` since the process began.
struct fault_point {
  std::string name;
  int occurrence;
  std::string label;  // "unlink /var/db/timezone/icutz", "#2" added on repeats
};

const std::set<std::string> file_system_calls = {
    "openat", "close", "read", "write", "lseek", "newfstatat", "access", "readlink", "unlink",
    "unlinkat", "rmdir", "symlink", "symlinkat", "fchdir", "chdir", "getdents64", "fcntl"};

// Every file-system call that an unfaulted start makes on the device's paths
// or on descriptors it opened there, in order. Calls of the loader, of a
// sanitizer runtime and writes to stderr are left out: they are not vell's.
std::vector<fault_point> fault_points(const start_case& start) {
  sandbox box;
  lay_out(start);
  run_vell({"/usr/bin/strace", "-qq", "-o", "/var/trace", "-e", "trace=%file,%desc"});
  std::ifstream trace("/var/trace");
  std::map<std::string, int> calls, labels;
  std::set<std::string> own_descriptors;
  std::vector<fault_point> points;
  for (std::string line; std::getline(trace, line);) {
    const size_t paren = line.find('(');
    if (paren == std::string::npos) continue;
    const std::string name = line.substr(0, paren);
    const int occurrence = ++calls[name];
    const std::string first = line.substr(paren + 1, line.find_first_of(",)", paren) - paren - 1);
    std::string label = name;
    if (first.starts_with('"') || first == "AT_FDCWD") {
      const size_t quote = line.find('"', paren);
      const std::string path = line.substr(quote + 1, line.find('"', quote + 1) - quote - 1);
      if (path.starts_with('/') && !path.starts_with("/var/db") && !path.starts_with("/usr/share")) continue;
      label += " " + path;
      if (name == "openat") own_descriptors.insert(line.substr(line.rfind("= ") + 2));  // "-1 ..." matches none
    } else if (!own_descriptors.contains(first)) {
      continue;
    } else if (name == "close") {
      own_descriptors.erase(first);
    }
    if (!file_system_calls.contains(name)) continue;
    if (const int seen = ++labels[label]; seen > 1) label.append(" #").append(std::to_string(seen));
    points.push_back({name, occurrence, label});
  }
  return points;
}

// What a start must never change: downloaded and system data.
std::string data_lines() {
  std::istringstream all(snapshot());
  std::string kept;
  for (std::string line; std::getline(all, line);) {
    if (line.starts_with(tz) || line.starts_with("/usr/share/")) kept += line + "\n";
  }
  return kept;
}

// What is wrong after a faulted start and three clean ones; "" when nothing.
std::string check_fault(const fault_point& point, const std::string& fault,
                        const std::string& data_before) {
  const run_result faulted =
      run_vell({"/usr/bin/strace", "-qq", "-o", "/dev/null", "-E", "ASAN_OPTIONS=detect_leaks=0", "-e",
                "inject=" + point.name + ":" + fault + ":when=" + std::to_string(point.occurrence)});
  const bool killed = fault == "signal=KILL";
  if (faulted.status != 0 && faulted.status != 1 && !(killed && faulted.status == 128 + SIGKILL))
    return "faulted start ended with status " + std::to_string(faulted.status);
  for (const std::string& line : faulted.messages) {
    if (line.find("Sanitizer") != std::string::npos || line.find("runtime error") != std::string::npos)
      return "faulted start: " + line;
  }
  std::string before_third;
  for (int clean = 1; clean <= 3; ++clean) {
    if (clean == 3) before_third = snapshot();
    if (const int status = run_vell().status; status != 0)
      return "clean start " + std::to_string(clean) + " ended with status " + std::to_string(status);
  }
  if (snapshot() != before_third) return "the third clean start still changed something";
  if (data_lines() != data_before) return "data under tz/ or on the system partition changed";
  const std::string zoneinfo = show("/var/db/timezone/zoneinfo"), icutz = show("/var/db/timezone/icutz");
  std::string dataset;
  if (zoneinfo != "-> /usr/share/zoneinfo.default") {
    for (const char* compatible : {"2016a.1.0", "2016b.1.0", "2016d.1.0", "2016e.1.0"}) {
      if (zoneinfo == "-> " + tz + compatible + "/zoneinfo") dataset = tz + compatible;
    }
    if (dataset.empty()) return "zoneinfo " + zoneinfo;
  }
  if (icutz != (dataset.empty() ? "absent" : "-> " + dataset + "/icutz"))
    return "icutz " + icutz + " beside zoneinfo " + zoneinfo;
  if (!show("/var/db/timezone/localtime").starts_with("-> /var/db/timezone/zoneinfo"))
    return "localtime " + show("/var/db/timezone/localtime");
  return "";
}

class Faults : public ::testing::TestWithParam<start_case> {};

TEST_P(Faults, EveryFileSystemCallOfAStart) {
  const start_case& start = GetParam();
  const std::vector<fault_point> points = fault_points(start);
  ASSERT_GT(points.size(), 10u) << "the trace of an unfaulted start is missing";
  std::set<std::string> failing;
  for (const fault_point& point : points) {
    for (const auto& [fault_name, fault] : {std::pair{"eio ", "error=EIO"}, std::pair{"kill ", "signal=KILL"}}) {
      sandbox box;
      lay_out(start);
      const std::string problem = check_fault(point, fault, data_lines());
      if (problem.empty()) continue;
      const std::string key = fault_name + point.label;
      failing.insert(key);
      if (!start.known.contains(key)) ADD_FAILURE() << key << ": " << problem;
    }
  }
  for (const std::string& key : start.known) {
    if (!failing.contains(key)) ADD_FAILURE() << "listed as known but now held: " << key;
  }
  std::printf("%s: %zu fault points, each failed with EIO and killed; %zu known to leave the links apart\n",
              start.name, points.size(), failing.size());
}

INSTANTIATE_TEST_SUITE_P(Start, Faults, ::testing::ValuesIn(starts),
                         [](const ::testing::TestParamInfo<start_case>& info) { return info.param.name; });

}  // namespace
}  // namespace vell
