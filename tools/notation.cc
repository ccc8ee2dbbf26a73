#include "tools/notation.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <optional>
#include <stdexcept>
#include <string_view>

namespace vell::sandbox {
namespace {

struct entry {
  std::string path;
  std::string_view kind;  // "/", "->", "=>", "=", "fifo", "absent"
  std::string text;       // the target, the other file or the contents
  mode_t mode;
};

std::optional<entry> parse(const std::string& line) {
  const size_t blank = line.find(' ');
  entry e{line.substr(0, blank), {}, "", 0644};
  std::string rest = blank == std::string::npos ? "" : line.substr(blank + 1);
  if (!e.path.starts_with("/") || e.path == "/") return std::nullopt;
  if (rest.starts_with("[")) {
    const size_t close = rest.find("] ");
    if (close != 5 || rest.find_first_not_of("01234567", 1) != close) return std::nullopt;
    e.mode = std::strtoul(rest.c_str() + 1, nullptr, 8);
    rest = rest.substr(close + 2);
  }
  if (e.path.ends_with('/')) {
    e.path.pop_back();
    e.kind = "/";
    if (blank == std::string::npos) e.mode = 0755;
    return rest.empty() ? std::optional(e) : std::nullopt;
  }
  for (const char* kind : {"->", "=>", "="}) {
    const std::string prefix = kind + std::string(" ");
    if (rest.starts_with(prefix) || rest == kind) {
      e.kind = kind;
      e.text = rest.substr(std::min(rest.size(), prefix.size()));
      return e.kind == "=" || !e.text.empty() ? std::optional(e) : std::nullopt;
    }
  }
  if (rest != "fifo" && rest != "absent") return std::nullopt;
  e.kind = rest == "fifo" ? "fifo" : "absent";
  return e;
}

[[noreturn]] void fail(const std::string& what) {
  throw std::runtime_error(what + ": " + std::strerror(errno));
}

// Clears a file or link at `path` or at one of its parents, and makes the parents.
void make_room(const std::string& path) {
  struct stat st;
  for (size_t slash = path.find('/', 1);; slash = path.find('/', slash + 1)) {
    const std::string part = path.substr(0, slash);
    if (lstat(part.c_str(), &st) == 0 && !S_ISDIR(st.st_mode)) unlink(part.c_str());
    if (slash == std::string::npos) return;
    mkdir(part.c_str(), 0755);
  }
}

void write_file(const entry& e) {
  const int fd = open(e.path.c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, e.mode);
  if (fd < 0) fail(e.path);
  const bool written = write(fd, e.text.data(), e.text.size()) == ssize_t(e.text.size());
  if (close(fd) != 0 || !written || chmod(e.path.c_str(), e.mode) != 0) fail(e.path);
}

}  // namespace

std::string read_all_and_close(int fd) {
  std::string text;
  char buffer[4096];
  lseek(fd, 0, SEEK_SET);
  for (ssize_t n; fd >= 0 && (n = read(fd, buffer, sizeof buffer)) > 0;) text.append(buffer, n);
  if (fd >= 0) close(fd);
  return text;
}

std::string expand(const std::string& line) {
  std::string out;
  for (size_t i = 0; i < line.size(); ++i) {
    const size_t star = line.find('*', i), close = line.find('}', i);
    if (line[i] == '@') {
      out += "/var/db/timezone/";
    } else if (line[i] == '{' && star == i + 2 && close != std::string::npos) {
      out.append(std::strtoul(line.c_str() + i + 3, nullptr, 10), line[i + 1]);
      i = close;
    } else {
      out += line[i];
    }
  }
  return out;
}

bool is_entry(const std::string& line) { return parse(line).has_value(); }

void lay_out(const std::string& line) {
  const std::optional<entry> e = parse(line);
  if (!e) throw std::invalid_argument("not an entry: " + line);
  make_room(e->path);
  if (e->kind == "/") {
    if (mkdir(e->path.c_str(), e->mode) != 0 && errno != EEXIST) fail(e->path);
  } else if (e->kind == "->") {
    if (symlink(e->text.c_str(), e->path.c_str()) != 0) fail(e->path);
  } else if (e->kind == "=>") {
    if (link(e->text.c_str(), e->path.c_str()) != 0) fail(e->path);
  } else if (e->kind == "=") {
    write_file(*e);
  } else if (e->kind == "fifo") {
    if (mkfifo(e->path.c_str(), e->mode) != 0) fail(e->path);
  }
}

std::string describe(const std::string& path, bool with_mode) {
  struct stat st;
  if (lstat(path.c_str(), &st) != 0) return path + " absent";
  if (S_ISDIR(st.st_mode)) return path + "/";
  if (S_ISFIFO(st.st_mode)) return path + " fifo";
  if (S_ISLNK(st.st_mode)) {
    char target[4096];
    const ssize_t n = readlink(path.c_str(), target, sizeof target);
    return path + " -> " + std::string(target, n < 0 ? 0 : n);
  }
  if (!S_ISREG(st.st_mode)) return path + " other";
  char mode[16] = "";
  if (with_mode) std::snprintf(mode, sizeof mode, " [%04o]", st.st_mode & 07777);
  return path + mode + " = " +
         read_all_and_close(open(path.c_str(), O_RDONLY | O_NONBLOCK | O_CLOEXEC));
}

std::string what_stands(const std::string& path) {
  const std::string entry = describe(path);
  const std::string rest = entry.substr(path.size() + (entry[path.size()] == ' ' ? 1 : 0));
  return rest == "= " ? "=" : rest;
}

std::vector<std::string> sample_device(const std::string& current, const std::string& latest) {
  std::vector<std::string> entries = {
      "/usr/share/zoneinfo.default/+VERSION =  2016c\n2017a",
      "/usr/share/zoneinfo.default/America/Los_Angeles = TZif",
      "/usr/share/icu/icutzformat.txt = 44l\n",
      "/var/db/timezone/localtime -> /var/db/timezone/zoneinfo/America/Los_Angeles",
      "/var/db/timezone/TZVersionDiffRecord = 2015z.1.0_2016a.1.0",
      "/var/db/timezone/needs_cleanup = stale",
      "/var/db/icu/"};
  for (const char* version : {"2016a.1.0", "2016b.1.0", "2016d.1.0", "2016e.1.0", "2017a.1.0"}) {
    const std::string dataset = "/var/db/timezone/tz/" + std::string(version);
    entries.push_back(dataset + "/zoneinfo/America/Los_Angeles = TZif");
    entries.push_back(dataset + "/icutz/icutz" + (version[3] == '7' ? "44b" : "44l") +
                      ".dat = ICU");
  }
  const auto dataset = [](const std::string& name) { return "/var/db/timezone/tz/" + name; };
  if (current == "system") {
    entries.push_back("/var/db/timezone/zoneinfo -> /usr/share/zoneinfo.default");
  } else if (!current.empty() && current != "-") {
    entries.push_back("/var/db/timezone/zoneinfo -> " + dataset(current) + "/zoneinfo");
    entries.push_back("/var/db/timezone/icutz -> " + dataset(current) + "/icutz");
  }
  if (!latest.empty() && latest != "-")
    entries.push_back("/var/db/timezone/tz_latest -> " + dataset(latest));
  return entries;
}

}  // namespace vell::sandbox
