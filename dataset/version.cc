#include "dataset/version.h"

#include <err.h>

#include <stdexcept>
#include <tuple>

#include "dataset/pattern.h"

namespace vell {

vell_version::vell_version(const std::string& text) { parse_version(*this, text); }

void parse_version(vell_version& v, const std::string& s) {
  // Compiled once: a start parses up to four versions, and compiling costs
  // more than matching.
  static const vell_regex pattern("([0-9]+)([a-z]+)(?:\\.([0-9]+))?(?:\\.([0-9]+))?");
  try {
    std::smatch results;
    if (!std::regex_match(s, results, pattern) || results.size() != 5) {
      warn("Cannot parse version string %s, results.size() = %d", s.c_str(),
           static_cast<int>(results.size()));
      throw std::invalid_argument("no match");
    }
    v.year = std::stoi(results[1].str());
    v.letters = results[2].str();
    // An absent dotted number has empty text, which stoi rejects.
    try {
      v.major = std::stoi(results[3].str());
    } catch (const std::invalid_argument&) {
      v.major = -1;
    }
    try {
      v.minor = std::stoi(results[4].str());
    } catch (const std::invalid_argument&) {
      v.minor = -1;
    }
  } catch (const std::invalid_argument&) {
    warn("Cannot parse version string %s", s.c_str());
    v = vell_version();
  }
}

bool operator>(const vell_version& a, const vell_version& b) {
  return std::tie(a.year, a.letters, a.major, a.minor) >
         std::tie(b.year, b.letters, b.major, b.minor);
}

bool operator==(const vell_version& a, const vell_version& b) {
  return std::tie(a.year, a.letters, a.major, a.minor) ==
         std::tie(b.year, b.letters, b.major, b.minor);
}

}  // namespace vell
