#include "tools/verdict.h"

#include <dirent.h>
#include <sys/stat.h>

#include <cstdio>
#include <filesystem>
#include <fstream>
#include <regex>
#include <set>

#include "tools/notation.h"
#include "tools/sandbox.h"

namespace vell::sandbox {
namespace {

const std::string data_dir = "/var/db/timezone/";
const std::string downloads = data_dir + "tz/";
const std::string system_zoneinfo = "/usr/share/zoneinfo.default";

std::string first_word(const std::string& path) {
  struct stat st;
  if (stat(path.c_str(), &st) != 0 || !S_ISREG(st.st_mode)) return "";
  std::string word;
  std::ifstream(path) >> word;
  return word;
}

// True when the folder `icutz` holds, directly, a regular file readable by
// others and named for `schema`, or for any schema when it is empty.
bool has_icu_data_for(const std::string& icutz, const std::string& schema) {
  static const std::regex name("icutz([0-9]+[lbe])\\.dat");
  DIR* dir = opendir(icutz.c_str());
  bool found = false;
  for (const dirent* entry; dir != nullptr && !found && (entry = readdir(dir)) != nullptr;) {
    std::cmatch m;
    struct stat st;
    found = std::regex_match(entry->d_name, m, name) && (schema.empty() || m.str(1) == schema) &&
            lstat((icutz + "/" + entry->d_name).c_str(), &st) == 0 && S_ISREG(st.st_mode) &&
            (st.st_mode & S_IROTH) != 0;
  }
  if (dir != nullptr) closedir(dir);
  return found;
}

}  // namespace

const std::vector<std::string> written_paths = {data_dir + "zoneinfo",
                                                data_dir + "icutz",
                                                data_dir + "tz_latest",
                                                data_dir + "localtime",
                                                data_dir + "needs_cleanup",
                                                data_dir + "TZVersionDiffRecord",
                                                "/var/db/icutz",
                                                "/var/db/icu"};

std::vector<std::string> written_state() {
  std::vector<std::string> state;
  for (const std::string& path : written_paths) state.push_back(what_stands(path));
  return state;
}

std::string unusable_links() {
  // What an ordinary root lacks; vell would point the links at it all the same.
  struct stat st;
  if (stat(system_zoneinfo.c_str(), &st) != 0 || !S_ISDIR(st.st_mode) ||
      first_word(system_zoneinfo + "/+VERSION").empty())
    return "the image has no system data: " + system_zoneinfo +
           " with the tz release in its +VERSION (vell-layout root lays it out)";
  const std::string zoneinfo = what_stands(data_dir + "zoneinfo");
  const std::string target = zoneinfo.starts_with("-> ") ? zoneinfo.substr(3) : "";
  std::string dataset;  // "" for the system data
  if (target != system_zoneinfo) {
    const std::string suffix = "/zoneinfo";
    const bool download = target.starts_with(downloads) && target.ends_with(suffix) &&
                          target.size() > downloads.size() + suffix.size();
    const std::string name =
        download ? target.substr(downloads.size(), target.size() - suffix.size() - downloads.size())
                 : "";
    if (name.empty() || name.find('/') != std::string::npos)
      return "zoneinfo is " + zoneinfo + ", neither the system data nor a download";
    dataset = downloads + name;
    // A device without ICU data takes downloads without any.
    const std::string schema = first_word("/usr/share/icu/icutzformat.txt");
    if (schema.empty() && has_icu_data_for(dataset + "/icutz", ""))
      return "zoneinfo names " + dataset +
             ", whose ICU data the system, which has none, cannot use";
    if (!schema.empty() && !has_icu_data_for(dataset + "/icutz", schema))
      return "zoneinfo names " + dataset +
             ", which has no ICU data file for the system's schema \"" + schema + "\"";
  }
  const std::string icutz = what_stands(data_dir + "icutz");
  if (icutz != (dataset.empty() ? "absent" : "-> " + dataset + "/icutz"))
    return "icutz is " + icutz + " while zoneinfo names " +
           (dataset.empty() ? "the system data" : dataset);
  const std::string localtime = what_stands(data_dir + "localtime");
  if (!localtime.starts_with("-> " + data_dir + "zoneinfo/") ||
      stat((data_dir + "localtime").c_str(), &st) != 0 || !S_ISREG(st.st_mode))
    return "localtime is " + localtime + ", not a link through zoneinfo to a zone file";
  return "";
}

std::string data_fingerprint() {
  std::set<std::string> lines;
  for (const std::string& root : {downloads, std::string("/usr/share")}) {
    std::error_code error;
    for (std::filesystem::recursive_directory_iterator it(root, error), end; !error && it != end;
         it.increment(error)) {
      struct stat st;
      const std::string path = it->path();
      if (lstat(path.c_str(), &st) != 0) continue;
      char line[128];
      std::snprintf(line, sizeof line, " %o %lld %lld.%09ld ", unsigned(st.st_mode),
                    static_cast<long long>(st.st_size), static_cast<long long>(st.st_mtim.tv_sec),
                    static_cast<long>(st.st_mtim.tv_nsec));
      lines.insert(path + line + (S_ISLNK(st.st_mode) ? what_stands(path) : ""));
    }
  }
  std::string all;
  for (const std::string& line : lines) all += line + "\n";
  return all;
}

std::string gate(const std::string& vell, const start_result& last, int* failed_stage) {
  int unused;
  int& stage = failed_stage != nullptr ? *failed_stage : unused;
  stage = 0;
  if (last.killed_after) return "the last start was " + ending(last);
  if (last.status != 0) return "the last start ended with status " + std::to_string(last.status);
  stage = 1;
  if (std::string why = unusable_links(); !why.empty())
    return "the links do not lead to usable data: " + why;
  stage = 2;
  const std::vector<std::string> before = written_state();
  run_start(vell);
  const std::vector<std::string> after = written_state();
  for (size_t i = 0; i < before.size(); ++i) {
    // Every start deletes the marker; it is left again only when links move.
    if (before[i] != after[i] && !written_paths[i].ends_with("/needs_cleanup"))
      return "one more start changed " + written_paths[i] + ": " + before[i] + " became " +
             after[i];
  }
  stage = -1;
  return "";
}

}  // namespace vell::sandbox
