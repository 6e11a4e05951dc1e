// The module's pictures read by hand: sizes and depths, grey palettes, masks and the meter-source frames.
#include <gtest/gtest.h>

#include <cstdlib>

#include "resources/BitmapResources.h"

using namespace ulvetta;

namespace {

uint32_t le32(const uint8_t* p) { return p[0] | p[1] << 8 | p[2] << 16 | uint32_t(p[3]) << 24; }
uint16_t le16(const uint8_t* p) { return uint16_t(p[0] | p[1] << 8); }

// A bitmap resource read by hand: BITMAPINFOHEADER, palette, rows.
struct Picture {
    int width = 0, height = 0, bits = 0, paletteCount = 0;
    const uint8_t* palette = nullptr;
    const uint8_t* rows = nullptr;
    bool bottomUp = true;

    int stride() const { return (width * bits / 8 + 3) & ~3; }
    // Grey level (blue component of the palette entry, or the middle byte) at x, y counted from the top.
    int grey(int x, int y) const {
        const uint8_t* row = rows + size_t(bottomUp ? height - 1 - y : y) * stride();
        return bits == 8 ? palette[row[x] * 4] : row[x * 3 + 1];
    }
};

Picture load(int id) {
    size_t size = 0;
    const uint8_t* p = BitmapResource(id, &size);
    Picture pic;
    if (!p || size < 40 || le32(p) != 40) {
        ADD_FAILURE() << "resource " << id << " is missing or has no BITMAPINFOHEADER";
        return pic;
    }
    pic.width = int(le32(p + 4));
    const int h = int(le32(p + 8));
    pic.bottomUp = h > 0;
    pic.height = std::abs(h);
    pic.bits = le16(p + 14);
    EXPECT_EQ(le16(p + 12), 1) << id;
    EXPECT_EQ(le32(p + 16), 0u) << id << ": compressed";
    pic.paletteCount = pic.bits == 8 ? (le32(p + 32) ? int(le32(p + 32)) : 256) : 0;
    pic.palette = p + 40;
    pic.rows = pic.palette + pic.paletteCount * 4;
    EXPECT_EQ(size, size_t(40 + pic.paletteCount * 4 + pic.stride() * pic.height)) << id << ": truncated or padded";
    return pic;
}

struct Expected {
    int id, width, height, bits;
};

// Every picture of the editor: masks and glyph strips are 8-bit grey, the rest 24-bit colour.
const Expected kAll[] = {
    {175, 457, 11, 8},  {178, 100, 20, 24}, {179, 100, 20, 8},  {186, 22, 15, 24},  {187, 15, 22, 24},
    {188, 22, 15, 8},   {189, 15, 22, 8},   {193, 383, 9, 8},   {196, 750, 167, 24}, {202, 3, 112, 24},
    {203, 112, 3, 24},  {204, 38, 17, 24},  {205, 118, 103, 24}, {206, 34, 13, 24},  {207, 14, 119, 24},
    {208, 14, 119, 24}, {209, 14, 119, 24}, {210, 34, 13, 24},  {211, 14, 119, 24}, {212, 119, 14, 24},
    {213, 14, 119, 24}, {214, 14, 119, 24}, {215, 119, 14, 24}, {216, 14, 119, 24}, {218, 13, 12, 24},
    {219, 13, 12, 24},  {220, 13, 12, 24},  {221, 13, 12, 24},  {222, 119, 14, 24}, {223, 14, 119, 24},
    {224, 14, 119, 24}, {225, 14, 119, 24}, {226, 14, 119, 24}, {227, 14, 119, 24}, {228, 324, 15, 24},
    {229, 119, 4, 24},  {230, 131, 26, 8},  {231, 131, 26, 24}, {233, 28, 12, 24},
};

}  // namespace

// Every known id gives its picture at its size and depth; unknown ones, the gaps between them included,
// give nothing.
TEST(BitmapResources, EveryPictureHasItsSizeAndDepthAndUnknownIdsNone) {
    for (const Expected& e : kAll) {
        const Picture p = load(e.id);
        EXPECT_TRUE(p.width == e.width && p.height == e.height && p.bits == e.bits)
            << e.id << ": " << p.width << " x " << p.height << ", " << p.bits << " bits";
        for (int i = 0; i < p.paletteCount; ++i) {
            const uint8_t* entry = p.palette + 4 * i;
            EXPECT_TRUE(entry[0] == entry[1] && entry[1] == entry[2]) << e.id << ": palette entry " << i << " not grey";
        }
    }
    for (int id : {0, -1, 1, 174, 217, 232, 234, 65536 + 205}) {
        size_t size = 123;
        EXPECT_TRUE(BitmapResource(id, &size) == nullptr && size == 0) << id;
    }
}

// A mask is as large as its picture, fully opaque somewhere and fully transparent somewhere (the corners).
TEST(BitmapResources, MasksCoverTheirPictures) {
    const std::pair<int, int> pairs[] = {{186, 188}, {187, 189}, {231, 230}, {178, 179}};
    for (auto [pictureId, maskId] : pairs) {
        const Picture picture = load(pictureId), mask = load(maskId);
        ASSERT_TRUE(mask.bits == 8 && mask.width == picture.width && mask.height == picture.height) << maskId;
        int opaque = 0;
        for (int y = 0; y < mask.height; ++y)
            for (int x = 0; x < mask.width; ++x) opaque += mask.grey(x, y) == 255;
        EXPECT_GT(opaque, 0) << maskId;
        EXPECT_EQ(mask.grey(0, 0), 0) << maskId;
    }
    // The return button reacts where its mask exceeds 196, in both frames.
    const Picture button = load(179);
    EXPECT_GT(button.grey(25, 10), 196);
    EXPECT_GT(button.grey(75, 10), 196);
}

// Frame k of the meter-source strip lights zone k: each zone looks different in its own frame.
TEST(BitmapResources, MeterSourceFramesLightOneZoneEach) {
    const Picture p = load(228);
    auto zoneDiffers = [&](int zone, int frameA, int frameB) {
        for (int y = 0; y < 15; ++y)
            for (int x = 0; x < 36; ++x)
                if (p.grey(frameA * 108 + zone * 36 + x, y) != p.grey(frameB * 108 + zone * 36 + x, y)) return true;
        return false;
    };
    for (int zone = 0; zone < 3; ++zone)
        for (int other = 0; other < 3; ++other)
            if (other != zone) {
                EXPECT_TRUE(zoneDiffers(zone, zone, other)) << "zone " << zone << " frame " << other;
            }
}
