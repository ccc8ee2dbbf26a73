#include "tools/report.h"

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <map>

#include "tools/sandbox.h"

namespace vell::sandbox {
namespace {

// Text as XML 1.0 takes it: markup, line breaks and tabs escaped, and bytes
// that are no printable ASCII (a scenario's paths may hold any) written out as
// \xNN.
std::string xml(const std::string& text) {
  std::string out;
  for (const unsigned char c : text) {
    if (c == '&')
      out += "&amp;";
    else if (c == '<')
      out += "&lt;";
    else if (c == '>')
      out += "&gt;";
    else if (c == '"')
      out += "&quot;";
    else if (c == '\n' || c == '\t')  // as references, which an attribute keeps
      out += c == '\n' ? "&#10;" : "&#9;";
    else if (c >= 0x20 && c < 0x7f)
      out += static_cast<char>(c);
    else {
      char escaped[8];
      std::snprintf(escaped, sizeof escaped, "\\x%02x", c);
      out += escaped;
    }
  }
  return out;
}

}  // namespace

std::vector<std::string> failures_of(const std::vector<vell_check>& checks) {
  std::vector<std::string> all;
  for (const vell_check& check : checks)
    all.insert(all.end(), check.failures.begin(), check.failures.end());
  return all;
}

void write_junit(const std::string& path, const std::vector<vell_check>& checks) {
  std::vector<std::string> suites;
  std::map<std::string, std::vector<const vell_check*>> by_suite;
  for (const vell_check& check : checks) {
    if (!by_suite.contains(check.suite)) suites.push_back(check.suite);
    by_suite[check.suite].push_back(&check);
  }
  const auto count = [](const std::vector<const vell_check*>& of, bool failed, bool skipped) {
    size_t n = 0;
    for (const vell_check* check : of)
      n += (failed && !check->failures.empty()) || (skipped && check->skipped);
    return n;
  };
  std::string out = "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n";
  std::vector<const vell_check*> everything;
  for (const vell_check& check : checks) everything.push_back(&check);
  out += "<testsuites name=\"vell-try\" tests=\"" + std::to_string(checks.size()) +
         "\" failures=\"" + std::to_string(count(everything, true, false)) + "\" skipped=\"" +
         std::to_string(count(everything, false, true)) + "\">\n";
  for (const std::string& suite : suites) {
    const auto& of = by_suite[suite];
    out += "  <testsuite name=\"" + xml(suite) + "\" tests=\"" + std::to_string(of.size()) +
           "\" failures=\"" + std::to_string(count(of, true, false)) +
           "\" errors=\"0\" skipped=\"" + std::to_string(count(of, false, true)) + "\">\n";
    for (const vell_check* check : of) {
      out += "    <testcase classname=\"" + xml(suite) + "\" name=\"" + xml(check->name) + "\"";
      if (check->failures.empty() && !check->skipped) {
        out += "/>\n";
        continue;
      }
      out += ">\n";
      if (check->skipped) out += "      <skipped/>\n";
      if (!check->failures.empty()) {
        std::string all;
        for (const std::string& failure : check->failures)
          all += (all.empty() ? "" : "\n") + failure;
        out += "      <failure message=\"" + xml(check->failures.front()) + "\">" + xml(all) +
               "</failure>\n";
      }
      out += "    </testcase>\n";
    }
    out += "  </testsuite>\n";
  }
  out += "</testsuites>\n";
  std::FILE* file = std::fopen(path.c_str(), "w");
  const bool written =
      file != nullptr && std::fwrite(out.data(), 1, out.size(), file) == out.size();
  if (file == nullptr || std::fclose(file) != 0 || !written)
    throw vell_try_error(path + ": " + std::strerror(errno));
}

}  // namespace vell::sandbox
