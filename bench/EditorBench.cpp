// A full repaint of the editor's back buffer as a working page draws it: the background gradient, the
// pictures at their sizes (thumbs and logo through their masks), the value texts and the meter needle; first
// with synthetic pictures through the drawing layer alone, then the real reverb page. And the 50 ms tick of
// that page while the needle moves, which must copy only the rectangle the needle swept.
#include <benchmark/benchmark.h>

#include <cstdio>
#include <memory>
#include <vector>

#include "editor/BitmapFont.h"
#include "editor/EditorFonts.h"
#include "editor/SkinDraw.h"
#include "editor/BmpBuilder.h"
#include "editor/PageSet.h"
#include "editor/headless/HeadlessHost.h"
#include "filter/ReverbCore.h"

namespace ulvetta {
namespace {

struct Picture {
  int w, h, count;
  bool masked;
};

// The page's pictures: size and how many times one repaint draws them.
const Picture kPictures[] = {
    {3, 112, 7, false},   // vertical grooves
    {112, 3, 3, false},   // horizontal grooves
    {38, 17, 9, false},   // display frames
    {118, 103, 1, false}, // meter face
    {14, 119, 7, false},  // vertical labels
    {119, 14, 2, false},  // OUTPUT LEVELS, COLOUR
    {34, 13, 2, false},   // DRY, WET
    {119, 4, 1, false},   // bar under the Algorithm box
    {13, 12, 2, false},   // page buttons
    {28, 12, 1, false},   // PAGE
    {119, 14, 1, false},  // Algorithm box
    {108, 15, 1, false},  // one frame of the meter source strip
    {131, 26, 1, true},   // logo
    {22, 15, 7, true},    // vertical fader thumbs
    {15, 22, 3, true},    // horizontal fader thumbs
};

std::unique_ptr<SkinBitmap> synthetic(int w, int h, int seed) {
  auto bitmap = std::make_unique<SkinBitmap>(nullptr);
  test::load(*bitmap, test::greyBitmap(w, h, [seed](int x, int y) { return uint8_t(x * 7 + y * 13 + seed); }));
  return bitmap;
}

void BM_EditorFullRepaint(benchmark::State& state) {
  DibSurface surface;
  surface.create(0, 0, 750, 167);
  std::vector<std::unique_ptr<SkinBitmap>> pictures, masks;
  for (const Picture& p : kPictures) {
    pictures.push_back(synthetic(p.w, p.h, p.count));
    masks.push_back(synthetic(p.w, p.h, 99));
  }
  BitmapFont font(nullptr);
  test::load(font.strip(), test::greyBitmap(kSmallFontWidth, kSmallFontHeight, [](int x, int y) { return uint8_t((x ^ y) * 37); }));
  font.setGlyphs(kFontCharacterSet, kSmallFontWidths.data());
  char texts[25][16];
  for (int i = 0; i < 25; ++i) std::snprintf(texts[i], sizeof texts[i], "%+.1f dB", -60.0 + 2.5 * i);

  for (auto _ : state) {
    for (int y = 0; y < 167; ++y)
      fillRect(&surface, 0, y, 750, 1, SkinColour{uint8_t(40 + y / 2), uint8_t(60 + y / 3), uint8_t(90 - y / 4), 255});
    for (size_t k = 0; k < pictures.size(); ++k) {
      const Picture& p = kPictures[k];
      for (int n = 0; n < p.count; ++n) {
        const int x = static_cast<int>((k * 97 + n * 41) % (750 - p.w)), y = static_cast<int>((k * 13 + n * 7) % (167 - p.h));
        if (p.masked)
          pictures[k]->maskedCopy(&surface, x, y, p.w, p.h, 0, 0, masks[k].get());
        else
          pictures[k]->copy(&surface, x, y, p.w, p.h, 0, 0);
      }
    }
    for (int i = 0; i < 25; ++i)
      drawText(&surface, font, 18 + 28 * i, 17, 34, 13, kTextCentre | kTextVCentre, 0, 0, texts[i],
               SkinColour{243, 242, 242, 255}, 255);
    drawLine(&surface, 128, 97, 107, 82, SkinColour{0, 0, 0, 255});
    benchmark::DoNotOptimize(surface.pixels());
    benchmark::ClobberMemory();
  }
}
BENCHMARK(BM_EditorFullRepaint)->Unit(benchmark::kMicrosecond);

// A core that streams and whose meter level swings between two values at every reading.
class SwingingCore : public ReverbCore {
 public:
  float getStatus(int32_t code) override {
    if (code == kStatusLoad) return ReverbCore::getStatus(code);
    if (code == kStatusStopped) return 0.0f;
    high_ = !high_;
    return high_ ? 0.8f : 0.2f;
  }

 private:
  bool high_ = false;
};

// The reverb page's paint: background cache (gradient, meter section, every picture) and all 24 controls.
void BM_WorkingPageRepaint(benchmark::State& state) {
  ReverbCore core;
  HeadlessHost host;
  PageSet pages(core, &host);
  host.show(&pages.window());
  for (auto _ : state) {
    pages.window().paint(0, 0, 750, 167);
    benchmark::DoNotOptimize(pages.window().surface()->pixels());
  }
}
BENCHMARK(BM_WorkingPageRepaint)->Unit(benchmark::kMicrosecond);

// One tick of the reverb page with the needle moving between levels 0.2 and 0.8; reports the pixels copied
// to the window per tick (the swept rectangle, never the 125250 of the whole editor).
void BM_MeterTick(benchmark::State& state) {
  SwingingCore core;
  HeadlessHost host;
  PageSet pages(core, &host);
  host.show(&pages.window());
  host.settle();
  pages.window().tick();
  host.clearPresented();
  int64_t ticks = 0, pixels = 0;
  for (auto _ : state) {
    pages.window().tick();
    ++ticks;
    for (const EditorRect& r : host.presented()) pixels += static_cast<int64_t>(r.w) * r.h;
    host.clearPresented();
  }
  state.counters["presented_px"] = static_cast<double>(pixels) / static_cast<double>(ticks);
}
BENCHMARK(BM_MeterTick)->Unit(benchmark::kMicrosecond);

}  // namespace
}  // namespace ulvetta
BENCHMARK_MAIN();
