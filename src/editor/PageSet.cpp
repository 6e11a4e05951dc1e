#include "editor/PageSet.h"

namespace ulvetta {

PageSet::PageSet(ReverbCore& core, WindowHost* host)
    : reverb_(std::make_unique<ReverbPage>(&core)),
      filter_(std::make_unique<FilterPage>(&core)),
      window_(std::make_unique<EditorWindow>()) {
  if (!window_->valid()) {
    failed_ = true;
    return;
  }
  window_->attach(host);
  failed_ = reverb_->create(window_.get()) != 0;
  failed_ = filter_->create(window_.get()) != 0 || failed_;
  about_ = AboutPage::create(window_.get(), &core);
  failed_ = !about_ || failed_;
}

PageSet::~PageSet() {
  reverb_->destroyControls();
  filter_->destroyControls();
  // The about page holds nothing but its controls and pictures, and leaves its slot when deleted.
  about_.reset();
  window_.reset();
  reverb_.reset();
  filter_.reset();
}

}  // namespace ulvetta
