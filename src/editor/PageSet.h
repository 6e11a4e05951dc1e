#pragma once
// Everything the editor shows for one core: the reverb and filter pages, the about page and the editor window
// that holds them. Built once per property page and torn down in the reverse order: the controls first, then
// the window, then the working pages (which stop listening to the core).
#include <memory>

#include "editor/AboutPage.h"
#include "editor/EditorWindow.h"
#include "editor/FilterPage.h"
#include "editor/ReverbPage.h"

namespace ulvetta {

class PageSet {
 public:
  // host (may be null) is attached to the window before the pages are populated, so that they read their
  // appearance through it.
  explicit PageSet(ReverbCore& core, WindowHost* host = nullptr);
  ~PageSet();
  PageSet(const PageSet&) = delete;
  PageSet& operator=(const PageSet&) = delete;

  // True when the window could not be created or a page could not be populated.
  bool failed() const { return failed_; }
  EditorWindow& window() { return *window_; }
  ReverbPage& reverbPage() { return *reverb_; }
  FilterPage& filterPage() { return *filter_; }
  AboutPage* aboutPage() { return about_.get(); }

 private:
  std::unique_ptr<ReverbPage> reverb_;
  std::unique_ptr<FilterPage> filter_;
  std::unique_ptr<EditorWindow> window_;
  std::unique_ptr<AboutPage> about_;
  bool failed_ = false;
};

}  // namespace ulvetta
