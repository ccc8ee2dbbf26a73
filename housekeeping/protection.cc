#include "housekeeping/protection.h"

#include <fcntl.h>
#include <unistd.h>

#include "fs/paths.h"
#include "platform/protection.h"

namespace vell {

void set_directory_protection(const std::string& path) {
  const int fd = open(path.c_str(), O_RDONLY | O_CLOEXEC);
  if (fd < 0) return;
  platform::set_protection_class(fd, platform::protection_class_d);
  close(fd);
}

void protect_data_directories() {
  set_directory_protection(paths::data_dir);
  set_directory_protection(paths::downloads);
}

}  // namespace vell
