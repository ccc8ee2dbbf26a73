// The regular expressions of a start: std::basic_regex with the ECMAScript
// grammar, through a traits class that keeps away each library's dear part.
#ifndef VELL_DATASET_PATTERN_H_
#define VELL_DATASET_PATTERN_H_

#include <cstddef>
#include <regex>
#include <string>

namespace vell {

#ifdef _LIBCPP_VERSION
/// libc++'s own traits build the global locale at the first pattern, with
/// every facet of the classic locale: half the binary and a third of a
/// start's wall time. vell never sets a locale, so these answer from
/// <cctype> as the "C" locale does. libc++ asks isctype with ctype_base
/// masks (for \d, \w and \s) and reads getloc().name(); collating elements
/// are single characters.
struct vell_regex_traits {
  using char_type = char;
  using string_type = std::string;
  using char_class_type = std::ctype_base::mask;
  struct locale_type {
    std::string name() const { return "C"; }
  };

  static std::size_t length(const char* s) { return std::char_traits<char>::length(s); }
  char translate(char c) const { return c; }
  char translate_nocase(char c) const;
  template <class It>
  string_type transform(It first, It last) const {
    return string_type(first, last);
  }
  template <class It>
  string_type transform_primary(It, It) const {
    return {};
  }
  template <class It>
  string_type lookup_collatename(It first, It last) const {
    return std::distance(first, last) == 1 ? string_type(first, last) : string_type();
  }
  template <class It>
  char_class_type lookup_classname(It first, It last, bool icase = false) const {
    return class_named(string_type(first, last), icase);
  }
  bool isctype(char c, char_class_type mask) const;
  int value(char c, int radix) const;
  locale_type imbue(locale_type l) { return l; }
  locale_type getloc() const { return {}; }

 private:
  static char_class_type class_named(string_type name, bool icase);
};
#else
/// libstdc++ fills a 256-entry cache for each bracket expression it
/// compiles, and asks transform_primary for every character (the locale's
/// facets, two copies and a collation transform) though only an equivalence
/// class ("[[=a=]]") reads the answer. vell's patterns have none (nor
/// back-references, which libstdc++ compares through any other traits
/// class case-sensitively).
struct vell_regex_traits : std::regex_traits<char> {
  template <class It>
  string_type transform_primary(It, It) const {
    return {};
  }
};
#endif

using vell_regex = std::basic_regex<char, vell_regex_traits>;

}  // namespace vell

#endif  // VELL_DATASET_PATTERN_H_
