// Faults at every file-system call of the scenarios marked "faults": each
// call in turn fails with EIO, or the process is killed there. Three clean
// starts later the links must lead to usable data, the starts must have
// reached a fixed point, and no downloaded or system data may have changed.
// The points where that cannot hold are the scenario's "known" lines
// ("eio|kill CALL PATH [#N]"), so that a new one fails and a fixed one too.
// Calls are named in their *at form, which every architecture has.
#include <gtest/gtest.h>
#include <signal.h>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <map>
#include <regex>
#include <set>

#include "testing/sandbox.h"

namespace vell::testing {
namespace {

struct fault_point {
  std::string call;   // as this architecture makes it, to inject
  int occurrence;     // of this call since the process began
  std::string label;  // "unlinkat /var/db/timezone/icutz", " #2" on repeats
};

// x86-64 and 32-bit ARM have the old path calls beside the *at ones; arm64
// has only the *at ones (and rmdir is unlinkat there), so labels use those.
std::string at_form(const std::string& call) {
  static const std::map<std::string, std::string> at = {{"unlink", "unlinkat"},
                                                        {"rmdir", "unlinkat"},
                                                        {"symlink", "symlinkat"},
                                                        {"readlink", "readlinkat"}};
  const auto found = at.find(call);
  return found == at.end() ? call : found->second;
}

// Every file-system call of an unfaulted start on the device's paths, or on
// descriptors opened there; the loader's and a sanitizer's calls are not vell's.
std::vector<fault_point> fault_points(const scenario& s) {
  sandbox box;
  play(s, true);
  run_vell({"/usr/bin/strace", "-qq", "-o", "/var/trace", "-e",
            "trace=%file,read,write,close,lseek,fstat,newfstatat,fchdir,getdents64,ftruncate"});
  std::ifstream trace("/var/trace");
  std::map<std::string, int> calls, labels;
  std::set<std::string> descriptors;
  std::vector<fault_point> points;
  // CALL( [AT_FDCWD, ] "PATH" or FD ...) = RESULT
  static const std::regex call_line("(\\w+)\\((AT_FDCWD, )?(\"([^\"]*)\"|\\d+).*= (-?\\d+).*");
  for (std::string line; std::getline(trace, line);) {
    std::smatch m;
    if (!std::regex_match(line, m, call_line)) continue;
    const int occurrence = ++calls[m[1]];
    const std::string path = m[4], descriptor = m[4].matched ? "" : m.str(3);
    if (path.starts_with("/") && !path.starts_with("/var/db") && !path.starts_with("/usr/share"))
      continue;
    if (!m[4].matched && !descriptors.contains(descriptor)) continue;
    if (m[1] == "openat") descriptors.insert(m[5]);
    if (m[1] == "close") descriptors.erase(descriptor);
    std::string label = at_form(m[1]) + (m[4].matched ? " " + path : "");
    if (const int seen = ++labels[label]; seen > 1) label += " #" + std::to_string(seen);
    points.push_back({m[1], occurrence, label});
  }
  return points;
}

// Every entry below the roots with what stands there, sorted.
std::string tree(std::initializer_list<const char*> roots) {
  std::set<std::string> lines;
  for (const char* root : roots) {
    for (const auto& entry : std::filesystem::recursive_directory_iterator(root))
      lines.insert(entry_at(entry.path()));
  }
  std::string all;
  for (const std::string& line : lines) all += line + "\n";
  return all;
}

// "" when zoneinfo names the system data or a compatible download with icutz
// beside it, and localtime leads through zoneinfo; else what is wrong.
std::string unusable_links() {
  static const std::regex download("\\S+ -> (/var/db/timezone/tz/2016[abde]\\.1\\.0)/zoneinfo");
  const std::string zoneinfo = entry_at("/var/db/timezone/zoneinfo");
  const std::string icutz = entry_at("/var/db/timezone/icutz");
  const std::string localtime = entry_at("/var/db/timezone/localtime");
  std::smatch m;
  const bool system = zoneinfo.ends_with(" -> /usr/share/zoneinfo.default");
  if (!system && !std::regex_match(zoneinfo, m, download)) return zoneinfo;
  if (icutz != "/var/db/timezone/icutz" + (system ? " absent" : " -> " + m.str(1) + "/icutz"))
    return icutz + " beside " + zoneinfo;
  if (!localtime.starts_with("/var/db/timezone/localtime -> /var/db/timezone/zoneinfo"))
    return localtime;
  return "";
}

// What is wrong after a faulted start and three clean ones; "" when nothing.
std::string check(const fault_point& point, const std::string& fault) {
  const std::string data = tree({"/var/db/timezone/tz", "/usr/share"});
  const run_result faulted = run_vell(
      {"/usr/bin/strace", "-qq", "-o", "/dev/null", "-E", "ASAN_OPTIONS=detect_leaks=0", "-e",
       "inject=" + point.call + ":" + fault + ":when=" + std::to_string(point.occurrence)});
  if (faulted.status > 1 && faulted.status != 128 + SIGKILL)
    return "faulted start ended with status " + std::to_string(faulted.status);
  std::string before_third;
  for (int clean = 1; clean <= 3; ++clean) {
    before_third = tree({"/var/db"});
    if (const int status = run_vell().status; status != 0)
      return "clean start " + std::to_string(clean) + " ended with " + std::to_string(status);
  }
  if (before_third != tree({"/var/db"})) return "the third clean start still changed something";
  if (data != tree({"/var/db/timezone/tz", "/usr/share"}))
    return "downloaded or system data changed";
  return unusable_links();
}

class Faults : public ::testing::TestWithParam<scenario> {};

TEST_P(Faults, EveryFileSystemCallOfAStart) {
  const scenario& s = GetParam();
  std::set<std::string> known, failing;
  for (const std::string& step : s.steps) {
    if (step.starts_with("known ")) known.insert(step.substr(6));
  }
  const std::vector<fault_point> points = fault_points(s);
  ASSERT_GT(points.size(), 10u) << "the trace of an unfaulted start is missing";
  for (const fault_point& point : points) {
    for (const char* fault : {"error=EIO", "signal=KILL"}) {
      const std::string key = (fault[0] == 'e' ? "eio " : "kill ") + point.label;
      sandbox box;
      play(s, true);
      const std::string problem = check(point, fault);
      if (!problem.empty() && failing.insert(key).second && !known.contains(key))
        ADD_FAILURE() << key << ": " << problem;
    }
  }
  for (const std::string& key : known)
    EXPECT_TRUE(failing.contains(key)) << "known, now held: " << key;
  std::printf("%s: %zu fault points, %zu known to leave the links apart\n", s.name.c_str(),
              points.size(), failing.size());
}

std::vector<scenario> marked() {
  std::vector<scenario> chosen;
  for (const scenario& s : read_scenarios()) {
    if (std::count(s.steps.begin(), s.steps.end(), "faults")) chosen.push_back(s);
  }
  return chosen;
}

INSTANTIATE_TEST_SUITE_P(Start, Faults, ::testing::ValuesIn(marked()), [](const auto& info) {
  return "at_" + info.param.name.substr(0, info.param.name.find('.')) + "_" +
         std::to_string(info.index);
});

}  // namespace
}  // namespace vell::testing
