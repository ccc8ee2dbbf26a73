#include "fs/small_files.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include "platform/protection.h"

namespace vell {
namespace {

constexpr int own_file_flags = O_WRONLY | O_CREAT | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY | O_CLOEXEC;

// A regular file; for one that vell writes, also under this one name only.
bool is_regular(int fd, bool sole_name) {
  struct stat status;
  return fstat(fd, &status) == 0 && S_ISREG(status.st_mode) && (!sole_name || status.st_nlink == 1);
}

}  // namespace

std::string read_first_word(const std::string& path) {
  // O_NONBLOCK: opening a FIFO must not wait for a writer.
  const int fd = open(path.c_str(), O_RDONLY | O_NONBLOCK | O_NOCTTY | O_CLOEXEC);
  if (fd < 0) return std::string();
  std::string text(first_word_bound, '\0');
  // One read: a regular file gives all it holds up to the bound.
  const ssize_t length = is_regular(fd, false) ? read(fd, text.data(), text.size()) : -1;
  close(fd);
  text.resize(length < 0 ? 0 : length);
  const char blanks[] = " \t\n\v\f\r";
  const size_t begin = text.find_first_not_of(blanks);
  if (begin == std::string::npos) return std::string();
  return text.substr(begin, text.find_first_of(blanks, begin) - begin);
}

bool touch_own_file(const std::string& path, int protection_class) {
  const int fd = platform::open_protected(path.c_str(), own_file_flags, protection_class, 0666);
  if (fd < 0) return false;
  const bool ours = is_regular(fd, true);
  return close(fd) == 0 && ours;
}

void replace_own_file(const std::string& path, const std::string& contents) {
  const int fd = open(path.c_str(), own_file_flags, 0666);
  if (fd < 0) return;
  // Truncated only once the file is known to be ours.
  if (is_regular(fd, true) && ftruncate(fd, 0) == 0) {
    [[maybe_unused]] const ssize_t written = write(fd, contents.data(), contents.size());
  }
  close(fd);
}

}  // namespace vell
