#include "editor/headless/EventScript.h"

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <iterator>
#include <sstream>

#include "editor/EditorWindow.h"
#include "editor/headless/HeadlessHost.h"

namespace ulvetta {
namespace {

struct MouseWord {
  const char* word;
  int event;
};
const MouseWord kMouseWords[] = {
    {"press", kLeftPress},           {"drag", kLeftDrag},     {"release", kLeftRelease},   {"move", kMove},
    {"dblclick", kLeftDoubleClick}, {"rpress", kRightPress}, {"rrelease", kRightRelease},
};

// The events that take one count: a virtual-key code or a number of ticks.
struct CountWord {
  const char* word;
  ScriptEvent::Kind kind;
  long maximum;
  const char* what;
};
const CountWord kCountWords[] = {{"key", ScriptEvent::kKey, 254, "virtual-key code"},
                                 {"tick", ScriptEvent::kTick, 1000000, "count of ticks"}};

// Virtual-key codes of the characters "type" accepts.
constexpr int kKeyMinus = 189;
constexpr int kKeyPeriod = 190;

// A whole decimal number in [lo, hi] and nothing else.
bool wholeNumber(const std::string& word, long lo, long hi, int* out) {
  if (word.empty()) return false;
  char* end = nullptr;
  errno = 0;
  const long v = std::strtol(word.c_str(), &end, 10);
  if (errno != 0 || *end != '\0' || v < lo || v > hi) return false;
  *out = static_cast<int>(v);
  return true;
}

// Parses one line (comment and surrounding space removed, not empty) into events; an empty return is
// success, anything else is what is wrong with the line.
std::string parseLine(const std::string& line, std::vector<ScriptEvent>* events) {
  std::istringstream in(line);
  std::vector<std::string> words{std::istream_iterator<std::string>(in), std::istream_iterator<std::string>()};
  const std::string quoted = "\"" + line + "\"";
  size_t i = 0;
  int modifiers = 0;
  for (; i < words.size() && (words[i] == "ctrl" || words[i] == "shift"); ++i)
    modifiers |= words[i] == "ctrl" ? kModifierCtrl : kModifierShift;
  if (i == words.size()) return "ctrl and shift must be followed by a mouse event, not end the line";
  const std::string& verb = words[i];
  const size_t args = words.size() - i - 1;
  for (const MouseWord& m : kMouseWords) {
    if (verb != m.word) continue;
    ScriptEvent e{ScriptEvent::kMouse, m.event, 0, 0, modifiers};
    if (args != 2 || !wholeNumber(words[i + 1], -32768, 32767, &e.x) ||
        !wholeNumber(words[i + 2], -32768, 32767, &e.y))
      return verb + " takes two whole numbers X Y from -32768 to 32767, not " + quoted;
    events->push_back(e);
    return {};
  }
  if (modifiers != 0) return "ctrl and shift go only before a mouse event, not before " + verb;
  for (const CountWord& w : kCountWords) {
    if (verb != w.word) continue;
    ScriptEvent e{w.kind};
    if (args != 1 || !wholeNumber(words[1], 1, w.maximum, &e.code))
      return verb + " takes one " + w.what + " from 1 to " + std::to_string(w.maximum) + ", not " + quoted;
    events->push_back(e);
    return {};
  }
  if (verb == "type") {
    if (args != 1) return "type takes one word of digits, \".\" and \"-\", not " + quoted;
    for (char c : words[1]) {
      ScriptEvent e{ScriptEvent::kKey};
      if (c >= '0' && c <= '9') e.code = c;  // the digit keys' codes are their characters'
      else if (c == '.') e.code = kKeyPeriod;
      else if (c == '-') e.code = kKeyMinus;
      else return "type takes digits, \".\" and \"-\" only, not \"" + std::string(1, c) + "\" in " + quoted;
      events->push_back(e);
    }
    return {};
  }
  return quoted +
         " is not an event; the events are press, drag, release, move, dblclick, rpress and rrelease (each "
         "with X Y, optionally after ctrl or shift), key CODE, type TEXT and tick N";
}

}  // namespace

bool EventScript::parse(const std::string& text, const std::string& source, std::string* error) {
  events_.clear();
  std::istringstream in(text);
  std::string line;
  for (int number = 1; std::getline(in, line); ++number) {
    line = line.substr(0, line.find('#'));
    const size_t first = line.find_first_not_of(" \t\r\f\v");
    if (first == std::string::npos) continue;
    line = line.substr(first, line.find_last_not_of(" \t\r\f\v") + 1 - first);
    const std::string problem = parseLine(line, &events_);
    if (!problem.empty()) {
      events_.clear();
      if (error) *error = source + " line " + std::to_string(number) + ": " + problem;
      return false;
    }
  }
  return true;
}

bool EventScript::load(const std::string& path, std::string* error) {
  std::ifstream file(path, std::ios::binary);
  std::string text;
  char chunk[4096];
  // A read error (a folder, for one) sets the badbit.
  while (file.read(chunk, sizeof chunk) || file.gcount() > 0) text.append(chunk, static_cast<size_t>(file.gcount()));
  if (!file.is_open() || file.bad()) {
    events_.clear();
    if (error) *error = "the events file \"" + path + "\" cannot be read";
    return false;
  }
  return parse(text, "\"" + path + "\"", error);
}

void EventScript::play(EditorWindow& window, HeadlessHost& host) const {
  for (const ScriptEvent& e : events_) {
    host.settle();
    switch (e.kind) {
      case ScriptEvent::kMouse: window.mouse(e.x, e.y, e.code, e.modifiers); break;
      case ScriptEvent::kKey: window.keyDown(e.code); break;
      case ScriptEvent::kTick:
        for (int n = 0; n < e.code; ++n) {
          window.tick();
          host.settle();
        }
        break;
    }
  }
  host.settle();
}

}  // namespace ulvetta
