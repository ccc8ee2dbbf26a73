#include "dataset/pattern.h"

#include <gtest/gtest.h>

#include <sstream>
#include <vector>

namespace vell {
namespace {

// Whatever the library, vell's patterns match what its own traits would
// match in the "C" locale: every class, escape, count and case rule, with
// and without icase, on every byte and a few longer subjects; and what it
// refuses, they refuse.
TEST(Pattern, MatchesAsTheLibrarysOwnTraits) {
  // Blank-separated: no pattern holds a blank.
  std::istringstream patterns(
      "[[:alnum:]] [[:alpha:]] [[:blank:]] [[:cntrl:]] [[:digit:]] [[:graph:]] [[:lower:]] "
      "[[:print:]] [[:punct:]] [[:space:]] [[:upper:]] [[:xdigit:]] [[:w:]] [[:Digit:]] "
      "[[:d:]] [[:s:]] [^[:alpha:]_] \\d \\w \\s \\W [[.a.]-z] [a-f] Q \\x4a|\\x4B|\\u0062|\\cJ "
      "a{2,3}|\\d{0,1} [[:nope:]] [[.ab.]]");
  std::vector<std::string> subjects = {"", "aa", "aaaa"};
  for (int byte = 0; byte < 256; ++byte) subjects.emplace_back(1, static_cast<char>(byte));
  for (std::string pattern; patterns >> pattern;) {
    for (const auto flags : {std::regex::ECMAScript, std::regex::ECMAScript | std::regex::icase}) {
      std::regex library;
      try {
        library.assign(pattern, flags);
      } catch (const std::regex_error&) {
        EXPECT_THROW(vell_regex(pattern, flags), std::regex_error) << pattern;
        continue;
      }
      const vell_regex ours(pattern, flags);
      for (const std::string& s : subjects)
        EXPECT_EQ(std::regex_match(s, ours), std::regex_match(s, library))
            << pattern << " (flags " << flags << ") on \"" << s << "\" (first byte "
            << (s.empty() ? -1 : static_cast<unsigned char>(s[0])) << ")";
    }
  }
}

}  // namespace
}  // namespace vell
