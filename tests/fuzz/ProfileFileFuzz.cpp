// Runs the profile file's reader and writer on arbitrary text. The input is "section NUL key NUL text"
// (missing parts fall back to fixed names); after setting the key, reading it must give the value back,
// setting it again must change nothing, and a neighbouring key must read as before.
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <string>
#include <string_view>

#include "platform/ProfileFile.h"

namespace {

// The part of input up to the next NUL (all of it when there is none), removed from input.
std::string_view take(std::string_view* input, std::string_view fallback) {
  const size_t end = input->find('\0');
  if (end == std::string_view::npos) return fallback;
  const std::string_view part = input->substr(0, end);
  input->remove_prefix(end + 1);
  return part;
}

void check(bool holds) {
  if (!holds) std::abort();
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  using ulvetta::ProfileFile;
  std::string_view input(reinterpret_cast<const char*>(data), size);
  const std::string_view section = take(&input, "Colours");
  const std::string_view key = take(&input, "Back1a");
  const std::string_view text = input;

  const std::string found = ProfileFile::findValue(text, section, key);
  check(found.size() <= text.size());
  const std::string value = "v" + std::to_string(size);
  if (!ProfileFile::writable(section, key, value)) return 0;

  const std::string updated = ProfileFile::withValue(text, section, key, value);
  check(ProfileFile::findValue(updated, section, key) == value);
  check(ProfileFile::withValue(updated, section, key, value) == updated);
  const std::string neighbour = std::string(key) + "2";
  check(ProfileFile::findValue(updated, section, neighbour) == ProfileFile::findValue(text, section, neighbour));
  return 0;
}
