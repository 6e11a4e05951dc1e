#include "editor/WorkingPage.h"

#include "editor/ChoiceList.h"
#include "editor/EditorFonts.h"
#include "editor/EditorWindow.h"
#include "editor/Fader.h"
#include "editor/NeedleMeter.h"
#include "editor/PresetMenu.h"
#include "editor/SegmentSelector.h"
#include "editor/SkinDraw.h"
#include "editor/StatusBar.h"
#include "editor/ValueDisplay.h"

namespace ulvetta {
namespace {

// Sizes of the controls, pixels.
constexpr int kDisplayW = 34, kDisplayH = 13;
constexpr int kFaderLength = 110, kFaderWidth = 22;
constexpr SkinColour kTextColour{243, 242, 242, 255};
constexpr SkinColour kLoadColour{20, 0, 177, 255};
constexpr SkinColour kNeedleColour{0, 0, 0, 255};

// Picture resources and places shared by both pages.
constexpr int kVerticalGroove = 202, kHorizontalGroove = 203, kDisplayFrame = 204, kMeterFace = 205;
constexpr int kGrooveY = 38, kFrameY = 15;
constexpr int kHorizontalGrooveX = 558;
constexpr int kHorizontalGrooveYs[] = {47, 68, 119};
constexpr WorkingPage::Placed kCommonPictures[] = {
    {kMeterFace, 87, 37},
    {212, 556, 18},  // OUTPUT LEVELS
    {215, 556, 91},  // COLOUR
    {210, 514, 43},  // DRY
    {206, 514, 61},  // WET
};
constexpr WorkingPage::Placed kAlgorithmBar{229, 557, 152};
constexpr WorkingPage::Placed kPageLabel{233, 506, 126};
constexpr WorkingPage::Placed kAlgorithmBox{222, 557, 139};
constexpr int kButton1X = 506, kButton2X = 521, kButtonY = 139;
constexpr EditorRect kLogoRect{81, 6, 131, 26};
constexpr int kLogo = 231, kLogoMask = 230;
constexpr int kVerticalThumb = 186, kVerticalThumbMask = 188, kHorizontalThumb = 187, kHorizontalThumbMask = 189;

// The Algorithm list, the meter source selector with its three zones, and the load bar.
constexpr EditorRect kAlgorithmListRect{557, 140, 119, 14};
constexpr int kAlgorithmListHeight = 88;
constexpr EditorRect kMeterSourceRect{91, 142, 108, 15};
constexpr int kMeterSourceStrip = 228;
constexpr int kZoneW = 36;
constexpr float kZonePositions[] = {0.0f, 0.5f, 1.0f};
constexpr EditorRect kLoadBarRect{558, 153, 117, 1};

// The meter section: its face colour, the shade columns either side and the highlight at its right edge.
constexpr EditorRect kMeterSection{80, 0, 133, 167};
constexpr EditorRect kMeterShades[] = {{76, 0, 4, 167}, {213, 0, 4, 167}};
constexpr EditorRect kMeterHighlight{215, 0, 1, 167};

bool inside(const EditorRect& r, int x, int y) { return x >= r.x && y >= r.y && x < r.x + r.w && y < r.y + r.h; }

void fill(DibSurface* target, const EditorRect& r, SkinColour c) { fillRect(target, r.x, r.y, r.w, r.h, c); }

}  // namespace

WorkingPage::WorkingPage(ReverbCore* core, Layout layout) : SkinPanel(core, nullptr), layout_(std::move(layout)) {
  if (core_) core_->addListener(this);
}

WorkingPage::~WorkingPage() {
  if (core_) core_->removeListener(this);
}

bool WorkingPage::loadPicture(int resource, int maskResource) {
  if (pictures_.count(resource)) return true;
  auto image = std::make_unique<SkinImage>(resource, EditorRect{}, maskResource ? SkinImage::kMasked : SkinImage::kCopy,
                                           maskResource);
  const bool loaded = image->loaded();
  pictures_[resource] = std::move(image);
  return loaded;
}

void WorkingPage::drawPicture(DibSurface* target, int resource, int x, int y) const {
  const auto it = pictures_.find(resource);
  if (it == pictures_.end() || !it->second->loaded()) return;
  const SkinBitmap& b = it->second->bitmap();
  it->second->draw(target, x, y, b.width(), b.height(), 0, 0);
}

int WorkingPage::create(EditorWindow* window) {
  window_ = window;
  bool ok = font_.strip().loadResource(kSmallFontResource);
  font_.setGlyphs(kFontCharacterSet, kSmallFontWidths.data());
  verticalThumb_ = std::make_unique<SkinImage>(kVerticalThumb, EditorRect{0, 0, 22, 15}, SkinImage::kMasked,
                                               kVerticalThumbMask);
  horizontalThumb_ = std::make_unique<SkinImage>(kHorizontalThumb, EditorRect{0, 0, 15, 22}, SkinImage::kMasked,
                                                 kHorizontalThumbMask);
  ok = verticalThumb_->loaded() && horizontalThumb_->loaded() && ok;
  ok = loadPicture(kLogo, kLogoMask) && ok;
  for (int resource : {kVerticalGroove, kHorizontalGroove, kDisplayFrame, kAlgorithmBar.resource,
                       kPageLabel.resource, kAlgorithmBox.resource, layout_.button1, layout_.button2})
    ok = loadPicture(resource) && ok;
  for (const Placed& p : kCommonPictures) ok = loadPicture(p.resource) && ok;
  for (const Placed& p : layout_.labels) ok = loadPicture(p.resource) && ok;
  for (const OptionalColumn& c : layout_.optional) ok = loadPicture(c.label.resource) && ok;

  // Each display goes just before its fader, and the two redraw each other.
  for (const Column& c : layout_.columns) {
    auto* display = static_cast<ValueDisplay*>(addChild(std::make_unique<ValueDisplay>(
        window, core_, this, c.paramId, c.displayX, c.displayY, kDisplayW, kDisplayH)));
    auto* fader = static_cast<Fader*>(addChild(std::make_unique<Fader>(
        window, core_, this, c.paramId, c.faderX, c.faderY, c.vertical ? kFaderWidth : kFaderLength,
        c.vertical ? kFaderLength : kFaderWidth, c.vertical ? Fader::kVertical : Fader::kHorizontal,
        c.vertical ? verticalThumb_.get() : horizontalThumb_.get())));
    display->link(fader);
    fader->link(display);
    columns_[c.paramId] = {display, fader};
  }
  const EditorRect& l = kAlgorithmListRect;
  algorithmList_ = static_cast<ChoiceList*>(addChild(
      std::make_unique<ChoiceList>(window, core_, this, kAlgorithm, l.x, l.y, l.w, l.h, kAlgorithmListHeight)));
  const EditorRect& m = kMeterSourceRect;
  meterSource_ = static_cast<SegmentSelector*>(addChild(std::make_unique<SegmentSelector>(
      window, core_, this, kMeterSource, m.x, m.y, m.w, m.h, kMeterSourceStrip, 3)));
  ok = meterSource_->frameCount() == 3 && ok;
  meter_ = static_cast<NeedleMeter*>(addChild(std::make_unique<NeedleMeter>(window, core_, this)));
  const EditorRect& b = kLoadBarRect;
  addChild(std::make_unique<StatusBar>(window, core_, this, b.x, b.y, b.w, b.h, kStatusLoad, kLoadColour));

  setupFonts();
  if (window) window->setPage(layout_.slot, this);
  loadAppearance(appearance_, core_, window ? window->host() : nullptr);
  return ok ? 0 : 1;
}

void WorkingPage::setupFonts() {
  for (auto& entry : columns_) entry.second.display->setFont(&font_, kTextColour);
  algorithmList_->setFont(&font_, kTextColour);
  for (const char* name : kAlgorithmNames) algorithmList_->addItem(name);
  const EditorRect& clip = NeedleMeter::kClip;
  meter_->setGeometry(NeedleMeter::kPivotX, NeedleMeter::kPivotY, clip.x, clip.y, clip.w, clip.h,
                      NeedleMeter::kLength, NeedleMeter::kRestAngle, kNeedleColour);
  for (int k = 0; k < 3; ++k)
    meterSource_->addZone(kMeterSourceRect.x + k * kZoneW, kMeterSourceRect.y, kZoneW, kMeterSourceRect.h,
                          kZonePositions[k]);
}

void WorkingPage::destroyControls() {
  SkinPanel::destroyControls();
  columns_.clear();
  algorithmList_ = nullptr;
  meterSource_ = nullptr;
  meter_ = nullptr;
  pictures_.clear();
  verticalThumb_.reset();
  horizontalThumb_.reset();
  font_.strip().release();
}

bool WorkingPage::columnShown(int32_t, int32_t) const { return true; }

void WorkingPage::ColumnControls::show(bool shown) {
  for (SkinControl* control : {static_cast<SkinControl*>(display), static_cast<SkinControl*>(fader)}) {
    if (shown) control->enable();
    else control->disable();
  }
}

void WorkingPage::paintBackground(DibSurface* target) {
  drawAppearanceBackground(appearance_, target);

  const SkinColour meter = appearance_.meter;
  const SkinColour shade{static_cast<uint8_t>(meter.r / 6), static_cast<uint8_t>(meter.g / 6),
                         static_cast<uint8_t>(meter.b / 6), 255};
  // round(0.6 shade + 0.4 meter): 6 shade + 4 meter is even, so it never falls on a half.
  auto highlight = [](int s, int m) { return static_cast<uint8_t>((6 * s + 4 * m + 5) / 10); };
  fill(target, kMeterSection, meter);
  for (const EditorRect& r : kMeterShades) fill(target, r, shade);
  fill(target, kMeterHighlight,
       {highlight(shade.r, meter.r), highlight(shade.g, meter.g), highlight(shade.b, meter.b), 255});

  for (int x : layout_.grooveXs) drawPicture(target, kVerticalGroove, x, kGrooveY);
  for (int y : kHorizontalGrooveYs) drawPicture(target, kHorizontalGroove, kHorizontalGrooveX, y);
  for (const Placed& p : layout_.frames) drawPicture(target, p.resource, p.x, p.y);
  for (const Placed& p : layout_.labels) drawPicture(target, p.resource, p.x, p.y);
  for (const Placed& p : kCommonPictures) drawPicture(target, p.resource, p.x, p.y);
  drawPicture(target, kLogo, kLogoRect.x, kLogoRect.y);
  drawPicture(target, kAlgorithmBar.resource, kAlgorithmBar.x, kAlgorithmBar.y);

  // The columns an Algorithm does not use are hidden: their controls neither paint nor respond.
  const int32_t algorithm = core_ ? core_->getValue(kAlgorithm) : 0;
  for (const OptionalColumn& c : layout_.optional) {
    const bool shown = columnShown(c.paramId, algorithm);
    const auto it = columns_.find(c.paramId);
    if (it != columns_.end()) it->second.show(shown);
    if (!shown) continue;
    drawPicture(target, kVerticalGroove, c.grooveX, kGrooveY);
    drawPicture(target, kDisplayFrame, c.frameX, kFrameY);
    drawPicture(target, c.label.resource, c.label.x, c.label.y);
  }

  drawPicture(target, layout_.button1, kButton1X, kButtonY);
  drawPicture(target, layout_.button2, kButton2X, kButtonY);
  drawPicture(target, kPageLabel.resource, kPageLabel.x, kPageLabel.y);
  drawPicture(target, kAlgorithmBox.resource, kAlgorithmBox.x, kAlgorithmBox.y);
}

bool WorkingPage::current() const { return window_ && window_->current() == this; }

void WorkingPage::showOther() {
  window_->showPage(layout_.otherSlot);
  if (EditorPage* other = window_->page(layout_.otherSlot)) other->refresh(kRefreshAll);
  window_->presentAll();
}

void WorkingPage::mouse(int x, int y, int event, int modifiers) {
  // A right click is the preset menu's and never reaches a control.
  if (event == kRightPress || event == kRightDoubleClick) {
    if (window_ && core_) showPresetMenu(*window_, x, y, *core_);
    return;
  }
  if ((event == kLeftPress || event == kLeftDoubleClick) && window_) {
    if (inside(layout_.otherButton, x, y)) {
      showOther();
      return;
    }
    if (inside(kLogoRect, x, y)) {
      window_->showPage(kAboutPage);
      window_->presentAll();
      return;
    }
  }
  // Moves with no button only serve the hover of the open Algorithm list.
  if (event == kMove) {
    if (algorithmList_) algorithmList_->mouse(x, y, event, modifiers);
    return;
  }
  offerMouse(x, y, event, modifiers);
}

bool WorkingPage::keyDown(int key) {
  if (key == kKeyTab && window_) {
    showOther();
    return true;
  }
  return SkinPanel::keyDown(key);
}

void WorkingPage::refresh(int32_t code) {
  if (!current()) return;
  if (code == kRefreshAll) {
    loadAppearance(appearance_, core_, window_->host());
    paint();
    window_->presentAll();
  } else if (code >= kRefreshParamBase && code < kRefreshParamBase + 99) {
    window_->invalidate();
  }
}

}  // namespace ulvetta
