#include "testing/sandbox.h"

#include <errno.h>
#include <fcntl.h>
#include <ftw.h>
#include <sched.h>
#include <signal.h>
#include <sys/mount.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <sstream>
#include <stdexcept>

#include <gtest/gtest.h>

namespace vell::testing {
namespace {

const char* const covered[] = {"/var", "/usr/share"};

[[noreturn]] void fail(const std::string& what) {
  throw std::runtime_error("sandbox: " + what + ": " + std::strerror(errno) +
                           " (tests need a private mount namespace; refusing to run on the host)");
}

[[noreturn]] void fail_layout(const std::string& what) {
  throw std::runtime_error("lay_out: " + what + ": " + std::strerror(errno));
}

// A later entry replaces a file or link that an earlier one put at the same path.
void make_room(const std::string& path) {
  struct stat st;
  if (lstat(path.c_str(), &st) == 0 && !S_ISDIR(st.st_mode)) unlink(path.c_str());
}

void write_proc(const char* path, const std::string& text) {
  const int fd = open(path, O_WRONLY | O_CLOEXEC);
  if (fd < 0 || write(fd, text.data(), text.size()) != static_cast<ssize_t>(text.size())) fail(path);
  close(fd);
}

void enter_private_namespace() {
  static bool entered = false;
  if (entered) return;
  const uid_t uid = geteuid();
  const gid_t gid = getegid();
  if (unshare(CLONE_NEWNS | (uid == 0 ? 0 : CLONE_NEWUSER)) != 0) fail("unshare");
  if (uid != 0) {
    write_proc("/proc/self/setgroups", "deny");
    write_proc("/proc/self/uid_map", "0 " + std::to_string(uid) + " 1");
    write_proc("/proc/self/gid_map", "0 " + std::to_string(gid) + " 1");
  }
  // Without this, mounts made below could propagate back to the host.
  if (mount(nullptr, "/", nullptr, MS_REC | MS_PRIVATE, nullptr) != 0) fail("make / private");
  for (const char* dir : covered) {
    if (mount("vell-guard", dir, "tmpfs", MS_RDONLY | MS_NOSUID | MS_NODEV, "size=64k") != 0)
      fail(std::string("guard ") + dir);
  }
  entered = true;
}


// Splits "path [0640]" into the path and its mode.
void make_parents(const std::string& path) {
  for (size_t slash = path.find('/', 1); slash != std::string::npos; slash = path.find('/', slash + 1)) {
    const std::string parent = path.substr(0, slash);
    make_room(parent);
    mkdir(parent.c_str(), 0755);
  }
}

std::string take_mode(std::string left, mode_t* mode) {
  const size_t open_bracket = left.rfind(" [");
  if (open_bracket != std::string::npos && left.back() == ']') {
    *mode = static_cast<mode_t>(std::stoul(left.substr(open_bracket + 2), nullptr, 8));
    left.erase(open_bracket);
  }
  return left;
}

void lay_out_one(const std::string& entry) {
  const size_t arrow = entry.find(" -> ");
  const size_t equals = entry.find(" = ");
  if (arrow != std::string::npos && (equals == std::string::npos || arrow < equals)) {
    const std::string path = entry.substr(0, arrow);
    make_parents(path);
    make_room(path);
    if (symlink(entry.substr(arrow + 4).c_str(), path.c_str()) != 0) fail_layout("symlink " + path);
    return;
  }
  if (equals != std::string::npos) {
    mode_t mode = 0644;
    const std::string path = take_mode(entry.substr(0, equals), &mode);
    make_parents(path);
    make_room(path);
    std::ofstream(path, std::ios::binary) << entry.substr(equals + 3);
    if (chmod(path.c_str(), mode) != 0) fail_layout("chmod " + path);
    return;
  }
  mode_t mode = 0755;
  std::string path = take_mode(entry, &mode);
  if (path.empty() || path.back() != '/') throw std::invalid_argument("lay_out: cannot read " + entry);
  path.pop_back();
  make_parents(path);
  make_room(path);
  if (mkdir(path.c_str(), mode) != 0 && errno != EEXIST) fail_layout("mkdir " + path);
  chmod(path.c_str(), mode);
}

std::string read_all(const std::string& path) {
  std::ifstream in(path, std::ios::binary);
  std::ostringstream text;
  text << in.rdbuf();
  return text.str();
}

std::vector<std::string> split_lines(const std::string& text) {
  std::vector<std::string> lines;
  std::istringstream in(text);
  for (std::string line; std::getline(in, line);) {
    if (line.rfind("vell: ", 0) == 0) line.erase(0, 6);
    lines.push_back(line);
  }
  return lines;
}

std::vector<std::string>* snapshot_lines;

int note_entry(const char* path, const struct stat* st, int, struct FTW*) {
  snapshot_lines->push_back(std::string(path) + " " + show(path) +
                            " mode " + std::to_string(st->st_mode & 07777));
  return 0;
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

void sandbox::lay_out(std::initializer_list<std::string> entries) {
  for (const std::string& entry : entries) lay_out_one(entry);
}

std::string show(const std::string& path) {
  struct stat st;
  if (lstat(path.c_str(), &st) != 0) return "absent";
  if (S_ISDIR(st.st_mode)) return "/";
  if (S_ISLNK(st.st_mode)) {
    char target[4096];
    const ssize_t n = readlink(path.c_str(), target, sizeof target);
    return "-> " + std::string(target, n < 0 ? 0 : n);
  }
  return "= " + read_all(path);
}

std::string snapshot() {
  std::vector<std::string> lines;
  snapshot_lines = &lines;
  for (const char* dir : covered) nftw(dir, note_entry, 16, FTW_PHYS);
  std::sort(lines.begin(), lines.end());
  std::string all;
  for (const std::string& line : lines) all += line + "\n";
  return all;
}

// The binary under test; testing/run-unprivileged moves it where nobody can reach it.
const char* vell_binary() {
  const char* moved = std::getenv("VELL_TEST_BINARY");
  return moved != nullptr ? moved : VELL_BINARY;
}

run_result run_vell(const std::vector<std::string>& wrapper) {
  std::vector<char*> argv;
  for (const std::string& word : wrapper) argv.push_back(const_cast<char*>(word.c_str()));
  argv.push_back(const_cast<char*>(wrapper.empty() ? "vell" : vell_binary()));
  argv.push_back(nullptr);
  int pipe_fds[2];
  if (pipe2(pipe_fds, O_CLOEXEC) != 0) fail("pipe");
  const pid_t child = fork();
  if (child < 0) fail("fork");
  if (child == 0) {
    dup2(pipe_fds[1], 2);
    const int null_fd = open("/dev/null", O_RDONLY);
    dup2(null_fd, 0);
    alarm(20);
    char* const envp[] = {nullptr};
    execve(wrapper.empty() ? vell_binary() : argv[0], argv.data(), envp);
    _exit(127);
  }
  close(pipe_fds[1]);
  std::string text;
  char buffer[4096];
  for (ssize_t n; (n = read(pipe_fds[0], buffer, sizeof buffer)) != 0;) {
    if (n < 0 && errno == EINTR) continue;
    if (n < 0) break;
    text.append(buffer, n);
  }
  close(pipe_fds[0]);
  int wait_status = 0;
  while (waitpid(child, &wait_status, 0) < 0 && errno == EINTR) {
  }
  const int status = WIFEXITED(wait_status) ? WEXITSTATUS(wait_status) : 128 + WTERMSIG(wait_status);
  return {status, split_lines(text)};
}

std::vector<std::string> messages_of(const std::function<void()>& fn) {
  std::fflush(stderr);
  FILE* capture = std::tmpfile();
  if (capture == nullptr) fail("tmpfile");
  const int saved = dup(2);
  dup2(fileno(capture), 2);
  auto restore = [&] {
    std::fflush(stderr);
    dup2(saved, 2);
    close(saved);
  };
  try {
    fn();
  } catch (...) {
    restore();
    std::fclose(capture);
    throw;
  }
  restore();
  std::rewind(capture);
  std::string text;
  for (int c; (c = std::fgetc(capture)) != EOF;) text.push_back(static_cast<char>(c));
  std::fclose(capture);
  return split_lines(text);
}

call_result call(const std::function<void()>& fn) {
  call_result result;
  result.messages = messages_of([&] {
    try {
      fn();
    } catch (int value) {
      result.thrown = value;
    }
  });
  return result;
}

void lay_out_device() {
  sandbox::lay_out({
      "/usr/share/zoneinfo.default/+VERSION =  2016c\n2017a",
      "/usr/share/zoneinfo.default/America/Los_Angeles = TZif",
      "/usr/share/icu/icutzformat.txt = 44l\n",
      "/var/db/timezone/localtime -> /var/db/timezone/zoneinfo/America/Los_Angeles",
      "/var/db/timezone/TZVersionDiffRecord = 2015z.1.0_2016a.1.0",
      "/var/db/timezone/needs_cleanup = stale",
      "/var/db/icu/",
  });
  for (const char* version : {"2016a.1.0", "2016b.1.0", "2016d.1.0", "2016e.1.0", "2017a.1.0"}) {
    const std::string dataset = std::string("/var/db/timezone/tz/") + version;
    const char* schema = version[3] == '7' ? "44b" : "44l";
    sandbox::lay_out({dataset + "/zoneinfo/America/Los_Angeles = TZif",
                      dataset + "/icutz/icutz" + schema + ".dat = ICU"});
  }
}

void lay_out_links(const std::string& current, const std::string& latest) {
  if (current == "system") {
    sandbox::lay_out({"/var/db/timezone/zoneinfo -> /usr/share/zoneinfo.default"});
  } else if (!current.empty()) {
    sandbox::lay_out({"/var/db/timezone/zoneinfo -> " + tz + current + "/zoneinfo",
                      "/var/db/timezone/icutz -> " + tz + current + "/icutz"});
  }
  if (!latest.empty()) sandbox::lay_out({"/var/db/timezone/tz_latest -> " + tz + latest});
}

void expect_messages(const std::vector<std::string>& got, const std::vector<std::string>& want) {
  std::string got_text, want_text;
  for (size_t i = 0; i < got.size(); ++i) {
    std::string line = got[i];
    if (i < want.size() && want[i].size() >= 3 && want[i].ends_with(": *")) {
      const std::string head = want[i].substr(0, want[i].size() - 1);
      if (line.rfind(head, 0) == 0) line = head + "*";
    }
    got_text += line + "\n";
  }
  for (const std::string& line : want) want_text += line + "\n";
  EXPECT_EQ(got_text, want_text);
}

}  // namespace vell::testing
