#include "dataset/pattern.h"

#ifdef _LIBCPP_VERSION
#include <cctype>

namespace vell {
namespace {

using mask = vell_regex_traits::char_class_type;
using std::ctype_base;

// alnum and graph are unions of these.
constexpr mask classified = ctype_base::space | ctype_base::print | ctype_base::cntrl |
                            ctype_base::upper | ctype_base::lower | ctype_base::alpha |
                            ctype_base::digit | ctype_base::punct | ctype_base::xdigit |
                            ctype_base::blank;
// \w and [[:w:]] also take '_': a bit no class uses.
constexpr mask underscore = static_cast<mask>(~classified & (classified + 1));

}  // namespace

char vell_regex_traits::translate_nocase(char c) const {
  return static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
}

bool vell_regex_traits::isctype(char c, mask m) const {
  const int u = static_cast<unsigned char>(c);
  const struct {
    mask bit;
    int (*is)(int);
  } classes[] = {{ctype_base::space, std::isspace},   {ctype_base::print, std::isprint},
                 {ctype_base::cntrl, std::iscntrl},   {ctype_base::upper, std::isupper},
                 {ctype_base::lower, std::islower},   {ctype_base::alpha, std::isalpha},
                 {ctype_base::digit, std::isdigit},   {ctype_base::punct, std::ispunct},
                 {ctype_base::xdigit, std::isxdigit}, {ctype_base::blank, std::isblank}};
  for (const auto& c : classes)
    if ((m & c.bit) != 0 && c.is(u) != 0) return true;
  return (m & underscore) != 0 && c == '_';
}

int vell_regex_traits::value(char c, int radix) const {
  const int digit = c >= '0' && c <= '9'   ? c - '0'
                    : c >= 'a' && c <= 'z' ? c - 'a' + 10
                    : c >= 'A' && c <= 'Z' ? c - 'A' + 10
                                           : radix;
  return digit < radix ? digit : -1;
}

mask vell_regex_traits::class_named(string_type name, bool icase) {
  for (char& c : name) c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
  const struct {
    const char* name;
    mask bits;
  } classes[] = {{"alnum", ctype_base::alnum},  {"alpha", ctype_base::alpha},
                 {"blank", ctype_base::blank},  {"cntrl", ctype_base::cntrl},
                 {"d", ctype_base::digit},      {"digit", ctype_base::digit},
                 {"graph", ctype_base::graph},  {"lower", ctype_base::lower},
                 {"print", ctype_base::print},  {"punct", ctype_base::punct},
                 {"s", ctype_base::space},      {"space", ctype_base::space},
                 {"upper", ctype_base::upper},  {"w", ctype_base::alnum | underscore},
                 {"xdigit", ctype_base::xdigit}};
  for (const auto& c : classes)
    if (name == c.name)
      return (icase && (c.bits & (ctype_base::lower | ctype_base::upper)) != 0)
                 ? static_cast<mask>(c.bits | ctype_base::alpha)
                 : static_cast<mask>(c.bits);
  return 0;
}

}  // namespace vell
#endif
