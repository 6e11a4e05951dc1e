#include "SkinSheet.h"

#include <algorithm>
#include <memory>
#include <string>
#include <vector>

#include "CliSetup.h"
#include "editor/BitmapFont.h"
#include "editor/DibSurface.h"
#include "editor/EditorFonts.h"
#include "editor/SkinDraw.h"
#include "editor/headless/PngPresenter.h"
#include "resources/BitmapResources.h"

namespace ulvetta {
namespace {

constexpr int kSheetWidth = 1024;
constexpr int kMargin = 12;
constexpr int kGap = 12;
// Bitmap resources are numbered in this range; the sheet shows whichever exist.
constexpr int kFirstResource = 100;
constexpr int kLastResource = 299;
constexpr SkinColour kBackground{46, 48, 52, 255};
constexpr SkinColour kCaption{200, 200, 196, 255};

struct Placed {
    std::unique_ptr<SkinBitmap> bitmap;
    int id, x, y;
};

// Places each bitmap left to right, starting a new row when the sheet is full; returns the height used.
int placeRow(std::vector<Placed>& placed, int captionHeight) {
    int x = kMargin, y = kMargin, rowHeight = 0;
    for (Placed& p : placed) {
        const int w = std::max(p.bitmap->width(), 24), h = p.bitmap->height() + captionHeight + 2;
        if (x + w > kSheetWidth - kMargin && x > kMargin) {
            x = kMargin;
            y += rowHeight + kGap;
            rowHeight = 0;
        }
        p.x = x;
        p.y = y;
        x += w + kGap;
        rowHeight = std::max(rowHeight, h);
    }
    return y + rowHeight + kGap;
}

}  // namespace

void writeSkinSheet(const std::string& path) {
    BitmapFont small, large;
    if (!small.strip().loadResource(kSmallFontResource) || !large.strip().loadResource(kLargeFontResource))
        throw CliError("the module holds no font strips", kExitFailure);
    small.setGlyphs(kFontCharacterSet, kSmallFontWidths.data());
    large.setGlyphs(kFontCharacterSet, kLargeFontWidths.data());

    std::vector<Placed> placed;
    for (int id = kFirstResource; id <= kLastResource; ++id) {
        auto bitmap = std::make_unique<SkinBitmap>();
        if (bitmap->loadResource(id)) placed.push_back({std::move(bitmap), id, 0, 0});
    }
    const int fontsTop = placeRow(placed, small.lineHeight());
    // Both character sets in three colours at three alphas, on the background and on white.
    const SkinColour colours[] = {{255, 255, 255, 255}, {244, 170, 60, 255}, {20, 0, 177, 255}};
    const int alphas[] = {255, 160, 80};
    const int lineStep = large.lineHeight() + 4;
    const int height = fontsTop + 2 * 9 * lineStep + kMargin;

    DibSurface sheet;
    if (!sheet.create(0, 0, kSheetWidth, height)) throw CliError("the sheet could not be allocated", kExitFailure);
    fillRect(&sheet, 0, 0, kSheetWidth, height, kBackground);
    for (const Placed& p : placed) {
        const std::string caption = std::to_string(p.id);
        drawText(&sheet, small, 0, 0, kSheetWidth, height, kTextLeft, p.x, p.y, caption, kCaption, 255);
        p.bitmap->copy(&sheet, p.x, p.y + small.lineHeight() + 2, p.bitmap->width(), p.bitmap->height(), 0, 0);
    }
    const int half = kSheetWidth / 2;
    fillRect(&sheet, half, fontsTop, kSheetWidth - half, height - fontsTop, SkinColour{236, 236, 232, 255});
    int y = fontsTop;
    for (const BitmapFont* font : {&small, &large}) {
        for (const SkinColour& c : colours) {
            for (const int alpha : alphas) {
                for (const int left : {kMargin, half + kMargin})
                    drawText(&sheet, *font, left, y, half - 2 * kMargin, lineStep, kTextLeft, left, y,
                             kFontCharacterSet, c, alpha);
                y += lineStep;
            }
        }
    }
    PngPresenter png(path);
    if (!png.present(sheet, 0, 0, kSheetWidth, height)) throw CliError(png.error(), kExitFailure);
}

}  // namespace ulvetta
