#include "tools/faults.h"

#include <signal.h>
#include <sys/mman.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <map>
#include <regex>
#include <set>
#include <sstream>

#include "tools/notation.h"
#include "tools/sandbox.h"
#include "tools/verdict.h"

namespace vell::sandbox {
namespace {

struct fault_point {
  std::string call;   // as this architecture makes it, to inject
  int occurrence;     // of this call since the process began
  std::string label;  // "unlinkat /var/db/timezone/icutz", " #2" on repeats
};

// x86-64 and 32-bit ARM have the old path calls beside the *at ones; arm64
// has only the *at ones (and rmdir is unlinkat there), and 32-bit ARM names
// its 64-bit stat, seek and truncate calls apart: labels use one name for
// each, so a sweep reads alike on every architecture.
std::string at_form(const std::string& call) {
  static const std::map<std::string, std::string> at = {
      {"unlink", "unlinkat"},     {"rmdir", "unlinkat"},       {"symlink", "symlinkat"},
      {"readlink", "readlinkat"}, {"fstatat64", "newfstatat"}, {"fstat64", "fstat"},
      {"_llseek", "lseek"},       {"ftruncate64", "ftruncate"}};
  const auto found = at.find(call);
  return found == at.end() ? call : found->second;
}

// Every file-system call of an unfaulted start on the device's paths, or on
// descriptors opened there; the loader's, an emulator's and a sanitizer's
// calls are not vell's.
std::vector<fault_point> fault_points(const std::string& vell, const std::string& strace) {
  const int trace = memfd_create("vell-trace", 0);
  // strace's classes, and "?" before a call this architecture may lack.
  const start_result traced =
      run_start(vell, {strace, "-qq", "-o", "/proc/self/fd/" + std::to_string(trace), "-e",
                       "trace=%file,%stat,read,write,close,lseek,?_llseek,fchdir,getdents64,"
                       "ftruncate,?ftruncate64"});
  for (const std::string& message : traced.messages)
    if (message.starts_with("strace: ")) throw vell_try_error(message);
  std::istringstream lines(read_all_and_close(trace));
  std::map<std::string, int> calls, labels;
  std::set<std::string> descriptors;
  std::vector<fault_point> points;
  // CALL( [AT_FDCWD, ] "PATH" or FD ...) = RESULT
  static const std::regex call_line("(\\w+)\\((AT_FDCWD, )?(\"([^\"]*)\"|\\d+).*= (-?\\d+).*");
  for (std::string line; std::getline(lines, line);) {
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

// What is wrong after the faulted start and the clean ones; "" when nothing.
std::string check(const fault_point& point, const std::string& fault, const std::string& vell,
                  const std::string& strace) {
  const std::string data = data_fingerprint();
  const start_result faulted = run_start(
      vell, {strace, "-qq", "-o", "/dev/null", "-E", "ASAN_OPTIONS=detect_leaks=0", "-e",
             "inject=" + point.call + ":" + fault + ":when=" + std::to_string(point.occurrence)});
  if (faulted.status > 1 && faulted.status != 128 + SIGKILL)
    return "the faulted start ended with status " + std::to_string(faulted.status);
  if (const int status = run_start(vell).status; status != 0)
    return "the first clean start ended with status " + std::to_string(status);
  std::string why = gate(vell, run_start(vell));
  if (why.empty() && data != data_fingerprint()) why = "downloaded or system data changed";
  return why;
}

}  // namespace

std::string find_strace() {
  if (std::string strace = on_path("strace"); !strace.empty()) return strace;
  throw vell_try_error(
      "--faults needs strace, which is not on PATH (Debian: apt-get install strace)");
}

std::vector<vell_check> sweep(const vell_scenario& s, const std::string& vell,
                              const std::string& strace) {
  vell_device device(s.image, s.device, s.device_where);
  device.reset();
  const std::vector<fault_point> points = fault_points(vell, strace);
  const std::string suite = s.where + (s.title.empty() ? "" : " " + s.title) + " (faults)";
  std::vector<vell_check> checks;
  if (points.empty())
    checks.push_back(
        {suite, "fault points", {s.where + ": strace saw no file-system call of vell"}});
  std::set<std::string> swept, failing;
  for (const fault_point& point : points) {
    for (const char* fault : {"error=EIO", "signal=KILL"}) {
      const std::string key = (fault[0] == 'e' ? "eio " : "kill ") + point.label;
      swept.insert(key);
      device.reset();
      const std::string problem = check(point, fault, vell, strace);
      vell_check& made = checks.emplace_back(vell_check{suite, key, {}});
      if (problem.empty() || !failing.insert(key).second) continue;
      bool known = false;
      for (const vell_step& step : s.known) known = known || step.text == key;
      if (!known) made.failures.push_back(s.where + ": " + key + ": " + problem);
    }
  }
  for (const vell_step& step : s.known) {
    vell_check& made =
        checks.emplace_back(vell_check{suite, step.where + ": known " + step.text, {}});
    // A misspelt point would otherwise pass for one that now holds.
    if (!swept.contains(step.text))
      made.failures.push_back(step.where + ": known, but no such fault point: " + step.text);
    else if (!failing.contains(step.text))
      made.failures.push_back(step.where + ": known, now holds: " + step.text);
  }
  std::printf("=== %s: %zu fault points, %zu leave the device unusable (%zu known)\n",
              s.where.c_str(), points.size(), failing.size(), s.known.size());
  return checks;
}

}  // namespace vell::sandbox
