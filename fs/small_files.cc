#include "fs/small_files.h"

#include <errno.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include "platform/protection.h"

namespace vell {
namespace {

bool is_blank(char c) { return c == ' ' || (c >= '\t' && c <= '\r'); }

// Only a lone regular file is ours to read or write; errno says why not.
bool is_own_regular_file(int fd, bool single_name) {
  struct stat status;
  if (fstat(fd, &status) != 0) return false;
  if (S_ISREG(status.st_mode) && (!single_name || status.st_nlink == 1)) return true;
  errno = S_ISREG(status.st_mode) ? EMLINK : EINVAL;
  return false;
}

}  // namespace

std::string read_first_word(const std::string& path) {
  // O_NONBLOCK: opening a FIFO must not wait for a writer.
  const int fd = open(path.c_str(), O_RDONLY | O_NONBLOCK | O_NOCTTY | O_CLOEXEC);
  if (fd < 0) return std::string();
  std::string text(first_word_bound, '\0');
  size_t length = 0;
  if (is_own_regular_file(fd, false)) {
    for (ssize_t n;
         length < text.size() && (n = read(fd, text.data() + length, text.size() - length)) != 0;) {
      if (n < 0 && errno == EINTR) continue;
      if (n < 0) break;
      length += n;
    }
  }
  close(fd);
  text.resize(length);
  size_t begin = 0;
  while (begin < text.size() && is_blank(text[begin])) ++begin;
  size_t end = begin;
  while (end < text.size() && !is_blank(text[end])) ++end;
  return text.substr(begin, end - begin);
}

int open_own_file(const std::string& path, int protection_class, unsigned mode) {
  const int flags = O_WRONLY | O_CREAT | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY | O_CLOEXEC;
  const int fd = protection_class == no_protection_class
                     ? open(path.c_str(), flags, mode)
                     : platform::open_protected(path.c_str(), flags, protection_class, mode);
  if (fd < 0 || is_own_regular_file(fd, true)) return fd;
  const int error = errno;
  close(fd);
  errno = error;
  return -1;
}

}  // namespace vell
