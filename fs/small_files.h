// The few small files vell reads or writes besides links. /var/db/timezone is
// written by other software, so neither a read nor a write may be led off:
// a read always ends, and a write never leaves /var/db/timezone.
#ifndef VELL_FS_SMALL_FILES_H_
#define VELL_FS_SMALL_FILES_H_

#include <cstddef>
#include <string>

namespace vell {

/// How much of a file read_first_word looks at. A real "+VERSION" or
/// "icutzformat.txt" holds a word of a few bytes; 1024 is the bound a link
/// target already has, and keeps every regular-expression engine in its depth.
inline constexpr std::size_t first_word_bound = 1024;

/// The first blank-separated word among the first first_word_bound bytes of
/// the regular file at `path` (links followed), cut at the bound. Anything
/// that is not a regular file, cannot be opened without blocking or cannot be
/// read counts as missing and gives "". Never prints, never throws.
std::string read_first_word(const std::string& path);

// The two writes below touch `path` only when it is, or can be created as, a
// regular file of its own: never through a link at `path`, never a FIFO or
// device, never a file with further hard links, and without blocking. A new
// file gets mode 0666 less the umask. They never print.

/// Creates an empty file at `path` with the data-protection class
/// `protection_class`, or leaves the file there as it is. False when that
/// cannot be done.
bool touch_own_file(const std::string& path, int protection_class);

/// Makes the file at `path` hold `contents`, as far as it can; nothing
/// reports a failure.
void replace_own_file(const std::string& path, const std::string& contents);

}  // namespace vell

#endif  // VELL_FS_SMALL_FILES_H_
