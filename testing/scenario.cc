#include "testing/scenario.h"

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <regex>
#include <sstream>

#include "testing/sandbox.h"

namespace vell::testing {
namespace {

std::string expand(const std::string& line) {
  std::string out;
  for (size_t i = 0; i < line.size(); ++i) {
    if (line[i] == '@') {
      out += "/var/db/timezone/";
    } else if (line[i] == '\\' && i + 1 < line.size() && line[i + 1] == 'n') {
      out += '\n', ++i;
    } else if (line[i] == '\\' && i + 1 < line.size() && line[i + 1] == '0') {
      out += '\0', ++i;
    } else if (line[i] == '\\' && line.compare(i, 2, "\\x") == 0) {
      out += static_cast<char>(std::stoi(line.substr(i + 2, 2), nullptr, 16)), i += 3;
    } else if (std::smatch m;
               line[i] == '{' && std::regex_search(line.begin() + i, line.end(), m,
                                                   std::regex("^\\{(.)\\*(\\d+)\\}"))) {
      out.append(std::stoul(m[2]), m.str(1)[0]), i += m.length(0) - 1;
    } else {
      out += line[i];
    }
  }
  return out;
}

std::string dataset_link(const std::string& name, const char* part) {
  return name == "system" ? std::string("/usr/share/zoneinfo.default")
                          : "/var/db/timezone/tz/" + name + part;
}

}  // namespace

std::vector<scenario> read_scenarios() {
  std::vector<std::filesystem::path> files;
  for (const auto& entry : std::filesystem::directory_iterator(VELL_SCENARIOS))
    files.push_back(entry);
  std::sort(files.begin(), files.end());
  std::vector<scenario> all;
  for (const auto& file : files) {
    std::ifstream in(file);
    std::string title, previous;
    int number = 0;
    for (std::string line; std::getline(in, line); previous = line) {
      ++number;
      if (line.starts_with("#") && !previous.starts_with("#")) title = line;
      if (line == "device" || line == "bare")
        all.push_back({file.filename().string() + ":" + std::to_string(number) + " " + title, {}});
      if (!line.empty() && !line.starts_with("#") && !all.empty())
        all.back().steps.push_back(expand(line));
    }
  }
  return all;
}

void set_up(const scenario& s) {
  for (const std::string& step : s.steps) {
    if (step.starts_with("start ")) return;
    if (step == "device") lay_out_device();
    if (step.starts_with("links ")) {
      std::istringstream words(step.substr(6));
      std::string current, latest;
      words >> current >> latest;
      if (current != "-")
        lay_out("/var/db/timezone/zoneinfo -> " + dataset_link(current, "/zoneinfo"));
      if (current != "-" && current != "system")
        lay_out("/var/db/timezone/icutz -> " + dataset_link(current, "/icutz"));
      if (latest != "-") lay_out("/var/db/timezone/tz_latest -> " + dataset_link(latest, ""));
    }
    if (step.starts_with("/")) lay_out(step);
  }
}

}  // namespace vell::testing
