#include "testing/sandbox.h"

#include <fcntl.h>
#include <sched.h>
#include <sys/mount.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <sstream>
#include <stdexcept>

namespace vell::testing {
namespace {

const char* const covered[] = {"/var", "/usr/share"};

[[noreturn]] void fail(const std::string& what) {
  throw std::runtime_error("sandbox: " + what + ": " + std::strerror(errno) +
                           " (tests need a private mount namespace; refusing to run on the host)");
}

void write_file(const std::string& path, const std::string& text) {
  std::ofstream out(path, std::ios::binary);
  if (!(out << text)) fail("write " + path);
}

void enter_private_namespace() {
  static bool entered = false;
  if (entered) return;
  const uid_t uid = geteuid();
  const gid_t gid = getegid();
  if (unshare(CLONE_NEWNS | (uid == 0 ? 0 : CLONE_NEWUSER)) != 0) fail("unshare");
  if (uid != 0) {
    write_file("/proc/self/setgroups", "deny");
    write_file("/proc/self/uid_map", "0 " + std::to_string(uid) + " 1");
    write_file("/proc/self/gid_map", "0 " + std::to_string(gid) + " 1");
  }
  // Without this, mounts made below could propagate back to the host.
  if (mount(nullptr, "/", nullptr, MS_REC | MS_PRIVATE, nullptr) != 0) fail("make / private");
  for (const char* dir : covered) {
    if (mount("vell-guard", dir, "tmpfs", MS_RDONLY | MS_NOSUID | MS_NODEV, "size=64k") != 0)
      fail(std::string("guard ") + dir);
  }
  entered = true;
}

// Clears a file or link standing at `path` or at one of its parents, and
// makes the parents.
void make_room(const std::string& path) {
  struct stat st;
  for (size_t slash = path.find('/', 1);; slash = path.find('/', slash + 1)) {
    const std::string part = path.substr(0, slash);
    if (lstat(part.c_str(), &st) == 0 && !S_ISDIR(st.st_mode)) unlink(part.c_str());
    if (slash == std::string::npos) return;
    mkdir(part.c_str(), 0755);
  }
}

}  // namespace

sandbox::sandbox() {
  enter_private_namespace();
  for (const char* dir : covered) {
    if (mount("vell-case", dir, "tmpfs", MS_NOSUID | MS_NODEV, "mode=0755") != 0)
      fail(std::string("tmpfs on ") + dir);
  }
}

sandbox::~sandbox() {
  for (const char* dir : covered) umount2(dir, MNT_DETACH);
}

void lay_out(const std::string& entry) {
  if (const size_t hard = entry.find(" => "); hard != std::string::npos) {
    make_room(entry.substr(0, hard));
    if (link(entry.substr(hard + 4).c_str(), entry.substr(0, hard).c_str()) != 0) fail("link");
    return;
  }
  const size_t arrow = entry.find(" -> "), equals = entry.find(" = ");
  if (arrow != std::string::npos && arrow < equals) {
    const std::string path = entry.substr(0, arrow);
    make_room(path);
    if (symlink(entry.substr(arrow + 4).c_str(), path.c_str()) != 0) fail("symlink " + path);
    return;
  }
  std::string path = entry.substr(0, equals);
  mode_t mode = equals == std::string::npos ? 0755 : 0644;
  if (const size_t bracket = path.rfind(" ["); bracket != std::string::npos) {
    mode = std::stoul(path.substr(bracket + 2), nullptr, 8);
    path.erase(bracket);
  }
  if (path.ends_with(" absent")) {
    make_room(path.erase(path.size() - 7));
    return;
  }
  if (path.ends_with(" fifo")) {
    path.erase(path.size() - 5);
    make_room(path);
    if (mkfifo(path.c_str(), 0644) != 0) fail("mkfifo " + path);
  } else if (equals != std::string::npos) {
    make_room(path);
    write_file(path, entry.substr(equals + 3));
  } else if (path.ends_with('/')) {
    path.pop_back();
    make_room(path);
    if (mkdir(path.c_str(), mode) != 0 && errno != EEXIST) fail("mkdir " + path);
  } else {
    throw std::invalid_argument("lay_out: cannot read " + entry);
  }
  if (chmod(path.c_str(), mode) != 0) fail("chmod " + path);
}

void lay_out_device() {
  for (const char* entry :
       {"/usr/share/zoneinfo.default/+VERSION =  2016c\n2017a",
        "/usr/share/zoneinfo.default/America/Los_Angeles = TZif",
        "/usr/share/icu/icutzformat.txt = 44l\n",
        "/var/db/timezone/localtime -> /var/db/timezone/zoneinfo/America/Los_Angeles",
        "/var/db/timezone/TZVersionDiffRecord = 2015z.1.0_2016a.1.0",
        "/var/db/timezone/needs_cleanup = stale", "/var/db/icu/"}) {
    lay_out(entry);
  }
  for (const std::string version :
       {"2016a.1.0", "2016b.1.0", "2016d.1.0", "2016e.1.0", "2017a.1.0"}) {
    const std::string dataset = "/var/db/timezone/tz/" + version;
    lay_out(dataset + "/zoneinfo/America/Los_Angeles = TZif");
    lay_out(dataset + "/icutz/icutz" + (version[3] == '7' ? "44b" : "44l") + ".dat = ICU");
  }
}

std::string show(const std::string& path) {
  struct stat st;
  if (lstat(path.c_str(), &st) != 0) return "absent";
  if (S_ISDIR(st.st_mode)) return "/";
  if (S_ISFIFO(st.st_mode)) return "fifo";
  if (S_ISLNK(st.st_mode)) {
    char target[4096];
    const ssize_t n = readlink(path.c_str(), target, sizeof target);
    return "-> " + std::string(target, n < 0 ? 0 : n);
  }
  std::ostringstream text;
  text << std::ifstream(path, std::ios::binary).rdbuf();
  return "= " + text.str();
}

std::string unusable_links() {
  const std::string zoneinfo = show("/var/db/timezone/zoneinfo");
  const std::string icutz = show("/var/db/timezone/icutz");
  std::string dataset;
  for (const char* version : {"2016a.1.0", "2016b.1.0", "2016d.1.0", "2016e.1.0"}) {
    if (zoneinfo == "-> /var/db/timezone/tz/" + std::string(version) + "/zoneinfo")
      dataset = "/var/db/timezone/tz/" + std::string(version);
  }
  if (dataset.empty() && zoneinfo != "-> /usr/share/zoneinfo.default")
    return "zoneinfo " + zoneinfo;
  if (icutz != (dataset.empty() ? "absent" : "-> " + dataset + "/icutz"))
    return "icutz " + icutz + " beside zoneinfo " + zoneinfo;
  if (!show("/var/db/timezone/localtime").starts_with("-> /var/db/timezone/zoneinfo"))
    return "localtime " + show("/var/db/timezone/localtime");
  return "";
}

run_result run_vell(const std::vector<std::string>& wrapper) {
  // testing/run-unprivileged moves the binary where an ordinary user can reach it.
  const char* moved = std::getenv("VELL_TEST_BINARY");
  std::vector<const char*> argv;
  for (const std::string& word : wrapper) argv.push_back(word.c_str());
  argv.push_back(moved != nullptr ? moved : VELL_BINARY);
  argv.push_back(nullptr);
  int pipe_fds[2];
  if (pipe2(pipe_fds, O_CLOEXEC) != 0) fail("pipe");
  const pid_t child = fork();
  if (child < 0) fail("fork");
  if (child == 0) {
    dup2(pipe_fds[1], 2);
    dup2(open("/dev/null", O_RDONLY), 0);
    alarm(5);
    char* const no_environment[] = {nullptr};
    execve(argv[0], const_cast<char* const*>(argv.data()), no_environment);
    _exit(127);
  }
  close(pipe_fds[1]);
  std::string text;
  char buffer[4096];
  for (ssize_t n; (n = read(pipe_fds[0], buffer, sizeof buffer)) != 0;) {
    if (n > 0) text.append(buffer, n);
    if (n < 0 && errno != EINTR) break;
  }
  close(pipe_fds[0]);
  int wait_status = 0;
  while (waitpid(child, &wait_status, 0) < 0 && errno == EINTR) {
  }
  run_result result{WIFEXITED(wait_status) ? WEXITSTATUS(wait_status) : 128 + WTERMSIG(wait_status),
                    {}};
  std::istringstream lines(text);
  for (std::string line; std::getline(lines, line);)
    result.messages.push_back(line.starts_with("vell: ") ? line.substr(6) : line);
  return result;
}

}  // namespace vell::testing
