// Where vell-try runs vell: a private mount namespace in which /var and
// /usr/share are a device's, never the host's, and a start with a time limit.
#ifndef VELL_TOOLS_SANDBOX_H_
#define VELL_TOOLS_SANDBOX_H_

#include <stdexcept>
#include <string>
#include <vector>

namespace vell::sandbox {

/// vell-try itself cannot go on: bad usage or input, no namespace, no vell.
/// main prints what() and exits with status 2.
class vell_try_error : public std::runtime_error {
 public:
  using std::runtime_error::runtime_error;
};

/// Moves this process into a private mount namespace (and a user namespace
/// when not root) and puts read-only guards over /var and /usr/share, so that
/// no write can reach the host's. Throws vell_try_error when it cannot.
void enter_private_namespace();

/// What stands at /var and /usr/share for a run of starts. An image
/// directory is seen through overlays whose writes go to memory, so neither
/// a copy is made nor the image changed; entries in notation are laid out on
/// top, or on empty memory-backed file systems when there is no image.
class vell_device {
 public:
  /// `image`: a directory holding var/db/timezone, or "" for none;
  /// `wheres`: the "FILE:LINE" of each entry, for the error when one cannot
  /// be laid out.
  vell_device(const std::string& image, std::vector<std::string> entries,
              std::vector<std::string> wheres = {});
  ~vell_device();
  vell_device(const vell_device&) = delete;
  vell_device& operator=(const vell_device&) = delete;

  /// Lays the device out afresh, as it was before any start. Needs
  /// enter_private_namespace; throws std::runtime_error when a mount fails,
  /// and vell_try_error naming its line when an entry cannot be laid out.
  void reset();

 private:
  void unmount_all();

  int image_fd_ = -1;
  std::vector<std::string> entries_, wheres_;
  std::vector<const char*> mounted_;  // in the order mounted
};

/// Throws vell_try_error unless `image` is a directory that holds
/// var/db/timezone and, when the caller is not root, whose entries that vell
/// may write are the caller's user's and group's.
void check_image(const std::string& image);

/// Where `program` is on PATH, or "" when it is not.
std::string on_path(const std::string& program);

/// How long one start may run before it is killed, unless a scenario says.
inline constexpr int start_time_limit_seconds = 5;

struct start_result {
  int status;                         // exit status, or 128 + signal number
  std::vector<std::string> messages;  // what it wrote to standard error, a line each
  int killed_after = 0;               // seconds, when its time limit ended it
};

/// How a start ended: "exit status N" or "killed after S s".
std::string ending(const start_result& result);

/// Runs `vell` with no arguments, an empty environment and standard input
/// from /dev/null, behind `wrapper` (such as strace and its arguments) when
/// given. A start still running after `limit_seconds` is killed with all it
/// started.
start_result run_start(const std::string& vell, const std::vector<std::string>& wrapper = {},
                       int limit_seconds = start_time_limit_seconds);

}  // namespace vell::sandbox

#endif  // VELL_TOOLS_SANDBOX_H_
