// Test support: a private file tree over /var and /usr/share for each case,
// so that vell's fixed absolute paths can be exercised without touching the
// host. Nothing here is used by vell itself.
#ifndef VELL_TESTING_SANDBOX_H_
#define VELL_TESTING_SANDBOX_H_

#include <string>
#include <vector>

namespace vell::testing {

/// Fresh, empty tmpfs over /var and /usr/share for the object's lifetime.
/// The first sandbox of a process moves the process into a private mount
/// namespace (plus a user namespace when not root) with read-only tmpfs
/// guards beneath, so a stray write can never reach the host. Throws
/// std::runtime_error, failing the test, when any of that is impossible.
class sandbox {
 public:
  sandbox();
  ~sandbox();
  sandbox(const sandbox&) = delete;
  sandbox& operator=(const sandbox&) = delete;
};

/// Creates one entry, parents as needed, replacing a file or link there:
///   "/a/dir/", "/a/dir/ [0700]"        a directory
///   "/a/link -> target"                a symbolic link
///   "/a/file = text", "/a/f [0640] = text"  a file holding the text
///   "/a/fifo fifo"                     a FIFO
///   "/a/gone absent"                   nothing
///   "/a/name => /b/file"               a further hard link to a file
void lay_out(const std::string& entry);

/// The sample device: system data 2016c (its "+VERSION" holds two words),
/// ICU schema 44l; downloads 2016a.1.0, 2016b.1.0, 2016d.1.0, 2016e.1.0 for
/// 44l and 2017a.1.0 for 44b; a local-time link of the present form; a stale
/// marker, /var/db/icu and the record "2015z.1.0_2016a.1.0". No zoneinfo,
/// icutz or tz_latest link.
void lay_out_device();

/// What stands at `path` in the notation of lay_out, without the path:
/// "-> target", "= text", "/", "fifo", or "absent".
std::string show(const std::string& path);

/// "" when the links lead to usable data (zoneinfo on the system partition or
/// on a compatible download of the sample device, icutz beside it, localtime
/// through zoneinfo), else what is wrong.
std::string unusable_links();

struct run_result {
  int status;                         // exit status, or 128 + signal number
  std::vector<std::string> messages;  // stderr lines without "vell: "
};

/// Runs the real vell binary with no arguments and an empty environment,
/// after `wrapper` (such as strace and its arguments) when given. A start
/// that takes over 5 seconds is killed by SIGALRM, so a hang fails its case.
run_result run_vell(const std::vector<std::string>& wrapper = {});

}  // namespace vell::testing

#endif  // VELL_TESTING_SANDBOX_H_
