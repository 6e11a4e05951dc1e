#pragma once
// A script of editor events, one a line: "press X Y", "drag", "release", "move", "dblclick", "rpress",
// "rrelease" (each optionally after "ctrl" and/or "shift"), "key CODE" (a virtual-key code), "type TEXT" (one
// key per character: digits, "." and "-"), "tick N" (N ticks of 50 ms) and "#" comments. It is parsed whole
// before anything is played, and played into an EditorWindow shown by a HeadlessHost.
#include <string>
#include <vector>

namespace ulvetta {

class EditorWindow;
class HeadlessHost;

struct ScriptEvent {
  enum Kind { kMouse, kKey, kTick } kind = kMouse;
  int code = 0;  // mouse event code, virtual-key code or tick count
  int x = 0, y = 0, modifiers = 0;
};

class EventScript {
 public:
  // Parses text, naming it source in errors. False with one sentence (no final full stop) that names the
  // first bad line; the script is then empty.
  bool parse(const std::string& text, const std::string& source, std::string* error);
  // Reads and parses a file.
  bool load(const std::string& path, std::string* error);

  const std::vector<ScriptEvent>& events() const { return events_; }
  // Delivers each event to window; before each one (and after the last) the host paints what was
  // invalidated, as a window system would between events.
  void play(EditorWindow& window, HeadlessHost& host) const;

 private:
  std::vector<ScriptEvent> events_;
};

}  // namespace ulvetta
