// Test support: a private file tree over /var and /usr/share for each case,
// so that vell's fixed absolute paths can be exercised without touching the
// host. Nothing here is used by vell itself.
#ifndef VELL_TESTING_SANDBOX_H_
#define VELL_TESTING_SANDBOX_H_

#include <functional>
#include <initializer_list>
#include <string>
#include <vector>

namespace vell::testing {

/// Fresh, empty tmpfs over /var and /usr/share for the object's lifetime.
/// The first sandbox of a process moves the process into a private mount
/// namespace (plus a user namespace when not root), and leaves read-only
/// tmpfs guards beneath, so a stray write can never reach the host. Throws
/// std::runtime_error, failing the test, when any of that is impossible.
class sandbox {
 public:
  sandbox();
  ~sandbox();
  sandbox(const sandbox&) = delete;
  sandbox& operator=(const sandbox&) = delete;

  /// Creates entries, parents as needed, one per string:
  ///   "/a/dir/"            a directory (mode 0755)
  ///   "/a/link -> target"  a symbolic link
  ///   "/a/file = text"     a file holding the rest verbatim (mode 0644)
  ///   "/a/file [0640] = text", "/a/dir/ [0700]"  the same with a mode
  /// A later entry replaces a file or link at the same path.
  static void lay_out(std::initializer_list<std::string> entries);
};

/// What stands at `path`, in the notation of lay_out: "-> target",
/// "= content", "/" for a directory, "absent" when nothing does.
std::string show(const std::string& path);

/// Every entry below /var and /usr/share, one sorted line each, with link
/// targets and file contents: two equal snapshots mean an unchanged tree.
std::string snapshot();

struct run_result {
  int status;  // exit status, or 128 + signal number
  std::vector<std::string> messages;  // stderr lines without "vell: "
};

/// Runs the real vell binary with no arguments and an empty environment,
/// under `wrapper` (a command and its arguments, such as strace) when given;
/// the wrapper's own stderr lines come back among the messages. A run that
/// takes over 20 seconds is killed by SIGALRM.
run_result run_vell(const std::vector<std::string>& wrapper = {});

/// Runs `fn` in this process and returns what it printed on stderr, line by
/// line without the "vell: " prefix. Exceptions from `fn` are passed on
/// after stderr is restored.
std::vector<std::string> messages_of(const std::function<void()>& fn);

/// What an in-process call printed, and the int it threw (0 when none).
struct call_result {
  std::vector<std::string> messages;
  int thrown = 0;
};
call_result call(const std::function<void()>& fn);

/// The folder of downloaded datasets.
inline const std::string tz = "/var/db/timezone/tz/";

/// Links zoneinfo and icutz to the download `current` (zoneinfo alone to the
/// system partition for "system", no link for ""), and tz_latest to the
/// download `latest` (no link for "").
void lay_out_links(const std::string& current, const std::string& latest);

/// A device for end-to-end starts: system data 2016c (its "+VERSION" holds
/// more than one word) with ICU schema 44l; downloads 2016a.1.0, 2016b.1.0,
/// 2016d.1.0 and 2016e.1.0 built for 44l and 2017a.1.0 built for 44b; a
/// local-time link of the present form; a stale marker and /var/db/icu; the
/// record "2015z.1.0_2016a.1.0". No zoneinfo, icutz or tz_latest link.
void lay_out_device();

/// Compares printed lines with expected ones. An expected line ending in
/// ": *" accepts any error text after that point; the others must be exact.
void expect_messages(const std::vector<std::string>& got,
                     const std::vector<std::string>& want);

}  // namespace vell::testing

#endif  // VELL_TESTING_SANDBOX_H_
