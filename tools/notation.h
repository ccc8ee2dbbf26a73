// The notation in which vell-try lays out and describes what stands at a
// path, one entry a line (paths hold no blanks):
//   PATH/                a directory
//   PATH -> TARGET       a symbolic link
//   PATH => OTHER        a further hard link to the file OTHER (laid out only)
//   PATH = TEXT          a regular file holding TEXT, mode 0644
//   PATH [0640] = TEXT   the same with its mode
//   PATH fifo            a FIFO
//   PATH other           a device or a socket (described only)
//   PATH absent          nothing
// In a line, "@" stands for "/var/db/timezone/" and "{c*N}" for N times c.
#ifndef VELL_TOOLS_NOTATION_H_
#define VELL_TOOLS_NOTATION_H_

#include <string>
#include <vector>

namespace vell::sandbox {

/// The line with "@" and "{c*N}" written out.
std::string expand(const std::string& line);

/// True when `entry` is a line that lay_out can make.
bool is_entry(const std::string& entry);

/// Makes `entry` stand, with its parents, in place of a file or link at the
/// path or at a parent. Throws std::invalid_argument for a line that is no
/// entry and std::runtime_error (with the errno text) when a call fails.
void lay_out(const std::string& entry);

/// What stands at `path` (not followed), as an entry; a file's mode is shown
/// when `with_mode`.
std::string describe(const std::string& path, bool with_mode = false);

/// Everything the open file `fd` holds, from its start; closes `fd`.
std::string read_all_and_close(int fd);

/// What stands at `path`, as describe gives it without the path: "/",
/// "-> TARGET", "= TEXT", "fifo", "other" or "absent".
std::string what_stands(const std::string& path);

/// The small device of a scenario's "device [CURRENT LATEST]" line: system
/// data 2016c (its "+VERSION" holds two words) with ICU schema 44l; downloads
/// 2016a.1.0, 2016b.1.0, 2016d.1.0, 2016e.1.0 for 44l and 2017a.1.0 for 44b; a
/// local-time link of the present form; a stale marker, /var/db/icu and the
/// record "2015z.1.0_2016a.1.0". CURRENT, when given, is the dataset that
/// zoneinfo (and icutz) name, "system" or "-" for no link; LATEST the one
/// tz_latest names, "-" for none.
std::vector<std::string> sample_device(const std::string& current, const std::string& latest);

}  // namespace vell::sandbox

#endif  // VELL_TOOLS_NOTATION_H_
