#include "tools/sandbox.h"

#include <dirent.h>
#include <fcntl.h>
#include <sched.h>
#include <signal.h>
#include <sys/mman.h>
#include <sys/mount.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <sstream>

#include "tools/notation.h"

namespace vell::sandbox {
namespace {

const char* const covered[] = {"/var", "/usr/share"};
// The upper layers of an image's overlays, in the memory mounted at /var beneath them.
const char* const stage_dirs[] = {"/var/.vell-try",           "/var/.vell-try/var",
                                  "/var/.vell-try/share",     "/var/.vell-try/var/upper",
                                  "/var/.vell-try/var/work",  "/var/.vell-try/share/upper",
                                  "/var/.vell-try/share/work"};

bool in_user_namespace = false;

std::string with_errno(const std::string& what) { return what + ": " + std::strerror(errno); }

void write_proc(const char* path, const std::string& text) {
  const int fd = open(path, O_WRONLY | O_CLOEXEC);
  const bool written = fd >= 0 && write(fd, text.data(), text.size()) == ssize_t(text.size());
  if (fd >= 0) close(fd);
  if (!written) throw vell_try_error(with_errno(std::string("cannot write ") + path));
}

void mount_or_throw(const char* source, const char* target, const char* type, unsigned long flags,
                    const std::string& options) {
  if (mount(source, target, type, flags, options.c_str()) != 0)
    throw std::runtime_error(with_errno(std::string("cannot mount ") + type + " on " + target));
}

}  // namespace

void enter_private_namespace() {
  static bool entered = false;
  if (entered) return;
  const uid_t uid = geteuid();
  const gid_t gid = getegid();
  in_user_namespace = uid != 0;
  if (unshare(CLONE_NEWNS | (in_user_namespace ? CLONE_NEWUSER : 0)) != 0)
    throw vell_try_error(with_errno("cannot make a private mount namespace") +
                         " (vell-try never runs vell on this machine's own /var)");
  if (in_user_namespace) {
    write_proc("/proc/self/setgroups", "deny");
    write_proc("/proc/self/uid_map", "0 " + std::to_string(uid) + " 1");
    write_proc("/proc/self/gid_map", "0 " + std::to_string(gid) + " 1");
  }
  // Without this, the mounts below could propagate back to the host.
  if (mount(nullptr, "/", nullptr, MS_REC | MS_PRIVATE, nullptr) != 0)
    throw vell_try_error(with_errno("cannot make the mount namespace private"));
  for (const char* dir : covered) {
    if (mount("vell-guard", dir, "tmpfs", MS_RDONLY | MS_NOSUID | MS_NODEV, "size=64k") != 0)
      throw vell_try_error(with_errno(std::string("cannot guard ") + dir));
  }
  entered = true;
}

void check_image(const std::string& image) {
  struct stat st;
  if (stat(image.c_str(), &st) != 0) throw vell_try_error(with_errno(image));
  if (stat((image + "/var/db/timezone").c_str(), &st) != 0 || !S_ISDIR(st.st_mode))
    throw vell_try_error(image + " is no device image: it has no var/db/timezone directory");
  if (geteuid() == 0) return;
  // In a user namespace only the caller's own user and group are mapped, and
  // an overlay cannot copy up what another owns: vell's writes would fail
  // where on the device they succeed.
  std::vector<std::string> written = {image + "/var", image + "/var/db"};
  for (const char* dir : {"/var/db", "/var/db/timezone"}) {
    DIR* entries = opendir((image + dir).c_str());
    for (const dirent* e; entries != nullptr && (e = readdir(entries)) != nullptr;) {
      if (std::strcmp(e->d_name, "..") != 0) written.push_back(image + dir + "/" + e->d_name);
    }
    if (entries != nullptr) closedir(entries);
  }
  for (const std::string& path : written) {
    if (lstat(path.c_str(), &st) == 0 && (st.st_uid != geteuid() || st.st_gid != getegid()))
      throw vell_try_error(path + " belongs to another user or group: run vell-try as root, or " +
                           "on a copy of the image that is yours");
  }
}

vell_device::vell_device(const std::string& image, std::vector<std::string> entries,
                         std::vector<std::string> wheres)
    : entries_(std::move(entries)), wheres_(std::move(wheres)) {
  if (image.empty()) return;
  image_fd_ = open(image.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
  if (image_fd_ < 0) throw vell_try_error(with_errno(image));
}

vell_device::~vell_device() {
  unmount_all();
  if (image_fd_ >= 0) close(image_fd_);
}

void vell_device::unmount_all() {
  for (; !mounted_.empty(); mounted_.pop_back()) umount2(mounted_.back(), MNT_DETACH);
}

void vell_device::reset() {
  unmount_all();
  const unsigned long flags = MS_NOSUID | MS_NODEV;
  mount_or_throw("vell-try", "/var", "tmpfs", flags, "mode=0755");
  mounted_.push_back("/var");
  if (image_fd_ < 0) {
    mount_or_throw("vell-try", "/usr/share", "tmpfs", flags, "mode=0755");
    mounted_.push_back("/usr/share");
  } else {
    for (const char* dir : stage_dirs) mkdir(dir, 0700);
    // The image's layers are named relative to it, so its path may hold any character.
    if (fchdir(image_fd_) != 0) throw std::runtime_error(with_errno("cannot enter the image"));
    const std::string user = in_user_namespace ? ",userxattr" : "";
    // /usr/share first: once the overlay covers /var, its stage is out of reach.
    for (const char* dir : {covered[1], covered[0]}) {
      const std::string lower = dir + 1, stage = dir == covered[0] ? "var" : "share";
      struct stat st;
      if (stat(lower.c_str(), &st) != 0) {
        mount_or_throw("vell-try", dir, "tmpfs", flags, "mode=0755");
      } else {
        mount_or_throw("vell-try", dir, "overlay", flags,
                       "lowerdir=" + lower + ",upperdir=/var/.vell-try/" + stage +
                           "/upper,workdir=/var/.vell-try/" + stage + "/work" + user);
      }
      mounted_.push_back(dir);
    }
    if (chdir("/") != 0) throw std::runtime_error(with_errno("cannot leave the image"));
  }
  for (size_t i = 0; i < entries_.size(); ++i) {
    try {
      lay_out(entries_[i]);
    } catch (const std::exception& e) {
      throw vell_try_error((i < wheres_.size() ? wheres_[i] + ": " : "") + "cannot lay out " +
                           entries_[i] + ": " + e.what());
    }
  }
}

std::string on_path(const std::string& program) {
  const char* path = std::getenv("PATH");
  std::istringstream dirs(path != nullptr ? path : "/usr/bin:/bin");
  for (std::string dir; std::getline(dirs, dir, ':');) {
    if (!dir.empty() && access((dir + "/" + program).c_str(), X_OK) == 0)
      return dir + "/" + program;
  }
  return "";
}

std::string ending(const start_result& result) {
  return result.killed_after ? "killed after " + std::to_string(result.killed_after) + " s"
                             : "exit status " + std::to_string(result.status);
}

start_result run_start(const std::string& vell, const std::vector<std::string>& wrapper,
                       int limit_seconds) {
  std::vector<const char*> argv;
  for (const std::string& word : wrapper) argv.push_back(word.c_str());
  argv.push_back(vell.c_str());
  argv.push_back(nullptr);
  const int messages = memfd_create("vell-messages", MFD_CLOEXEC);
  const pid_t child = messages < 0 ? -1 : fork();
  if (child < 0) throw std::runtime_error(with_errno("cannot start " + vell));
  if (child == 0) {
    // A group of its own, so that a wrapper and what it runs are killed together.
    setpgid(0, 0);
    dup2(messages, 2);
    // Standard input from /dev/null, and no other descriptor of vell-try's left behind.
    dup2(open("/dev/null", O_RDONLY | O_CLOEXEC), 0);
    char* const no_environment[] = {nullptr};
    execve(argv[0], const_cast<char* const*>(argv.data()), no_environment);
    _exit(127);
  }
  // An alarm with a handler interrupts waitpid instead of ending vell-try.
  struct sigaction on_alarm {};
  on_alarm.sa_handler = [](int) {};
  sigaction(SIGALRM, &on_alarm, nullptr);
  alarm(limit_seconds);
  int wait_status = 0, killed_after = 0;
  while (waitpid(child, &wait_status, 0) < 0) {
    if (errno != EINTR) break;
    kill(-child, SIGKILL);
    kill(child, SIGKILL);
    killed_after = limit_seconds;
  }
  alarm(0);
  start_result result{
      WIFEXITED(wait_status) ? WEXITSTATUS(wait_status) : 128 + WTERMSIG(wait_status),
      {},
      killed_after};
  const std::string text = read_all_and_close(messages);
  for (size_t begin = 0, end; begin < text.size(); begin = end + 1) {
    end = text.find('\n', begin);
    if (end == std::string::npos) end = text.size();
    result.messages.push_back(text.substr(begin, end - begin));
  }
  return result;
}

}  // namespace vell::sandbox
