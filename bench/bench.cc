// Prints what one start of vell costs, beside what the same start must cost
// at least: the C floor (its file-system calls, nothing else) and the library
// floor (its standard-library work, with each library). Runs in a private
// mount namespace over the tests' sample device.
//   vell_bench [RUNS] [--vell PATH] [--profile DIR]
// RUNS interleaved timed runs (default 200); --vell measures another build of
// vell; --profile keeps each program's callgrind file and trace in DIR.
#include <fcntl.h>
#include <signal.h>
#include <spawn.h>
#include <sys/ptrace.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <time.h>
#include <unistd.h>

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <map>
#include <random>
#include <sstream>
#include <string>
#include <vector>

#include "platform/syscall_filter.h"
#include "tools/notation.h"
#include "tools/sandbox.h"

extern char** environ;

namespace {

struct program {
  const char* name;
  std::string path;
  std::vector<std::string> arguments;
  std::vector<std::string> command(std::vector<std::string> before = {}) const {
    before.push_back(path);
    before.insert(before.end(), arguments.begin(), arguments.end());
    return before;
  }
};

struct start {
  const char* name;
  std::vector<std::string> links;
};

const char* const changed_by_a_start[] = {"/var/db/timezone/zoneinfo",
                                          "/var/db/timezone/icutz",
                                          "/var/db/timezone/tz_latest",
                                          "/var/db/timezone/needs_cleanup",
                                          "/var/db/timezone/TZVersionDiffRecord",
                                          "/var/db/timezone/localtime"};

void prepare(const start& s) {
  for (const char* path : changed_by_a_start) unlink(path);
  for (const std::string& entry : s.links) vell::sandbox::lay_out(entry);
}

// Runs `argv` with its output discarded; returns wall nanoseconds.
long run(const std::vector<std::string>& argv, const char* stderr_to = "/dev/null") {
  std::vector<char*> args;
  for (const std::string& word : argv) args.push_back(const_cast<char*>(word.c_str()));
  args.push_back(nullptr);
  posix_spawn_file_actions_t actions;
  posix_spawn_file_actions_init(&actions);
  posix_spawn_file_actions_addopen(&actions, 1, "/dev/null", O_WRONLY, 0);
  posix_spawn_file_actions_addopen(&actions, 2, stderr_to, O_WRONLY | O_CREAT | O_TRUNC, 0600);
  char* empty_env[] = {nullptr};
  timespec t0, t1;
  clock_gettime(CLOCK_MONOTONIC, &t0);
  pid_t pid;
  if (posix_spawn(&pid, args[0], &actions, nullptr, args.data(), empty_env) != 0) {
    std::perror(args[0]);
    std::exit(1);
  }
  int status;
  waitpid(pid, &status, 0);
  clock_gettime(CLOCK_MONOTONIC, &t1);
  posix_spawn_file_actions_destroy(&actions);
  return (t1.tv_sec - t0.tv_sec) * 1000000000L + (t1.tv_nsec - t0.tv_nsec);
}

std::string read_file(const std::string& path) {
  std::ifstream in(path);
  std::stringstream text;
  text << in.rdbuf();
  return text.str();
}

// Peak resident memory of the program's own image, read at its exit: the
// rusage of a child would also count the memory it had before exec.
long peak_rss_kib(const program& p, const start& s) {
  prepare(s);
  const pid_t pid = fork();
  if (pid == 0) {
    ptrace(PTRACE_TRACEME, 0, nullptr, nullptr);
    const int null_fd = open("/dev/null", O_WRONLY);
    dup2(null_fd, 1);
    dup2(null_fd, 2);
    std::vector<char*> argv;
    for (const std::string& word : p.command()) argv.push_back(strdup(word.c_str()));
    argv.push_back(nullptr);
    char* envp[] = {nullptr};
    execve(argv[0], argv.data(), envp);
    _exit(127);
  }
  long peak = -1;
  int status;
  waitpid(pid, &status, 0);  // stopped at its exec
  ptrace(PTRACE_SETOPTIONS, pid, nullptr, PTRACE_O_TRACEEXIT);
  ptrace(PTRACE_CONT, pid, nullptr, nullptr);
  while (waitpid(pid, &status, 0) == pid && WIFSTOPPED(status)) {
    int pass = WSTOPSIG(status);
    if (status >> 8 == (SIGTRAP | (PTRACE_EVENT_EXIT << 8))) {
      std::istringstream lines(read_file("/proc/" + std::to_string(pid) + "/status"));
      for (std::string line; std::getline(lines, line);)
        if (line.rfind("VmHWM:", 0) == 0) peak = std::atol(line.c_str() + 6);
      pass = 0;
    }
    ptrace(PTRACE_CONT, pid, nullptr, pass);
  }
  return peak;
}

// With --profile DIR, each program's callgrind file (for callgrind_annotate)
// and system-call trace are kept there.
std::string profile_dir;
std::string kept(const program& p, const start& s, const char* kind) {
  return profile_dir + "/" + p.path.substr(p.path.rfind('/') + 1) + "." +
         std::to_string(s.links.size()) + "." + kind;
}

long instructions(const program& p, const start& s, const std::string& scratch) {
  prepare(s);
  const std::string out = profile_dir.empty() ? "/dev/null" : kept(p, s, "callgrind");
  run(p.command({"/usr/bin/valgrind", "--tool=callgrind", "--callgrind-out-file=" + out}),
      scratch.c_str());
  const std::string log = read_file(scratch);
  const size_t at = log.find("Collected : ");
  return at == std::string::npos ? -1 : std::atol(log.c_str() + at + 12);
}

// System calls before the program first touches the device's paths, and after.
std::pair<int, int> system_calls(const program& p, const start& s, const std::string& scratch) {
  prepare(s);
  run(p.command({"/usr/bin/strace", "-f", "-o", scratch}));
  if (!profile_dir.empty()) std::ofstream(kept(p, s, "strace")) << read_file(scratch);
  std::istringstream trace(read_file(scratch));
  int before = 0, after = 0;
  bool started = false;
  for (std::string line; std::getline(trace, line);) {
    if (line.find("+++") != std::string::npos || line.find("resumed>") != std::string::npos)
      continue;
    started = started || line.find("\"/var/db") != std::string::npos ||
              line.find("\"/usr/share") != std::string::npos;
    ++(started ? after : before);
  }
  return {before, after};
}

struct figures {
  long instructions = 0;
  std::pair<int, int> calls;
  std::vector<long> wall;
  long rss_kib = 0;
  double median_us() const {
    std::vector<long> sorted = wall;
    std::sort(sorted.begin(), sorted.end());
    return sorted.empty() ? 0 : sorted[sorted.size() / 2] / 1000.0;
  }
};

}  // namespace

int main(int argc, char** argv) {
  int runs = 200;
  std::string vell_path = VELL_BINARY;
  for (int i = 1; i < argc; ++i) {
    if (std::string(argv[i]) == "--profile" && i + 1 < argc) {
      profile_dir = argv[++i];
    } else if (std::string(argv[i]) == "--vell" && i + 1 < argc) {
      vell_path = argv[++i];
    } else {
      runs = std::atoi(argv[i]);
    }
  }
  const std::string dir = BENCH_DIR;
  const std::vector<program> programs = {
      {"vell", vell_path, {}},
      {"C floor", dir + "/c_floor", {}},
      {"C floor, confined",
       dir + "/c_floor_confined",
       {std::to_string(vell::platform::filter_length())}},
      {"library floor, libstdc++", dir + "/library_floor_libstdcxx", {}},
      {"library floor, libc++", dir + "/library_floor_libcxx", {}}};
  const std::string d = "/var/db/timezone/tz/2016d.1.0";
  const std::string localtime =
      "/var/db/timezone/localtime -> /var/db/timezone/zoneinfo/America/Los_Angeles";
  const std::vector<start> starts = {
      {"steady start (links and tz_latest name 2016d.1.0)",
       {"/var/db/timezone/zoneinfo -> " + d + "/zoneinfo",
        "/var/db/timezone/icutz -> " + d + "/icutz", "/var/db/timezone/tz_latest -> " + d,
        localtime}},
      {"promotion (links name the system data, tz_latest 2016d.1.0)",
       {"/var/db/timezone/zoneinfo -> /usr/share/zoneinfo.default",
        "/var/db/timezone/tz_latest -> " + d, localtime}},
      {"first start with reset (no links but tz_latest)", {"/var/db/timezone/tz_latest -> " + d}},
  };
  char scratch_name[] = "/tmp/vell-bench.XXXXXX";
  close(mkstemp(scratch_name));
  const std::string scratch = scratch_name;

  // Each program is read back from the disk, as a boot reads it: a binary
  // just linked sits in memory as the linker wrote it, which maps otherwise.
  for (const program& p : programs) {
    const int fd = open(p.path.c_str(), O_RDONLY | O_CLOEXEC);
    if (fd < 0 || fdatasync(fd) != 0 || posix_fadvise(fd, 0, 0, POSIX_FADV_DONTNEED) != 0) {
      std::perror(p.path.c_str());
      return 1;
    }
    close(fd);
  }
  vell::sandbox::enter_private_namespace();
  vell::sandbox::vell_device device("", vell::sandbox::sample_device("", ""));
  device.reset();
  std::printf("%d interleaved runs per program and start; floors are those of the steady start.\n",
              runs);
  for (const start& s : starts) {
    std::map<std::string, figures> results;
    for (const program& p : programs) {
      results[p.name].instructions = instructions(p, s, scratch);
      results[p.name].calls = system_calls(p, s, scratch);
      results[p.name].rss_kib = peak_rss_kib(p, s);
    }
    // A new order each round: a program run after a heavier one finds the
    // caches emptied, and a fixed order would charge that to whoever follows.
    std::vector<const program*> order;
    for (const program& p : programs) order.push_back(&p);
    std::mt19937 shuffler(1);
    for (int i = 0; i < runs; ++i) {
      std::shuffle(order.begin(), order.end(), shuffler);
      for (const program* p : order) {
        prepare(s);
        results[p->name].wall.push_back(run(p->command()));
      }
    }
    std::printf("\n%s\n  %-26s %14s %12s %22s %10s\n", s.name, "program", "instructions",
                "wall (us)", "syscalls start+own", "peak KiB");
    for (const program& p : programs) {
      const figures& f = results[p.name];
      std::printf("  %-26s %14ld %12.1f %14d + %-6d %10ld\n", p.name, f.instructions, f.median_us(),
                  f.calls.first, f.calls.second, f.rss_kib);
    }
    const figures& vell = results["vell"];
    const figures& c_floor = results["C floor"];
    const figures& confined = results["C floor, confined"];
    const figures& library = std::min(
        results["library floor, libstdc++"], results["library floor, libc++"],
        [](const figures& a, const figures& b) { return a.instructions < b.instructions; });
    std::printf(
        "  vell / C floor: wall %.2fx    vell / confined C floor: wall %.2fx    "
        "vell / cheaper library floor: instructions %.2fx\n",
        vell.median_us() / c_floor.median_us(), vell.median_us() / confined.median_us(),
        double(vell.instructions) / library.instructions);
  }
  // What the build costs in flash.
  run({"/usr/bin/strip", "-o", scratch, vell_path});
  struct stat stripped {};
  stat(scratch_name, &stripped);
  std::printf("\n%s: %lld bytes stripped\n", vell_path.c_str(),
              static_cast<long long>(stripped.st_size));
  unlink(scratch_name);
  return 0;
}
