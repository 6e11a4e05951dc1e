#pragma once
// A WindowHost without a window, for tests and the snapshot command: presented rectangles are recorded (the
// back buffer is the picture), an invalidation becomes a full repaint at the next event, and the choosers,
// the menu and the preset dialogs take their answers from a queue filled by the caller.
#include <deque>
#include <string>
#include <vector>

#include "editor/WindowHost.h"

namespace ulvetta {

class EditorWindow;

class HeadlessHost : public WindowHost {
 public:
  // A scripted answer to the next chooser, menu or dialog.
  struct Answer {
    enum Kind { kCancel, kColour, kFile, kMenu } kind = kCancel;
    SkinColour colour;
    std::string file;  // a path for the file chooser, a preset name for the preset dialogs
    int menuId = 0;
  };
  // One shown menu with the position it was asked for.
  struct ShownMenu {
    std::vector<MenuItem> items;
    int x = 0, y = 0;
  };
  struct DialogRun {
    bool save = false;
    std::string folder;
  };

  // profilePath may be empty (no appearance file); moduleFolder ends with a separator.
  HeadlessHost(std::string profilePath = {}, std::string moduleFolder = {}, std::string presetFolder = {});

  // Shows window: attaches this host to it; repaints go through it. The host must outlive the window.
  void show(EditorWindow* window);
  // The paint event the window system would send: a full repaint when something invalidated the window.
  void settle();

  void queue(Answer answer) { answers_.push_back(std::move(answer)); }
  void queueColour(SkinColour c) { queue({Answer::kColour, c, {}, 0}); }
  void queueFile(std::string path) { queue({Answer::kFile, {}, std::move(path), 0}); }
  void queueMenu(int id) { queue({Answer::kMenu, {}, {}, id}); }
  void queueCancel() { queue({}); }

  const std::vector<EditorRect>& presented() const { return presented_; }
  void clearPresented() { presented_.clear(); }
  bool invalid() const { return invalid_; }
  bool captured() const { return captured_; }
  const std::vector<std::string>& messages() const { return messages_; }
  const std::vector<std::string>& documents() const { return documents_; }
  const std::vector<ShownMenu>& menus() const { return menus_; }
  const std::vector<DialogRun>& dialogs() const { return dialogs_; }

  void present(const DibSurface& surface, int x, int y, int w, int h) override;
  void invalidate() override { invalid_ = true; }
  void setCapture() override { captured_ = true; }
  void releaseCapture() override { captured_ = false; }
  int caretBlinkTime() override { return 500; }
  void messageBox(const std::string& text) override { messages_.push_back(text); }
  void openDocument(const std::string& target) override { documents_.push_back(target); }
  bool chooseColour(SkinColour initial, SkinColour* chosen) override;
  bool chooseBitmapFile(const std::string& initial, std::string* chosen) override;
  int trackMenu(const std::vector<MenuItem>& items, int x, int y) override;
  // A queued file answer is the preset name to save the settings under (save) or to load; anything else
  // cancels the dialog.
  void runPresetDialog(bool save, ReverbCore& core, const std::string& folder) override;
  std::string profilePath() override { return profilePath_; }
  std::string moduleFolder() override { return moduleFolder_; }
  std::string presetFolder() override { return presetFolder_; }

 private:
  // The next queued answer; a cancel when the queue is empty.
  Answer next();

  std::string profilePath_, moduleFolder_, presetFolder_;
  EditorWindow* window_ = nullptr;
  std::deque<Answer> answers_;
  std::vector<EditorRect> presented_;
  std::vector<std::string> messages_, documents_;
  std::vector<ShownMenu> menus_;
  std::vector<DialogRun> dialogs_;
  bool invalid_ = false;
  bool captured_ = false;
};

}  // namespace ulvetta
