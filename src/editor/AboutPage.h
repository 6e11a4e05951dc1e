#pragma once
// The editor's about page (slot 2): the background picture, product and credit lines that fade in and out
// one after another on a translucent panel, a link to the documentation installed beside the module (or to a
// web address given at build time), and a button back to the reverb page.
#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "editor/BitmapFont.h"
#include "editor/PushButton.h"
#include "editor/SkinImage.h"
#include "editor/SkinPanel.h"

namespace ulvetta {

class AboutPage : public SkinPanel, public PushButtonTarget {
  // Only create() can make the key, so every page is built there and registered in its slot.
  struct Key {};

 public:
  // One text of the credit cycle, shown from tick first to tick last inclusive; lines end at character 10.
  struct CreditLine {
    std::string text;
    int32_t first, last, fadeIn, fadeOut;  // ticks of 50 ms
  };

  static constexpr EditorRect kCreditArea{405, 23, 340, 90};
  static constexpr EditorRect kLinkArea{570, 152, 180, 15};
  static constexpr EditorRect kReturnButton{689, 123, 50, 20};
  static constexpr int kPanelMargin = 6;  // pixels around the text
  static constexpr int kPanelAlpha = 90;  // darkening of the panel at full opacity

  // Builds the page with its credit lines and registers it in window's slot 2; the slot is emptied again
  // when the page is destroyed, so the window must outlive the page.
  static std::unique_ptr<AboutPage> create(EditorWindow* window, ReverbCore* core);
  AboutPage(Key, EditorWindow* window, ReverbCore* core);
  ~AboutPage() override;

  // Appends a line; the cycle length becomes last when that is larger.
  void addCreditLine(std::string text, int32_t first, int32_t last, int32_t fadeIn, int32_t fadeOut);
  const std::vector<CreditLine>& creditLines() const { return lines_; }
  int32_t cycleLength() const { return cycle_; }
  int32_t tickCount() const { return t_; }
  // The first line showing at tick t, or null.
  const CreditLine* lineAt(int32_t t) const;
  // A line's opacity at tick t: rising over fadeIn ticks from 0 at first, 1, then falling over fadeOut ticks
  // to 0 at last.
  static float opacity(const CreditLine& line, int32_t t);
  // The darkened panel behind a text: the text's box centred in the credit area, enlarged by the margin.
  EditorRect panelFor(const std::string& text) const;

  // What the link opens: the web address given at build time, else README.html in the module's folder.
  std::string linkTarget() const;
  // What the link area shows: the web address without its scheme, or "README.html".
  std::string linkLabel() const;

  // Advances the cycle by one tick and redraws the current line's panel, only while this page is shown.
  void tick() override;
  // The return button, then a press or double-click in the link area opens the link.
  void mouse(int x, int y, int event, int modifiers) override;
  // Keys (TAB too) are not used here.
  bool keyDown(int) override { return false; }
  // The return button: shows the reverb page.
  void set(int id, float value) override;

 protected:
  void paintBackground(DibSurface* target) override;

 private:
  SkinImage background_;
  BitmapFont font_;
  std::vector<CreditLine> lines_;
  int32_t cycle_ = 0;
  int32_t t_ = 0;
};

}  // namespace ulvetta
