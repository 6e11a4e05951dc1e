#pragma once
// The headless presenter: writes the presented rectangle of the back buffer to a PNG file (8-bit RGB). The
// file appears whole or not at all: it is written beside its final name and renamed into place.
#include <string>

#include "editor/Presenter.h"

namespace ulvetta {

class PngPresenter : public Presenter {
 public:
  explicit PngPresenter(std::string path) : path_(std::move(path)) {}

  bool present(const DibSurface& surface, int x, int y, int w, int h) override;
  // One sentence saying why the last present failed; empty after a success.
  const std::string& error() const { return error_; }

 private:
  std::string path_;
  std::string error_;
};

}  // namespace ulvetta
