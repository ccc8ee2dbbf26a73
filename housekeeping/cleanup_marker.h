// The marker that tells other software a displaced dataset may be deleted.
#ifndef VELL_HOUSEKEEPING_CLEANUP_MARKER_H_
#define VELL_HOUSEKEEPING_CLEANUP_MARKER_H_

namespace vell {

/// Creates /var/db/timezone/needs_cleanup (mode 0666, class 4) or leaves an
/// existing one untouched. Any failure prints "Cannot touch file %s" once;
/// never throws.
void mark_needs_cleanup();

}  // namespace vell

#endif  // VELL_HOUSEKEEPING_CLEANUP_MARKER_H_
