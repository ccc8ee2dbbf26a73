// vell-try: runs vell on a device image or a scenario in a sandbox, shows what
// each start did, and exits 0 when the image is fit to ship, 1 when not, and
// 2 when vell-try itself could not run.
#include <limits.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>

#include "tools/faults.h"
#include "tools/sandbox.h"
#include "tools/scenario.h"

namespace {

using vell::sandbox::vell_try_error;

const char usage[] = R"(usage: vell-try [--starts N] [--vell PATH] [--then COMMAND] [--faults] IMAGE

Runs vell on IMAGE in a private mount namespace and shows, for each start, its
messages, its exit status and what stands at the links, the marker and the
record before and after (changed rows start with "*"). IMAGE is never changed.

IMAGE is a device image (a directory holding var/db/timezone and usr/share,
seen through overlays, never copied) or a scenario file (below).

  --starts N      N starts (default 1) on an image or a scenario without starts
  --vell PATH     the vell to run (default: the one beside vell-try)
  --then COMMAND  a shell command run in the sandbox after the last start
  --faults        sweep the first start instead: every file-system call of it
                  in turn fails with EIO, and separately the start is killed
                  there; report each point after which two clean starts leave
                  the device failing the check below, or that changed a
                  download or the system partition (needs strace)

Exit status: 0 when the last start ended with 0, the links lead to usable data
(zoneinfo names the system data or a download with an ICU data file for the
system's schema, icutz that download's icutz or nothing, localtime a zone file
through zoneinfo), one more start changes nothing and every expectation of a
scenario held; 1 otherwise, with a line for each that failed; 2 when vell-try
could not run.

A scenario file holds scenarios, each begun by a "device" line; "#" starts a
comment, and the comment above a device line names its scenario:
  device [CURRENT LATEST]  a small built-in device: system data 2016c, ICU
                           schema 44l; downloads 2016a.1.0, 2016b.1.0,
                           2016d.1.0, 2016e.1.0 (44l) and 2017a.1.0 (44b);
                           zoneinfo and icutz naming CURRENT ("system", or "-"
                           for no link), tz_latest naming LATEST ("-": none)
  ENTRY                    before the first start, laid out; after it, what
                           must stand there:
      PATH/  PATH -> TARGET  PATH => OTHER (a hard link)  PATH = TEXT
      PATH [0640] = TEXT  PATH fifo  PATH absent
  start [STATUS]           a start; with STATUS, it must end so and print
  | MESSAGE                exactly these messages, without "vell: " and
                           the error text
  active DATASET           zoneinfo and icutz name DATASET, or "system"
  verdict REASON           the check above fails, for this reason
  limit SECONDS            before the first start: each start is killed
                           after SECONDS (1 to 60) instead of 5
  faults                   --faults sweeps this scenario (if none is marked,
                           every scenario of the file)
  known eio|kill CALL PATH [#N]  a fault point known to leave it failing
In a line "@" stands for "/var/db/timezone/" and "{c*N}" for N times c.
)";

std::string absolute(const std::string& path) {
  char resolved[PATH_MAX];
  if (realpath(path.c_str(), resolved) == nullptr)
    throw vell_try_error(path + ": " + std::strerror(errno));
  return resolved;
}

std::string vell_beside_this_program() {
  char self[PATH_MAX];
  const ssize_t n = readlink("/proc/self/exe", self, sizeof self - 1);
  if (n < 0) return "vell";
  const std::string path(self, n);
  return path.substr(0, path.rfind('/') + 1) + "vell";
}

int run(int argc, char** argv) {
  vell::sandbox::vell_try_options options{vell_beside_this_program(), ""};
  int starts = 1;
  bool faults = false;
  std::string image;
  for (int i = 1; i < argc; ++i) {
    const std::string arg = argv[i];
    const bool has_value = i + 1 < argc;
    if (arg == "-h" || arg == "--help") {
      std::fputs(usage, stdout);
      return 0;
    } else if (arg == "--starts" && has_value) {
      char* end;
      starts = std::strtol(argv[++i], &end, 10);
      if (*end != '\0' || starts < 1 || starts > 1000)
        throw vell_try_error("--starts takes a number from 1 to 1000");
    } else if (arg == "--vell" && has_value) {
      options.vell = argv[++i];
    } else if (arg == "--then" && has_value) {
      options.then = argv[++i];
    } else if (arg == "--faults") {
      faults = true;
    } else if (arg.starts_with("-") || !image.empty()) {
      throw vell_try_error(
          "usage: vell-try [--starts N] [--vell PATH] [--then COMMAND] "
          "[--faults] IMAGE (--help tells more)");
    } else {
      image = arg;
    }
  }
  if (image.empty()) throw vell_try_error("no IMAGE (--help tells more)");
  image = absolute(image);
  options.vell = absolute(options.vell);
  struct stat st;
  if (stat(options.vell.c_str(), &st) != 0 || !S_ISREG(st.st_mode) ||
      access(options.vell.c_str(), X_OK) != 0)
    throw vell_try_error(options.vell + " is no program vell-try can run (--vell PATH)");
  // The sandbox covers these: vell would vanish from under its own path.
  for (const char* covered : {"/var/", "/usr/share/"}) {
    if (options.vell.starts_with(covered) || image.starts_with(covered))
      throw vell_try_error(options.vell + " and " + image + " must lie outside " + covered +
                           ", which the sandbox covers");
  }
  const bool is_image = stat(image.c_str(), &st) == 0 && S_ISDIR(st.st_mode);
  if (is_image) vell::sandbox::check_image(image);
  const std::vector<vell::sandbox::vell_scenario> scenarios =
      is_image ? std::vector{vell::sandbox::image_scenario(image, starts)}
               : vell::sandbox::read_scenarios(image, starts);
  const std::string strace = faults ? vell::sandbox::find_strace() : "";
  bool any_marked = false;
  for (const auto& s : scenarios) any_marked = any_marked || s.faults;

  vell::sandbox::enter_private_namespace();
  std::vector<std::string> failures;
  for (const auto& s : scenarios) {
    if (faults && any_marked && !s.faults) continue;
    for (const std::string& failure :
         faults ? vell::sandbox::sweep(s, options.vell, strace) : vell::sandbox::play(s, options))
      failures.push_back(failure);
    std::fflush(stdout);
  }
  for (const std::string& failure : failures) std::printf("vell-try: fail: %s\n", failure.c_str());
  if (failures.empty())
    std::printf("vell-try: pass: %s\n",
                faults     ? "after every fault point two clean starts left usable links that one "
                             "more start did not change, and no download or system data changed"
                : is_image ? "the last start ended with 0, the links lead to usable data, and one "
                             "more start changed nothing"
                           : "every scenario ended as its expectations and verdicts say");
  return failures.empty() ? 0 : 1;
}

}  // namespace

int main(int argc, char** argv) {
  try {
    return run(argc, argv);
  } catch (const std::exception& e) {
    std::fflush(stdout);
    std::fprintf(stderr, "vell-try: %s\n", e.what());
    return 2;
  }
}
