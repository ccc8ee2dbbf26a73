#include "fs/path_ops.h"

#include <err.h>
#include <errno.h>
#include <unistd.h>

#include <cstdio>

namespace vell {

void remove(const std::string& path) {
  if (unlink(path.c_str()) == 0 || errno == ENOENT) return;
  const int error = errno;
  warn("remove: could not remove %s", path.c_str());
  throw error;
}

void remove_quietly(const std::string& path) { std::remove(path.c_str()); }

bool exists(const std::string& path) { return access(path.c_str(), F_OK) == 0; }

std::string read_symlink(const std::string& path) {
  char buffer[1024 + 1];
  const ssize_t n = readlink(path.c_str(), buffer, sizeof buffer - 1);
  if (n < 0) {
    if (errno == ENOENT) return std::string();
    const int error = errno;
    warn("read_symlink: %s", path.c_str());
    throw error;
  }
  buffer[n] = '\0';
  return std::string(buffer);
}

void create_symlink(const std::string& target, const std::string& link) {
  if (symlink(target.c_str(), link.c_str()) == 0) return;
  const int error = errno;
  warn("create_symlink: from %s to %s", link.c_str(), target.c_str());
  throw error;
}

}  // namespace vell
