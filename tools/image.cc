#include "tools/image.h"

#include <fcntl.h>
#include <spawn.h>
#include <sys/mman.h>
#include <sys/mount.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <vector>

#include "tools/sandbox.h"

extern char** environ;

namespace vell::sandbox {
namespace {

constexpr char wanted_help[] =
    "IMAGE is a device image directory, a root file system as a tar archive (plain, gzip, bzip2, "
    "xz or zstd) or an ext2/3/4, squashfs or erofs image, or a scenario file";

bool at(const std::string& head, size_t offset, const std::string& magic) {
  return head.size() >= offset + magic.size() && head.compare(offset, magic.size(), magic) == 0;
}

// The first `size` bytes of `path` (fewer when it is shorter).
std::string first_bytes(const std::string& path, size_t size) {
  const int fd = open(path.c_str(), O_RDONLY | O_CLOEXEC);
  if (fd < 0) throw vell_try_error(path + ": " + std::strerror(errno));
  std::string head(size, '\0');
  const ssize_t n = pread(fd, head.data(), head.size(), 0);
  close(fd);
  head.resize(n < 0 ? 0 : n);
  return head;
}

// Runs `argv` with standard output discarded; its status, and its standard error.
std::pair<int, std::string> run_tool(const std::vector<std::string>& argv) {
  std::vector<char*> args;
  for (const std::string& word : argv) args.push_back(const_cast<char*>(word.c_str()));
  args.push_back(nullptr);
  const int errors = memfd_create("vell-try-tool", MFD_CLOEXEC);
  posix_spawn_file_actions_t actions;
  posix_spawn_file_actions_init(&actions);
  posix_spawn_file_actions_addopen(&actions, 0, "/dev/null", O_RDONLY, 0);
  posix_spawn_file_actions_addopen(&actions, 1, "/dev/null", O_WRONLY, 0);
  posix_spawn_file_actions_adddup2(&actions, errors, 2);
  pid_t child = -1;
  const int failed =
      errors < 0 ? errno : posix_spawnp(&child, args[0], &actions, nullptr, args.data(), environ);
  posix_spawn_file_actions_destroy(&actions);
  if (failed != 0) {
    if (errors >= 0) close(errors);
    throw vell_try_error(argv[0] + ": " + std::strerror(failed) + " (" + wanted_help + ")");
  }
  int status = 0;
  while (waitpid(child, &status, 0) < 0 && errno == EINTR) {
  }
  std::string text;
  char buffer[4096];
  for (ssize_t n; (n = pread(errors, buffer, sizeof buffer, text.size())) > 0;)
    text.append(buffer, n);
  close(errors);
  return {WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status), text};
}

void run_or_throw(const std::vector<std::string>& argv, const std::string& image,
                  bool (*harmless)(const std::string& line) = nullptr) {
  const auto [status, errors] = run_tool(argv);
  if (status == 0) return;
  // A tool may fail only for what it may: a wanted folder the image lacks.
  bool all_harmless = harmless != nullptr;
  std::string last;
  for (size_t begin = 0, end; begin < errors.size(); begin = end + 1) {
    end = errors.find('\n', begin);
    if (end == std::string::npos) end = errors.size();
    const std::string line = errors.substr(begin, end - begin);
    if (line.empty()) continue;
    if (harmless == nullptr || !harmless(line)) {
      all_harmless = false;
      last = line;
    }
  }
  if (!all_harmless)
    throw vell_try_error(image + ": " + argv[0] + " cannot unpack it: " +
                         (last.empty() ? "exit status " + std::to_string(status) : last));
}

}  // namespace

image_kind kind_of(const std::string& path) {
  struct stat st;
  if (stat(path.c_str(), &st) != 0) throw vell_try_error(path + ": " + std::strerror(errno));
  if (S_ISDIR(st.st_mode)) return image_kind::directory;
  const std::string head = first_bytes(path, 4096);
  if (at(head, 0, "hsqs")) return image_kind::squashfs;
  if (at(head, 1080, "\x53\xef")) return image_kind::ext;
  if (at(head, 1024, "\xe2\xe1\xf5\xe0")) return image_kind::erofs;
  if (at(head, 257, "ustar") || at(head, 0, "\x1f\x8b") || at(head, 0, "BZh") ||
      at(head, 0,
         "\xfd"
         "7zXZ") ||
      at(head, 0, "\x28\xb5\x2f\xfd"))
    return image_kind::tar;
  for (const unsigned char c : head.substr(0, 512)) {
    if (c < 0x20 && c != '\n' && c != '\t' && c != '\r')
      throw vell_try_error(path + " is none of what vell-try reads: " + wanted_help);
  }
  return image_kind::text;
}

void unpack(const std::string& image, image_kind kind, const std::string& into) {
  const std::string var = into + "/var", share = into + "/usr/share";
  for (const std::string& dir : {var, into + "/usr", share}) mkdir(dir.c_str(), 0755);
  switch (kind) {
    case image_kind::tar: {
      // The whole archive is read to find the members: with a decompressor
      // that uses every core where one is at hand (xz's threads only help an
      // archive compressed in blocks, as xz -T makes them).
      std::vector<std::string> tar{"tar", "-x", "-f", image, "-C", into, "--no-same-owner"};
      const std::string head = first_bytes(image, 6);
      if (at(head, 0, "BZh") && !on_path("lbzip2").empty())
        tar.push_back("--use-compress-program=lbzip2");
      if (at(head, 0,
             "\xfd"
             "7zXZ"))
        tar.push_back("--use-compress-program=xz -T0");
      // Members are named "var/db/..." or "./var/db/...", as the archive was
      // made: both are asked for, and the form it lacks is not found.
      for (const char* member :
           {"var/db", "./var/db", "usr/share/zoneinfo.default", "./usr/share/zoneinfo.default",
            "usr/share/icu", "./usr/share/icu"})
        tar.push_back(member);
      run_or_throw(tar, image, [](const std::string& line) {
        return line.ends_with("Not found in archive") ||
               line.starts_with("tar: Exiting with failure status");
      });
      break;
    }
    case image_kind::ext: {
      // debugfs reads the file system itself, without mounting it; a wanted
      // folder it lacks is only a message.
      const std::string commands = into + "/.debugfs";
      const std::string text = "rdump /var/db " + var +
                               "\nrdump /usr/share/zoneinfo.default /usr/share/icu " + share + "\n";
      const int fd = open(commands.c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, 0600);
      const bool written = fd >= 0 && write(fd, text.data(), text.size()) == ssize_t(text.size());
      if (fd >= 0) close(fd);
      if (!written) throw vell_try_error(commands + ": " + std::strerror(errno));
      run_or_throw({"debugfs", "-f", commands, image}, image);
      unlink(commands.c_str());
      break;
    }
    case image_kind::squashfs:
      run_or_throw({"unsquashfs", "-n", "-no-xattrs", "-f", "-d", into, image, "/var/db",
                    "/usr/share/zoneinfo.default", "/usr/share/icu"},
                   image);
      break;
    case image_kind::erofs:
      // erofs-utils 1.5 (Debian 12) unpacks a whole image or nothing.
      run_or_throw({"fsck.erofs", "--extract=" + into, "--overwrite", "--no-preserve-owner", image},
                   image);
      break;
    case image_kind::directory:
    case image_kind::text:
      break;
  }
}

vell_scratch_dir::vell_scratch_dir() {
  char name[] = "/tmp/vell-try-image.XXXXXX";
  if (mkdtemp(name) == nullptr)
    throw vell_try_error(std::string("cannot make a folder in /tmp: ") + std::strerror(errno));
  path_ = name;
  if (mount("vell-try", name, "tmpfs", MS_NOSUID | MS_NODEV, "mode=0755") != 0) {
    const int error = errno;
    rmdir(name);
    throw vell_try_error(std::string("cannot mount memory for the image: ") + std::strerror(error));
  }
}

vell_scratch_dir::~vell_scratch_dir() {
  umount2(path_.c_str(), MNT_DETACH);
  rmdir(path_.c_str());
}

}  // namespace vell::sandbox
