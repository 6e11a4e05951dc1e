#pragma once
// Page 1 of the editor: input gain, the low- and high-pass filters and the notch.
#include "editor/WorkingPage.h"

namespace ulvetta {

class FilterPage : public WorkingPage {
 public:
  explicit FilterPage(ReverbCore* core);
};

}  // namespace ulvetta
