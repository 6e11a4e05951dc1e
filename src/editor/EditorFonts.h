#pragma once
// The character set shared by the editor's two bitmap fonts and the glyph width of each character, in strip
// order. The strips hold the glyphs side by side in this order, so the widths add up to the strip widths.
#include <array>

namespace ulvetta {

// 77 characters; the comma stands before the plus sign, as in the strips.
inline constexpr char kFontCharacterSet[] =
    " !\"&'()*,+-./0123456789:?ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz";
inline constexpr int kFontCharacterCount = sizeof(kFontCharacterSet) - 1;

// Resource ids and sizes of the two glyph strips, in pixels.
inline constexpr int kSmallFontResource = 193;
inline constexpr int kSmallFontWidth = 383;
inline constexpr int kSmallFontHeight = 9;
inline constexpr int kLargeFontResource = 175;
inline constexpr int kLargeFontWidth = 457;
inline constexpr int kLargeFontHeight = 11;

// Small font (control texts), pixels per glyph in set order.
inline constexpr std::array<int, kFontCharacterCount> kSmallFontWidths = {
    4, 1, 3, 6, 2, 3, 3, 4, 2, 6, 3, 2, 3,                                               // space .. slash
    6, 4, 5, 6, 5, 5, 5, 5, 5, 6,                                                        // 0-9
    2, 5,                                                                                // : ?
    7, 6, 7, 7, 6, 5, 8, 7, 2, 5, 6, 5, 8, 6, 8, 6, 7, 6, 7, 6, 6, 6, 9, 6, 6, 6,        // A-Z
    5, 5, 5, 5, 5, 3, 5, 6, 1, 3, 5, 2, 7, 5, 5, 6, 5, 3, 4, 4, 4, 4, 7, 5, 5, 4};       // a-z

// Large font (the about page), pixels per glyph in set order.
inline constexpr std::array<int, kFontCharacterCount> kLargeFontWidths = {
    6, 3, 4, 7, 3, 3, 4, 4, 3, 7, 4, 2, 3,                                               // space .. slash
    7, 5, 7, 6, 6, 6, 6, 6, 6, 6,                                                        // 0-9
    3, 6,                                                                                // : ?
    8, 7, 8, 9, 7, 7, 9, 7, 3, 6, 7, 7, 9, 7, 9, 7, 9, 8, 7, 7, 8, 7, 10, 7, 8, 7,       // A-Z
    6, 6, 6, 6, 6, 3, 6, 6, 2, 3, 5, 3, 9, 6, 6, 6, 6, 4, 6, 3, 6, 5, 8, 6, 5, 5};       // a-z

}  // namespace ulvetta
