// The parsed version of a dataset, such as 2016a.1.0, and its ordering.
#ifndef VELL_DATASET_VERSION_H_
#define VELL_DATASET_VERSION_H_

#include <string>

namespace vell {

struct vell_version {
  /// The unknown version: (-1, "", -1, -1), older than every parsed one.
  vell_version() = default;
  /// Parses `text` with parse_version, with the same messages and throws.
  explicit vell_version(const std::string& text);

  int year = -1;
  std::string letters;
  int major = -1;  // -1 when the string has no dotted number here
  int minor = -1;
};

/// Fills `v` from the whole of `s`: digits, lower-case letters, at most two
/// dotted numbers. A string of another form prints
/// "Cannot parse version string %s, results.size() = %d", then
/// "Cannot parse version string %s", and leaves the unknown version. A number
/// over INT_MAX throws std::out_of_range, with earlier fields already set.
void parse_version(vell_version& v, const std::string& s);

/// Strict lexicographic order over (year, letters, major, minor): a is newer.
bool operator>(const vell_version& a, const vell_version& b);
bool operator==(const vell_version& a, const vell_version& b);

}  // namespace vell

#endif  // VELL_DATASET_VERSION_H_
