// The operations through which every link under /var/db/timezone is read,
// removed and created. A failure prints one line through warn() and is
// thrown as the call's errno, a plain int; callers never look at the value.
#ifndef VELL_FS_PATH_OPS_H_
#define VELL_FS_PATH_OPS_H_

#include <string>

namespace vell {

/// Unlinks `path` (a file or a link, never a directory). A missing path is
/// silent. Any other failure prints "remove: could not remove %s" and throws
/// errno as int.
void remove(const std::string& path);

/// Deletes a file, a link or an empty directory and ignores every failure:
/// for clean-up whose outcome nothing depends on. Never prints, never throws.
void remove_quietly(const std::string& path);

/// True when access(path, F_OK) succeeds; follows links, so a dangling link
/// is false. Never prints, never throws.
bool exists(const std::string& path);

/// Reads the target of the link at `path` (at most 1024 bytes; a longer target
/// comes back cut). A missing link gives "". Any other failure prints
/// "read_symlink: %s" and throws errno as int.
std::string read_symlink(const std::string& path);

/// Creates the link `link` holding `target` (symlink(2) argument order). Never
/// replaces an existing entry. A failure prints
/// "create_symlink: from %s to %s" (link first) and throws errno as int.
void create_symlink(const std::string& target, const std::string& link);

}  // namespace vell

#endif  // VELL_FS_PATH_OPS_H_
