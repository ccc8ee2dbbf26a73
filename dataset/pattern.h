// The regular expressions of a start: still std::basic_regex with the
// ECMAScript grammar, but without the locale's collation.
#ifndef VELL_DATASET_PATTERN_H_
#define VELL_DATASET_PATTERN_H_

#include <regex>

namespace vell {

/// libstdc++ fills a 256-entry cache for each bracket expression it
/// compiles, and asks transform_primary for every character (the locale's
/// facets, two copies and a collation transform) though only an equivalence
/// class ("[[=a=]]") reads the answer. vell's patterns have none.
struct vell_regex_traits : std::regex_traits<char> {
  template <class It>
  string_type transform_primary(It, It) const {
    return {};
  }
};

using vell_regex = std::basic_regex<char, vell_regex_traits>;

}  // namespace vell

#endif  // VELL_DATASET_PATTERN_H_
