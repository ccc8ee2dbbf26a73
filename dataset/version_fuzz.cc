// Any bytes as a version string: parsing never crashes, and a string that
// parses gives a version newer than the unknown one, in a strict order.
#include <cstddef>
#include <cstdint>
#include <stdexcept>
#include <string>

#include "dataset/version.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  const std::string text(reinterpret_cast<const char*>(data), size);
  vell::vell_version version;
  try {
    vell::parse_version(version, text);
  } catch (const std::out_of_range&) {
    return 0;  // a number over INT_MAX; the caller's fallback handles it
  }
  const vell::vell_version unknown;
  if (version == unknown) return 0;  // did not parse
  if (!(version > unknown) || unknown > version || version > version || !(version == version))
    __builtin_trap();
  if (version.year < 0 || version.letters.empty() ||
      version.letters.find_first_not_of("abcdefghijklmnopqrstuvwxyz") != std::string::npos ||
      text.find(version.letters) == std::string::npos)
    __builtin_trap();
  return 0;
}
