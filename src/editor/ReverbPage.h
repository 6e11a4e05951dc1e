#pragma once
// Page 0 of the editor: the reverb parameters. Pre Delay, Diffusion and Early Reflections show only for the
// Algorithms that use them.
#include "editor/WorkingPage.h"

namespace ulvetta {

class ReverbPage : public WorkingPage {
 public:
  explicit ReverbPage(ReverbCore* core);

 protected:
  bool columnShown(int32_t paramId, int32_t algorithm) const override;
};

}  // namespace ulvetta
