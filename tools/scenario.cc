#include "tools/scenario.h"

#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <sstream>

#include "tools/notation.h"
#include "tools/sandbox.h"
#include "tools/verdict.h"

namespace vell::sandbox {
namespace {

std::vector<std::string> words_of(const std::string& text) {
  std::istringstream in(text);
  std::vector<std::string> words;
  for (std::string word; in >> word;) words.push_back(word);
  return words;
}

// The status a start line asks for, -1 for "start" alone, -2 for no start line.
int start_status(const std::string& text) {
  if (text == "start") return -1;
  const std::string status = text.starts_with("start ") ? text.substr(6) : "";
  if (status.empty() || status.size() > 3 ||
      status.find_first_not_of("0123456789") != std::string::npos)
    return -2;
  return std::stoi(status);
}

// A message as scenarios write it: without vell's name, the error text
// that warn() puts after its last ": ", and the blanks before that.
std::string as_written(const std::string& message) {
  std::string text = message.starts_with("vell: ") ? message.substr(6) : message;
  text = text.substr(0, text.rfind(": "));
  return text.substr(0, text.find_last_not_of(' ') + 1);
}

std::string cell(std::string text) {
  for (size_t at; (at = text.find('\n')) != std::string::npos;) text.replace(at, 1, "\\n");
  return text.size() > 44 ? text.substr(0, 41) + "..." : text;
}

void print_start(int number, const start_result& result, const std::vector<std::string>& before,
                 const std::vector<std::string>& after) {
  std::printf("--- start %d: %s\n", number, ending(result).c_str());
  for (const std::string& message : result.messages) std::printf("  | %s\n", message.c_str());
  std::printf("  %-22s %-46s %s\n", "entry", "before", "after");
  for (size_t i = 0; i < written_paths.size(); ++i) {
    const std::string name = written_paths[i].starts_with("/var/db/timezone/")
                                 ? written_paths[i].substr(17)
                                 : written_paths[i];
    std::printf("%c %-22s %-46s %s\n", before[i] == after[i] ? ' ' : '*', name.c_str(),
                cell(before[i]).c_str(), before[i] == after[i] ? "(same)" : cell(after[i]).c_str());
  }
}

void run_then(const std::string& command) {
  std::printf("--- then: %s\n", command.c_str());
  std::fflush(stdout);
  const pid_t child = fork();
  if (child == 0) {
    execl("/bin/sh", "sh", "-c", command.c_str(), static_cast<char*>(nullptr));
    _exit(127);
  }
  int status;
  while (child > 0 && waitpid(child, &status, 0) < 0 && errno == EINTR) {
  }
}

std::string in_quotes(const std::string& text) { return "\"" + text + "\""; }

}  // namespace

std::vector<vell_scenario> read_scenarios(const std::string& file, int starts) {
  std::ifstream in(file);
  if (!in) throw vell_try_error(file + ": " + std::strerror(errno));
  std::vector<vell_scenario> all;
  std::string title, previous;
  int number = 0;
  for (std::string line; std::getline(in, line); previous = line) {
    const std::string where = file + ":" + std::to_string(++number);
    if (line.starts_with("#") && !previous.starts_with("#")) title = line;
    if (line.empty() || line.starts_with("#")) continue;
    const std::string text = expand(line);
    const std::vector<std::string> words = words_of(text);
    if (words.empty()) continue;  // blanks alone
    const auto unreadable = [&](const std::string& why) {
      return vell_try_error(where + ": " + why + ": " + line);
    };
    if (words[0] == "device") {
      if (words.size() != 1 && words.size() != 3)
        throw unreadable("device takes no or two datasets");
      all.push_back(
          {where,
           title,
           "",
           sample_device(words.size() == 3 ? words[1] : "", words.size() == 3 ? words[2] : ""),
           {},
           {},
           start_time_limit_seconds,
           false,
           {}});
      all.back().device_where.assign(all.back().device.size(), where);
      continue;
    }
    if (all.empty()) throw unreadable("a scenario begins with a device line");
    vell_scenario& s = all.back();
    const bool started = !s.steps.empty();
    const std::string last = started ? s.steps.back().text : "";
    if (text == "faults") {
      s.faults = true;
    } else if (words[0] == "limit" && !started) {
      s.limit_seconds = words.size() == 2 ? std::atoi(words[1].c_str()) : 0;
      if (s.limit_seconds < 1 || s.limit_seconds > 60)
        throw unreadable("limit takes 1 to 60 seconds");
    } else if (words[0] == "known") {
      if (words.size() < 3 || (words[1] != "eio" && words[1] != "kill"))
        throw unreadable("known takes eio or kill and a fault point");
      s.known.push_back({where, text.substr(6)});
    } else if (start_status(text) != -2) {
      s.steps.push_back({where, text});
    } else if (!started && is_entry(text)) {
      s.device.push_back(text);
      s.device_where.push_back(where);
    } else if (!started) {
      const bool expectation =
          words[0] == "active" || words[0] == "verdict" || text.starts_with("|");
      throw unreadable(expectation ? "expectations come after a start" : "cannot read");
    } else if (text.starts_with("|") && !last.starts_with("|") && start_status(last) == -2) {
      throw unreadable("messages follow a start");
    } else if (text.starts_with("| ") || text == "|" ||
               (words[0] == "active" && words.size() == 2) || words[0] == "verdict" ||
               is_entry(text)) {
      s.steps.push_back({where, text});
    } else {
      throw unreadable("cannot read");
    }
  }
  for (vell_scenario& s : all) {
    if (s.steps.empty()) s.steps.assign(starts, {s.where, "start"});
  }
  return all;
}

vell_scenario image_scenario(const std::string& image, int starts) {
  vell_scenario s{image, "", image, {}, {}, {}, start_time_limit_seconds, false, {}};
  s.steps.assign(starts, {image, "start"});
  return s;
}

std::vector<vell_check> play(const vell_scenario& s, const vell_try_options& options) {
  vell_device device(s.image, s.device, s.device_where);
  device.reset();
  const std::string suite = s.where + (s.title.empty() ? "" : " " + s.title);
  std::printf("=== %s\n", suite.c_str());
  // A check per expectation, in the order of the file; failures go to the
  // step they are about.
  std::vector<vell_check> checks(s.steps.size());
  std::vector<bool> expected(s.steps.size());
  const auto fail = [&](const vell_step& step, const std::string& what) {
    checks[&step - s.steps.data()].failures.push_back(step.where + ": " + what);
  };
  start_result last{-1, {}};
  int number = 0;
  const vell_step* verdict = nullptr;
  for (size_t i = 0; i < s.steps.size(); ++i) {
    const vell_step& step = s.steps[i];
    const std::vector<std::string> words = words_of(step.text);
    expected[i] = true;
    if (const int status = start_status(step.text); status != -2) {
      const std::vector<std::string> before = written_state();
      const start_result result = run_start(options.vell, {}, s.limit_seconds);
      print_start(++number, result, before, written_state());
      last = result;
      if (status >= 0 && (status != result.status || result.killed_after))
        fail(step, "expected exit status " + std::to_string(status) + ", found " + ending(result));
      // The first message that differs: the ones after it would only repeat the shift.
      const size_t first = i + 1;
      size_t end = first;
      while (end < s.steps.size() && s.steps[end].text.starts_with("|")) ++end;
      for (size_t m = first; m < end; ++m) expected[m] = status >= 0;
      expected[i] = status >= 0;
      const size_t checked = status >= 0 ? std::max(end - first, result.messages.size()) : 0;
      for (size_t m = 0; m < checked; ++m) {
        const std::string got = m < result.messages.size() ? as_written(result.messages[m]) : "";
        if (first + m == end) {
          fail(step, "unexpected message " + in_quotes(got));
          break;
        }
        const std::string want =
            s.steps[first + m].text.substr(std::min<size_t>(2, s.steps[first + m].text.size()));
        if (m >= result.messages.size() || got != want) {
          fail(s.steps[first + m], "expected message " + in_quotes(want) + ", found " +
                                       (m < result.messages.size() ? in_quotes(got) : "none"));
          break;
        }
      }
      i = end - 1;
    } else if (words[0] == "active") {
      const bool system = words[1] == "system";
      const std::string dataset = "/var/db/timezone/tz/" + words[1];
      const std::string zoneinfo = what_stands("/var/db/timezone/zoneinfo");
      const std::string icutz = what_stands("/var/db/timezone/icutz");
      const std::string want_zoneinfo =
          "-> " + (system ? std::string("/usr/share/zoneinfo.default") : dataset + "/zoneinfo");
      const std::string want_icutz = system ? "absent" : "-> " + dataset + "/icutz";
      if (zoneinfo != want_zoneinfo || icutz != want_icutz)
        fail(step, "expected zoneinfo " + want_zoneinfo + " and icutz " + want_icutz + ", found " +
                       zoneinfo + " and " + icutz);
    } else if (words[0] == "verdict") {
      verdict = &step;
    } else {
      std::string path = words[0];
      if (path.size() > 1 && path.ends_with('/')) path.pop_back();
      std::string got = describe(path, words.size() > 1 && words[1].starts_with("["));
      got = got.substr(0, got.find_last_not_of(' ') + 1);
      if (got != step.text)
        fail(step, "expected " + in_quotes(step.text) + ", found " + in_quotes(got));
    }
  }
  if (!options.then.empty()) run_then(options.then);
  int failed_stage = -1;
  const std::string why = gate(options.vell, last, &failed_stage);
  if (verdict != nullptr && why != verdict->text.substr(8))
    fail(*verdict, "expected verdict " + in_quotes(verdict->text.substr(8)) + ", found " +
                       (why.empty() ? "pass" : in_quotes(why)));
  std::vector<vell_check> made;
  for (size_t i = 0; i < s.steps.size(); ++i) {
    if (!expected[i]) continue;
    checks[i].suite = suite;
    checks[i].name = s.steps[i].where + ": " + s.steps[i].text;
    made.push_back(std::move(checks[i]));
  }
  // Without a verdict line the gate's own steps are checks too.
  for (int stage = 0; verdict == nullptr && stage < gate_stages; ++stage) {
    vell_check check{suite, gate_stage_names[stage], {}, failed_stage >= 0 && stage > failed_stage};
    if (stage == failed_stage) check.failures.push_back(s.where + ": " + why);
    made.push_back(std::move(check));
  }
  return made;
}

}  // namespace vell::sandbox
