// The library floor: only the standard-library work of a steady start, built
// once with each standard library. Three datasets are built (three version
// patterns compiled and matched), two ICU directories walked (two file-name
// patterns), four file streams opened with one word read from each.
#include <fstream>
#include <regex>
#include <string>

int main() {
  const char* const files[] = {"/usr/share/zoneinfo.default/+VERSION",
                               "/usr/share/icu/icutzformat.txt",
                               "/var/db/timezone/tz/2016d.1.0/zoneinfo/+VERSION",
                               "/var/db/timezone/tz/2016d.1.0/zoneinfo/+VERSION"};
  std::string words[4];
  for (int i = 0; i < 4; ++i) {
    std::ifstream in(files[i]);
    in >> words[i];
  }
  int sum = 0;
  const std::string versions[] = {words[0] + ".1.0", "2016d.1.0", "2016d.1.0"};
  for (const std::string& version : versions) {
    const std::regex pattern("([0-9]+)([a-z]+)(?:\\.([0-9]+))?(?:\\.([0-9]+))?");
    std::smatch results;
    if (std::regex_match(version, results, pattern)) sum += std::stoi(results[1].str());
  }
  for (int i = 0; i < 2; ++i) {
    const std::regex pattern("icutz([0-9]+[lbe])\\.dat");
    std::cmatch match;
    if (std::regex_match("icutz44l.dat", match, pattern))
      sum += static_cast<int>(match[1].length());
  }
  return sum == 3 * 2016 + 6 ? 0 : 1;
}
