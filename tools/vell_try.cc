// vell-try: runs vell on a device image or a scenario in a sandbox, shows what
// each start did, and exits 0 when the image is fit to ship, 1 when not, and
// 2 when vell-try itself could not run.
#include <getopt.h>
#include <limits.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <optional>
#include <string>

#include "tools/faults.h"
#include "tools/image.h"
#include "tools/sandbox.h"
#include "tools/scenario.h"

namespace {

using vell::sandbox::image_kind;
using vell::sandbox::vell_try_error;

const char synopsis[] =
    "usage: vell-try [--starts N] [--vell PATH] [--then COMMAND] [--faults] IMAGE";
const char usage[] = R"(usage: vell-try [--starts N] [--vell PATH] [--then COMMAND] [--faults] IMAGE
       vell-try --help | --version

Runs vell on IMAGE in a private mount namespace and shows, for each start, its
messages, its exit status and what stands at the links, the marker and the
record before and after (changed rows start with "*"). IMAGE is never changed.

IMAGE is a device image (a directory holding var/db/timezone and usr/share,
seen through overlays, never copied), a root file system as a tar archive
(plain, gzip, bzip2, xz or zstd) or an ext2/3/4, squashfs or erofs image (of
which var/db, usr/share/zoneinfo.default and usr/share/icu are unpacked into
memory; erofs whole), told by content, or a scenario file (below).

  --starts N      N starts (default 1) on an image or a scenario without starts
  --vell PATH     the vell to run (default: the one beside vell-try)
  --then COMMAND  a shell command run in the sandbox after the last start
  --junit FILE    also write every check to FILE as JUnit XML, for CI systems
  -h, --help      this text;  --version  vell-try's version
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
  std::string image, junit;
  const option long_options[] = {
      {"starts", required_argument, nullptr, 's'}, {"vell", required_argument, nullptr, 'v'},
      {"then", required_argument, nullptr, 't'},   {"faults", no_argument, nullptr, 'f'},
      {"junit", required_argument, nullptr, 'j'},  {"help", no_argument, nullptr, 'h'},
      {"version", no_argument, nullptr, 'V'},      {nullptr, 0, nullptr, 0}};
  // Errors are ours to say, with what was wrong, then the synopsis.
  opterr = 0;
  for (int option; (option = getopt_long(argc, argv, ":h", long_options, nullptr)) != -1;) {
    const std::string given = argv[optind - 1];
    switch (option) {
      case 'h':
        std::fputs(usage, stdout);
        return 0;
      case 'V':
        std::printf("vell-try %s\n", VELL_VERSION);
        return 0;
      case 's': {
        char* end;
        const long n = std::strtol(optarg, &end, 10);
        if (*optarg == '\0' || *end != '\0' || n < 1 || n > 1000)
          throw vell_try_error("--starts takes a number from 1 to 1000, not " +
                               std::string(optarg));
        starts = n;
        break;
      }
      case 'v':
        options.vell = optarg;
        break;
      case 't':
        options.then = optarg;
        break;
      case 'f':
        faults = true;
        break;
      case 'j':
        junit = optarg;
        break;
      case ':':
        throw vell_try_error(given + " needs a value\n" + synopsis);
      default:
        throw vell_try_error("unknown option " + given + "\n" + synopsis);
    }
  }
  if (optind < argc) image = argv[optind++];
  if (optind < argc)
    throw vell_try_error("one IMAGE only, not also " + std::string(argv[optind]) + "\n" + synopsis);
  if (image.empty()) throw vell_try_error(std::string("no IMAGE\n") + synopsis);
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
  const image_kind kind = vell::sandbox::kind_of(image);
  const bool is_image = kind != image_kind::text;
  if (kind == image_kind::directory) vell::sandbox::check_image(image);
  std::vector<vell::sandbox::vell_scenario> scenarios =
      is_image ? std::vector{vell::sandbox::image_scenario(image, starts)}
               : vell::sandbox::read_scenarios(image, starts);
  const std::string strace = faults ? vell::sandbox::find_strace() : "";
  bool any_marked = false;
  for (const auto& s : scenarios) any_marked = any_marked || s.faults;

  vell::sandbox::enter_private_namespace();
  // An image file: what the starts read, unpacked into memory of this namespace.
  std::optional<vell::sandbox::vell_scratch_dir> unpacked;
  if (is_image && kind != image_kind::directory) {
    unpacked.emplace();
    vell::sandbox::unpack(image, kind, unpacked->path());
    if (stat((unpacked->path() + "/var/db/timezone").c_str(), &st) != 0 || !S_ISDIR(st.st_mode))
      throw vell_try_error(image + " is no device image: it has no var/db/timezone directory");
    scenarios.front().image = unpacked->path();
  }
  std::vector<vell::sandbox::vell_check> checks;
  for (const auto& s : scenarios) {
    if (faults && any_marked && !s.faults) continue;
    for (vell::sandbox::vell_check& check :
         faults ? vell::sandbox::sweep(s, options.vell, strace) : vell::sandbox::play(s, options))
      checks.push_back(std::move(check));
    std::fflush(stdout);
  }
  const std::vector<std::string> failures = vell::sandbox::failures_of(checks);
  for (const std::string& failure : failures) std::printf("vell-try: fail: %s\n", failure.c_str());
  if (!junit.empty()) vell::sandbox::write_junit(junit, checks);
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
