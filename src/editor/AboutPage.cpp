#include "editor/AboutPage.h"

#include <algorithm>

#include "editor/EditorFonts.h"
#include "editor/EditorWindow.h"
#include "editor/SkinDraw.h"

#ifndef ULVETTA_WEB_ADDRESS
#define ULVETTA_WEB_ADDRESS ""
#endif

namespace ulvetta {

namespace {

constexpr int kBackgroundPicture = 196;
constexpr int kReturnStrip = 178;
constexpr int kReturnMask = 179;
constexpr int kReturnButtonId = 0;
constexpr char kDocument[] = "README.html";
constexpr SkinColour kTextColour{255, 255, 255, 255};
constexpr SkinColour kLinkColour{255, 170, 52, 255};      // the amber of the artwork
constexpr SkinColour kUnderlineColour{96, 66, 28, 255};
constexpr int kLinkRightMargin = 12;                      // keeps the text clear of the rack ear's screw

// The credit cycle: product, maker, then who did what. Names are the project's own.
constexpr char kMaker[] = "The Ulvetta developers";

}  // namespace

AboutPage::AboutPage(Key, EditorWindow* window, ReverbCore* core)
    : SkinPanel(core, window), background_(kBackgroundPicture, kEditorRect) {
  font_.strip().loadResource(kLargeFontResource);
  font_.setGlyphs(kFontCharacterSet, kLargeFontWidths.data());
}

std::unique_ptr<AboutPage> AboutPage::create(EditorWindow* window, ReverbCore* core) {
  auto page = std::make_unique<AboutPage>(Key{}, window, core);
  const std::string names = std::string("\n\n") + kMaker;
  page->addCreditLine("Morvane Ulvetta Version 1.0", 0, 79, 15, 20);
  page->addCreditLine("SMP Optimized Digital Reverberation", 80, 159, 15, 20);
  page->addCreditLine("Made by the Ulvetta developers\nfrom its own code and artwork", 160, 239, 15, 20);
  page->addCreditLine("Algorithm Development:" + names, 240, 319, 15, 20);
  page->addCreditLine("Graphic Artwork and Design:" + names + "\nGlyphs drawn from DejaVu Sans", 320, 399, 15, 20);
  page->addCreditLine("GUI Programming:" + names, 400, 479, 15, 20);
  page->addCreditLine("QA:" + names, 480, 559, 15, 20);
  page->addChild(std::make_unique<PushButton>(window, page.get(), kReturnButtonId, kReturnButton, kReturnStrip,
                                              kReturnMask, page.get()));
  if (window) window->setPage(kAboutPage, page.get());
  return page;
}

AboutPage::~AboutPage() {
  if (window_ && window_->page(kAboutPage) == this) window_->setPage(kAboutPage, nullptr);
}

void AboutPage::addCreditLine(std::string text, int32_t first, int32_t last, int32_t fadeIn, int32_t fadeOut) {
  lines_.push_back({std::move(text), first, last, fadeIn, fadeOut});
  if (last > cycle_) cycle_ = last;
}

const AboutPage::CreditLine* AboutPage::lineAt(int32_t t) const {
  for (const CreditLine& line : lines_)
    if (line.first <= t && t <= line.last) return &line;
  return nullptr;
}

float AboutPage::opacity(const CreditLine& line, int32_t t) {
  if (t - line.first < line.fadeIn) return static_cast<float>(t - line.first) / static_cast<float>(line.fadeIn);
  if ((t - line.last) + line.fadeOut >= 0)
    return 1.0f - static_cast<float>(t - (line.last - line.fadeOut)) / static_cast<float>(line.fadeOut);
  return 1.0f;
}

EditorRect AboutPage::panelFor(const std::string& text) const {
  const int tw = font_.textWidth(text), th = font_.textHeight(text);
  const int x = kCreditArea.x + (kCreditArea.w - tw) / 2, y = kCreditArea.y + (kCreditArea.h - th) / 2;
  return {x - kPanelMargin, y - kPanelMargin, tw + 2 * kPanelMargin, th + 2 * kPanelMargin};
}

std::string AboutPage::linkTarget() const {
  if (*ULVETTA_WEB_ADDRESS) return ULVETTA_WEB_ADDRESS;
  WindowHost* host = window_ ? window_->host() : nullptr;
  return (host ? host->moduleFolder() : std::string()) + kDocument;
}

std::string AboutPage::linkLabel() const {
  const std::string address = ULVETTA_WEB_ADDRESS;
  if (address.empty()) return kDocument;
  const size_t scheme = address.find("://");
  return scheme == std::string::npos ? address : address.substr(scheme + 3);
}

void AboutPage::paintBackground(DibSurface* target) {
  background_.draw(target);
  const std::string label = linkLabel();
  const EditorRect clip{kLinkArea.x, kLinkArea.y, kLinkArea.w - kLinkRightMargin, kLinkArea.h};
  drawText(target, font_, clip.x, clip.y, clip.w, clip.h, kTextCentre | kTextVCentre, 0, 0, label, kLinkColour,
           255);
  const int tw = std::min(font_.textWidth(label), clip.w);
  const int underline = clip.y + (clip.h + font_.lineHeight()) / 2;
  fillRect(target, clip.x + (clip.w - tw) / 2, underline, tw, 1, kUnderlineColour);
}

void AboutPage::tick() {
  DibSurface* s = surface();
  if (!s || window_->current() != this) return;
  if (++t_ > cycle_) t_ = 0;
  const CreditLine* line = lineAt(t_);
  if (!line || !background_.loaded() || font_.strip().empty()) return;
  const float a = opacity(*line, t_);
  const EditorRect panel = panelFor(line->text);
  repaintRect(panel.x, panel.y, panel.w, panel.h, nextChildId());
  fillRect(s, panel.x, panel.y, panel.w, panel.h, {0, 0, 0, static_cast<uint8_t>(a * kPanelAlpha)});
  drawText(s, font_, panel.x, panel.y, panel.w, panel.h, kTextCentre | kTextVCentre, 0, 0, line->text, kTextColour,
           static_cast<int>(a * 255.0f));
  window_->present(panel.x, panel.y, panel.w, panel.h);
}

void AboutPage::mouse(int x, int y, int event, int modifiers) {
  if (offerMouse(x, y, event, modifiers) || !isPress(event)) return;
  const bool inLink = x >= kLinkArea.x && y >= kLinkArea.y && x < kLinkArea.x + kLinkArea.w &&
                      y < kLinkArea.y + kLinkArea.h;
  if (inLink && window_ && window_->host()) window_->host()->openDocument(linkTarget());
}

void AboutPage::set(int, float) {
  if (window_) window_->showPage(kReverbPage);
}

}  // namespace ulvetta
