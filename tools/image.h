// Image files: what an image pipeline hands on (a root file system as a tar
// archive or a file-system image) made into a device image directory that
// the sandbox runs vell on, with Debian's own tools for each format.
#ifndef VELL_TOOLS_IMAGE_H_
#define VELL_TOOLS_IMAGE_H_

#include <string>

namespace vell::sandbox {

enum class image_kind {
  directory,  // a device image as it is
  text,       // no image: a scenario file, or nothing vell-try reads
  tar,        // a tar archive, plain or compressed with gzip, bzip2, xz or zstd
  ext,        // an ext2, ext3 or ext4 file system
  squashfs,
  erofs,
};

/// What `path` is, by its content, not its name. A file that is none of the
/// image formats counts as text when its first bytes are printable, so that
/// a scenario file still reads; anything else throws vell_try_error, saying
/// what IMAGE may be.
image_kind kind_of(const std::string& path);

/// Unpacks from the image file `image` what starts and the judgement read
/// (var/db, usr/share/zoneinfo.default and usr/share/icu; links leading
/// elsewhere in the image lead nowhere then) into the empty directory
/// `into`, as the caller's own files, with tar, debugfs, unsquashfs or
/// fsck.erofs. The image is only read. Throws vell_try_error with the tool's
/// words when it fails.
void unpack(const std::string& image, image_kind kind, const std::string& into);

/// A memory-backed directory for unpack, private to this process's mount
/// namespace (enter_private_namespace first); removed when it goes.
class vell_scratch_dir {
 public:
  vell_scratch_dir();
  ~vell_scratch_dir();
  vell_scratch_dir(const vell_scratch_dir&) = delete;
  vell_scratch_dir& operator=(const vell_scratch_dir&) = delete;
  const std::string& path() const { return path_; }

 private:
  std::string path_;
};

}  // namespace vell::sandbox

#endif  // VELL_TOOLS_IMAGE_H_
