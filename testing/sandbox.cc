#include "testing/sandbox.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sched.h>
#include <sys/mount.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <filesystem>
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
  if (!(std::ofstream(path, std::ios::binary) << text)) fail("write " + path);
}

std::string read_file(const std::string& path) {
  std::ostringstream text;
  text << std::ifstream(path, std::ios::binary).rdbuf();
  return text.str();
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

std::string expand(const std::string& line) {
  std::string out;
  for (size_t i = 0; i < line.size(); ++i) {
    const size_t star = line.find('*', i), close = line.find('}', i);
    if (line[i] == '@') {
      out += "/var/db/timezone/";
    } else if (line[i] == '{' && star == i + 2 && close != std::string::npos) {
      out.append(std::stoul(line.substr(i + 3)), line[i + 1]);
      i = close;
    } else {
      out += line[i];
    }
  }
  return out;
}

// A message without the error text that warn() puts after its last ": ",
// and without the blanks before it.
std::string without_error_text(const std::string& message) {
  const std::string text = message.substr(0, message.rfind(": "));
  return text.substr(0, text.find_last_not_of(' ') + 1);
}

std::string dataset_part(const std::string& dataset, const std::string& part) {
  return dataset == "system" ? "/usr/share/zoneinfo.default"
                             : "/var/db/timezone/tz/" + dataset + part;
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
  const size_t blank = entry.find(' ');
  std::string path = entry.substr(0, blank);
  std::string rest = blank == std::string::npos ? "" : entry.substr(blank + 1);
  mode_t mode = path.ends_with('/') ? 0755 : 0644;
  if (rest.starts_with("[")) {
    mode = std::stoul(rest.substr(1), nullptr, 8);
    rest.erase(0, rest.find(']') + 2);
  }
  if (path.ends_with('/')) path.pop_back();
  make_room(path);
  bool made = true;
  if (rest.starts_with("-> ")) {
    made = symlink(rest.c_str() + 3, path.c_str()) == 0;
  } else if (rest.starts_with("=> ")) {
    made = link(rest.c_str() + 3, path.c_str()) == 0;
  } else if (rest.starts_with("=")) {
    write_file(path, rest.substr(std::min<size_t>(2, rest.size())));
  } else if (rest == "fifo") {
    made = mkfifo(path.c_str(), mode) == 0;
  } else if (rest.empty()) {
    made = mkdir(path.c_str(), mode) == 0 || errno == EEXIST;
  } else if (rest != "absent") {
    throw std::invalid_argument("lay_out: cannot read " + entry);
  }
  if (!made || (rest.starts_with("=") && chmod(path.c_str(), mode) != 0)) fail(entry);
}

std::string entry_at(const std::string& path, bool with_mode) {
  struct stat st;
  if (lstat(path.c_str(), &st) != 0) return path + " absent";
  char mode[16] = "";
  if (with_mode) std::snprintf(mode, sizeof mode, " [%04o]", st.st_mode & 07777);
  if (S_ISDIR(st.st_mode)) return path + "/";
  if (S_ISFIFO(st.st_mode)) return path + " fifo";
  if (S_ISLNK(st.st_mode)) return path + " -> " + std::filesystem::read_symlink(path).string();
  return path + mode + " = " + read_file(path);
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

run_result run_vell(const std::vector<std::string>& wrapper) {
  // testing/run-unprivileged moves the binary where an ordinary user can reach it.
  const char* moved = std::getenv("VELL_TEST_BINARY");
  std::vector<const char*> argv;
  for (const std::string& word : wrapper) argv.push_back(word.c_str());
  argv.push_back(moved != nullptr ? moved : VELL_BINARY);
  argv.push_back(nullptr);
  FILE* messages = std::tmpfile();
  const pid_t child = messages == nullptr ? -1 : fork();
  if (child < 0) fail("fork");
  if (child == 0) {
    dup2(fileno(messages), 2);
    dup2(open("/dev/null", O_RDONLY), 0);
    alarm(5);
    char* const no_environment[] = {nullptr};
    execve(argv[0], const_cast<char* const*>(argv.data()), no_environment);
    _exit(127);
  }
  int wait_status = 0;
  while (waitpid(child, &wait_status, 0) < 0 && errno == EINTR) {
  }
  run_result result{WIFEXITED(wait_status) ? WEXITSTATUS(wait_status) : 128 + WTERMSIG(wait_status),
                    {}};
  std::istringstream lines(read_file("/proc/self/fd/" + std::to_string(fileno(messages))));
  std::fclose(messages);
  for (std::string line; std::getline(lines, line);)
    result.messages.push_back(line.starts_with("vell: ") ? line.substr(6) : line);
  return result;
}

std::vector<scenario> read_scenarios() {
  std::vector<std::filesystem::path> files;
  for (const auto& entry : std::filesystem::directory_iterator(VELL_SCENARIOS))
    files.push_back(entry);
  std::sort(files.begin(), files.end());
  std::vector<scenario> all;
  for (const auto& file : files) {
    std::ifstream in(file);
    std::string title, previous;
    int number = 0;
    for (std::string line; std::getline(in, line); previous = line) {
      ++number;
      if (line.starts_with("#") && !previous.starts_with("#")) title = line;
      if (line.starts_with("device"))
        all.push_back({file.filename().string() + ":" + std::to_string(number) + " " + title, {}});
      if (!line.empty() && !line.starts_with("#") && !all.empty())
        all.back().steps.push_back(expand(line));
    }
  }
  return all;
}

void play(const scenario& s, bool set_up_only) {
  bool started = false;
  for (size_t i = 0; i < s.steps.size(); ++i) {
    const std::string& step = s.steps[i];
    std::istringstream words(step);
    std::string word, current, latest;
    words >> word >> current >> latest;
    if (word == "device") {
      lay_out_device();
      if (current.empty()) continue;
      if (current != "-")
        lay_out("/var/db/timezone/zoneinfo -> " + dataset_part(current, "/zoneinfo"));
      if (current != "-" && current != "system")
        lay_out("/var/db/timezone/icutz -> " + dataset_part(current, "/icutz"));
      if (latest != "-") lay_out("/var/db/timezone/tz_latest -> " + dataset_part(latest, ""));
    } else if (word == "start") {
      if (set_up_only) return;
      started = true;
      const run_result result = run_vell();
      EXPECT_EQ(result.status, std::stoi(current)) << step;
      std::string got, want;
      for (const std::string& message : result.messages) got += without_error_text(message) + "\n";
      while (i + 1 < s.steps.size() && s.steps[i + 1].starts_with("| "))
        want += s.steps[++i].substr(2) + "\n";
      EXPECT_EQ(got, want) << step;
    } else if (word == "active") {
      const bool system = current == "system";
      EXPECT_EQ(entry_at("/var/db/timezone/zoneinfo"),
                "/var/db/timezone/zoneinfo -> " + dataset_part(current, "/zoneinfo"));
      EXPECT_EQ(entry_at("/var/db/timezone/icutz"),
                "/var/db/timezone/icutz" +
                    (system ? " absent" : " -> " + dataset_part(current, "/icutz")));
    } else if (step.starts_with("/") && !started) {
      lay_out(step);
    } else if (step.starts_with("/")) {
      std::string path = word;
      if (path.size() > 1 && path.ends_with('/')) path.pop_back();
      const std::string got = entry_at(path, current.starts_with("["));
      EXPECT_EQ(got.substr(0, got.find_last_not_of(' ') + 1), step);
    }
  }
}

}  // namespace vell::testing
