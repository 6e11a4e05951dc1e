#!/usr/bin/python3
"""Draws every bitmap of the editor and writes them as BMP files with the resource script that lists them.

Run with Debian's Python (python3-pil): make-artwork.py OUT_DIR. The output is deterministic: the same fonts
and Pillow give the same bytes, so the committed files in artwork/ can be checked by running this again.
The look is one piece of rack hardware: dark anodised panels, light engraved lettering, amber accents.
"""
import math
import os
import struct
import sys

from PIL import Image, ImageDraw, ImageFilter, ImageFont

PRODUCT = "Morvane Ulvetta"

FONT_DIR = "/usr/share/fonts/truetype/dejavu"
SANS = "DejaVuSans.ttf"
SANS_BOLD = "DejaVuSans-Bold.ttf"
COND_BOLD = "DejaVuSansCondensed-Bold.ttf"

# Palette of the whole device (R, G, B).
PANEL = (44, 47, 52)
PANEL_DARK = (24, 26, 29)
PANEL_EDGE_HI = (92, 97, 104)
PANEL_EDGE_LO = (12, 13, 15)
INK = (228, 230, 233)
INK_DIM = (120, 125, 132)
AMBER = (255, 170, 52)
AMBER_DIM = (96, 66, 28)
WINDOW = (12, 14, 16)
IVORY = (238, 230, 208)
SCALE_INK = (30, 30, 32)
SCALE_RED = (196, 36, 28)

# The needle: pivot (60, 86) in meter-face pixels (147, 123 on the page, face drawn at 87, 37); rest angle
# alpha (radians, the single-precision constant); getStatus(0) scales the linear peak level by METER_GAIN and
# caps it at 1, so every level from -6.99 dBFS up pins the needle at alpha.
NEEDLE_PIVOT = (60, 86)
NEEDLE_ALPHA = math.pi * 0.3055555522441864
METER_GAIN = 2.235730360023138
SCALE_MARKS = [None, -25, -15, -9, -6, -3, 0, 6]  # None is minus infinity
MINOR_MARKS = [-30, -20, -12, -10, -8]

# Glyph strips: 77 characters in strip order (the comma before the plus sign) and their cell widths (pixels).
CHARSET = " !\"&'()*,+-./0123456789:?ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz"
SMALL_WIDTHS = [4, 1, 3, 6, 2, 3, 3, 4, 2, 6, 3, 2, 3,
                6, 4, 5, 6, 5, 5, 5, 5, 5, 6, 2, 5,
                7, 6, 7, 7, 6, 5, 8, 7, 2, 5, 6, 5, 8, 6, 8, 6, 7, 6, 7, 6, 6, 6, 9, 6, 6, 6,
                5, 5, 5, 5, 5, 3, 5, 6, 1, 3, 5, 2, 7, 5, 5, 6, 5, 3, 4, 4, 4, 4, 7, 5, 5, 4]
LARGE_WIDTHS = [6, 3, 4, 7, 3, 3, 4, 4, 3, 7, 4, 2, 3,
                7, 5, 7, 6, 6, 6, 6, 6, 6, 6, 3, 6,
                8, 7, 8, 9, 7, 7, 9, 7, 3, 6, 7, 7, 9, 7, 9, 7, 9, 8, 7, 7, 8, 7, 10, 7, 8, 7,
                6, 6, 6, 6, 6, 3, 6, 6, 2, 3, 5, 3, 9, 6, 6, 6, 6, 4, 6, 3, 6, 5, 8, 6, 5, 5]


def font(name, size):
    return ImageFont.truetype(os.path.join(FONT_DIR, name), size)


def needle_angle(db):
    """Needle angle (radians, counter-clockwise from +x) for a peak level in dBFS; None is minus infinity."""
    v = 0.0 if db is None else min(1.0, 10.0 ** (db / 20.0) * METER_GAIN)
    return (math.pi - 2.0 * NEEDLE_ALPHA) * (1.0 - v) + NEEDLE_ALPHA


def polar(angle, radius, scale=1):
    return ((NEEDLE_PIVOT[0] + math.cos(angle) * radius) * scale,
            (NEEDLE_PIVOT[1] - math.sin(angle) * radius) * scale)


# ---- small drawing helpers -------------------------------------------------------------------------------

def lerp(a, b, t):
    return tuple(int(round(x + (y - x) * t)) for x, y in zip(a, b))


def vertical_gradient(w, h, top, bottom):
    img = Image.new("RGB", (w, h))
    px = img.load()
    for y in range(h):
        c = lerp(top, bottom, y / max(1, h - 1))
        for x in range(w):
            px[x, y] = c
    return img


def brushed(w, h, base, depth, seed):
    """Horizontal brushed-metal grain: per-row brightness from a fixed integer hash, no free randomness."""
    img = Image.new("RGB", (w, h))
    px = img.load()
    state = seed
    row_level = []
    for _ in range(h):
        state = (state * 1103515245 + 12345) & 0x7FFFFFFF
        row_level.append((state >> 16) % (2 * depth + 1) - depth)
    for y in range(h):
        for x in range(w):
            state = (state * 1103515245 + 12345) & 0x7FFFFFFF
            fine = ((state >> 16) & 3) - 1
            d = row_level[y] + fine
            px[x, y] = tuple(max(0, min(255, c + d)) for c in base)
    return img


def bevel(img, hi=PANEL_EDGE_HI, lo=PANEL_EDGE_LO, box=None):
    d = ImageDraw.Draw(img)
    x0, y0, x1, y1 = box or (0, 0, img.width - 1, img.height - 1)
    d.line([(x0, y1), (x0, y0), (x1, y0)], fill=hi)
    d.line([(x1, y0 + 1), (x1, y1), (x0 + 1, y1)], fill=lo)


def spaced_width(text, fnt, spacing):
    return sum(fnt.getlength(c) for c in text) + spacing * (len(text) - 1)


def draw_spaced(draw, xy, text, fnt, fill, spacing):
    """Draws text with extra letter spacing (pixels), each character on a whole-pixel position."""
    x, y = xy
    for c in text:
        draw.text((round(x), y), c, font=fnt, fill=fill)
        x += fnt.getlength(c) + spacing


def centred_text(img, text, fnt, fill, spacing=1, dy=0):
    d = ImageDraw.Draw(img)
    w = spaced_width(text, fnt, spacing)
    top, bottom = fnt.getbbox("HQ")[1], fnt.getbbox("HQ")[3]
    x = (img.width - w) / 2
    y = (img.height - (bottom - top)) // 2 - top + dy
    draw_spaced(d, (x, y), text, fnt, fill, spacing)


# ---- panel pieces -------------------------------------------------------------------------------------------

def nameplate(w, h, text, size=8, spacing=1):
    img = vertical_gradient(w, h, (58, 62, 68), PANEL)
    bevel(img)
    centred_text(img, text, font(COND_BOLD, size), INK, spacing)
    return img


def vertical_label(text):
    # Reads bottom to top beside its fader.
    return nameplate(119, 14, text).transpose(Image.Transpose.ROTATE_90)


def groove(length, vertical):
    img = Image.new("RGB", (length, 3))
    d = ImageDraw.Draw(img)
    d.line([(0, 0), (length - 1, 0)], fill=PANEL_EDGE_LO)
    d.line([(0, 1), (length - 1, 1)], fill=(4, 4, 5))
    d.line([(0, 2), (length - 1, 2)], fill=PANEL_EDGE_HI)
    return img.transpose(Image.Transpose.ROTATE_90).transpose(Image.Transpose.FLIP_TOP_BOTTOM) if vertical else img


def display_frame():
    img = Image.new("RGB", (38, 17), WINDOW)
    d = ImageDraw.Draw(img)
    d.rectangle([0, 0, 37, 16], outline=PANEL_EDGE_LO)
    bevel(img, lo=PANEL_EDGE_HI, hi=PANEL_EDGE_LO)
    d.rectangle([1, 1, 36, 15], outline=(30, 33, 37))
    return img


def rounded_mask(w, h, radius, inset=0.0):
    s = 4
    m = Image.new("L", (w * s, h * s), 0)
    ImageDraw.Draw(m).rounded_rectangle([inset * s, inset * s, (w - inset) * s - 1, (h - inset) * s - 1],
                                        radius=radius * s, fill=255)
    return m.resize((w, h), Image.Resampling.BOX)


def thumb_vertical():
    """Cap of a vertical fader, 22 x 15: brushed aluminium with grip ridges and an amber index line."""
    img = vertical_gradient(22, 15, (205, 208, 212), (120, 124, 130))
    d = ImageDraw.Draw(img)
    for y in (3, 5, 9, 11):
        d.line([(3, y), (18, y)], fill=(150, 154, 160))
        d.line([(3, y + 1), (18, y + 1)], fill=(222, 224, 228))
    d.line([(2, 7), (19, 7)], fill=AMBER)
    d.rounded_rectangle([0, 0, 21, 14], radius=3, outline=(70, 73, 78))
    return img


def thumb_horizontal():
    return thumb_vertical().transpose(Image.Transpose.ROTATE_90)


def page_button(digit, lit):
    img = vertical_gradient(13, 12, (70, 74, 80) if not lit else (120, 84, 30), PANEL_DARK if not lit else (70, 44, 12))
    bevel(img)
    fnt = font(COND_BOLD, 9)
    centred_text(img, digit, fnt, AMBER if lit else INK_DIM, 0)
    return img


def algorithm_box():
    img = Image.new("RGB", (119, 14), WINDOW)
    d = ImageDraw.Draw(img)
    bevel(img, hi=PANEL_EDGE_LO, lo=PANEL_EDGE_HI)
    d.rectangle([104, 1, 117, 12], fill=(40, 43, 48))
    d.line([(103, 1), (103, 12)], fill=PANEL_EDGE_LO)
    s = 4
    arrow = Image.new("L", (14 * s, 12 * s), 0)
    ImageDraw.Draw(arrow).polygon([(3 * s, 4 * s), (11 * s, 4 * s), (7 * s, 9 * s)], fill=255)
    arrow = arrow.resize((14, 12), Image.Resampling.BOX)
    img.paste(Image.new("RGB", (14, 12), AMBER), (104, 1), arrow)
    return img


def load_bar_trough():
    img = Image.new("RGB", (119, 4), (64, 67, 72))
    d = ImageDraw.Draw(img)
    d.line([(0, 0), (118, 0)], fill=PANEL_EDGE_LO)
    d.line([(0, 3), (118, 3)], fill=PANEL_EDGE_HI)
    return img


def source_strip():
    """Three 108 x 15 frames side by side; frame k lights zone k (IN, OUT, VERB, 36 pixels each)."""
    img = Image.new("RGB", (324, 15))
    fnt = font(COND_BOLD, 9)
    for frame in range(3):
        for zone, name in enumerate(("IN", "OUT", "VERB")):
            lit = zone == frame
            top, bottom = ((122, 86, 32), (64, 40, 10)) if lit else ((62, 66, 72), PANEL_DARK)
            cell = vertical_gradient(36, 15, top, bottom)
            bevel(cell)
            if lit:
                ImageDraw.Draw(cell).line([(4, 12), (31, 12)], fill=AMBER)
            centred_text(cell, name, fnt, AMBER if lit else INK_DIM, 1, dy=-1)
            img.paste(cell, (frame * 108 + zone * 36, 0))
    return img


def return_button():
    img = Image.new("RGB", (100, 20))
    fnt = font(COND_BOLD, 9)
    for frame, pressed in enumerate((False, True)):
        top, bottom = ((84, 89, 96), (36, 39, 44)) if not pressed else ((30, 32, 36), (60, 64, 70))
        cell = vertical_gradient(50, 20, top, bottom)
        centred_text(cell, "RETURN", fnt, AMBER if pressed else INK, 1, dy=1 if pressed else 0)
        img.paste(cell, (frame * 50, 0))
    d = ImageDraw.Draw(img)
    for x0 in (0, 50):
        d.rounded_rectangle([x0, 0, x0 + 49, 19], radius=4, outline=(12, 13, 15))
    return img


def return_button_mask():
    m = Image.new("L", (100, 20))
    one = rounded_mask(50, 20, 4)
    m.paste(one, (0, 0))
    m.paste(one, (50, 0))
    return m


def logo_shape():
    """The logo's coverage (131 x 26) and its colour picture: a ripple mark and the name in two weights."""
    s = 4
    cover = Image.new("L", (131 * s, 26 * s), 0)
    colour = Image.new("RGB", (131 * s, 26 * s), INK)
    dc, dk = ImageDraw.Draw(cover), ImageDraw.Draw(colour)
    cx, cy = 12 * s, 13 * s
    for r, wdt in ((3, 3), (7, 2), (10.5, 2)):
        box = [cx - r * s, cy - r * s, cx + r * s, cy + r * s]
        if r == 3:
            dc.ellipse(box, fill=255)
        else:
            dc.arc(box, -60, 60, fill=255, width=wdt * s)
    dk.rectangle([0, 0, 24 * s, 26 * s], fill=AMBER)
    dc.text((27 * s, 1 * s), "ULVETTA", font=font(SANS_BOLD, 15 * s), fill=255)
    lettering = font(COND_BOLD, 7 * s)
    x = 28 * s
    for c in "MORVANE":
        dc.text((x, 18 * s), c, font=lettering, fill=255)
        x += lettering.getlength(c) + 2 * s
    return (cover.resize((131, 26), Image.Resampling.BOX), colour.resize((131, 26), Image.Resampling.BOX))


def meter_face():
    """The level meter, 118 x 103: ivory scale window whose marks sit where the needle points for each level."""
    w, h, s = 118, 103, 4
    big = Image.new("RGB", (w * s, h * s), PANEL_DARK)
    d = ImageDraw.Draw(big)
    d.rounded_rectangle([2 * s, 2 * s, (w - 2) * s - 1, 62 * s - 1], radius=4 * s, fill=IVORY)
    # The red zone: from -8 dB to the end stop, a band just outside the scale arc.
    px, py = NEEDLE_PIVOT[0] * s, NEEDLE_PIVOT[1] * s
    r0, r1 = 57 * s, 61 * s
    red_from, red_to = math.degrees(needle_angle(-8)), math.degrees(needle_angle(6))
    d.arc([px - r1, py - r1, px + r1, py + r1], -red_from, -red_to + 1, fill=SCALE_RED, width=r1 - r0)
    # Scale arc and ticks.
    lo, hi = math.degrees(needle_angle(None)), math.degrees(needle_angle(6))
    d.arc([px - r0, py - r0, px + r0, py + r0], -lo, -hi, fill=SCALE_INK, width=s)
    for db in MINOR_MARKS:
        a = needle_angle(db)
        d.line([polar(a, 57, s), polar(a, 62, s)], fill=SCALE_INK, width=s)
    for db in SCALE_MARKS:
        a = needle_angle(db)
        red = db is not None and needle_angle(db) <= needle_angle(-8)
        d.line([polar(a, 55, s), polar(a, 66, s)], fill=SCALE_RED if red else SCALE_INK, width=int(1.5 * s))
    img = big.resize((w, h), Image.Resampling.BOX)
    # Numbers at whole pixels; marks that land on the same angle share one stacked label.
    d = ImageDraw.Draw(img)
    fnt = font(COND_BOLD, 8)
    groups = {}
    for db in SCALE_MARKS:
        groups.setdefault(round(math.degrees(needle_angle(db)), 1), []).append(db)
    for deg, marks in groups.items():
        texts = ["-\u221e" if m is None else ("+%d" % m if m > 0 else "%d" % m) for m in marks]
        texts = [t.replace("-\u221e", "\u2212\u221e") for t in texts]
        red = len(marks) > 1 or (marks[0] is not None and marks[0] >= -6)
        a = math.radians(deg)
        if len(marks) == 1:
            fnt_mark = font(SANS_BOLD, 10) if marks[0] is None else fnt
            x, y = polar(a, 74 if marks[0] is None else 73)
            tw = fnt_mark.getlength(texts[0])
            d.text((round(x - tw / 2), round(y - 6)), texts[0], font=fnt_mark, fill=SCALE_RED if red else SCALE_INK)
        else:
            # The end stop: every level from -7 dBFS up reads here, listed top down.
            for i, t in enumerate(reversed(texts)):
                tw = fnt.getlength(t)
                d.text((round(112 - tw), 4 + i * 7), t, font=fnt, fill=SCALE_RED)
    d.text((12, 44), "dBFS", font=font(COND_BOLD, 8), fill=SCALE_INK)
    # The needle's pivot housing, below the part of the face where the needle shows.
    px, py = NEEDLE_PIVOT
    d.pieslice([px - 14, py - 14, px + 14, py + 14], 180, 360, fill=(58, 62, 68), outline=(90, 95, 102))
    d.ellipse([px - 3, py - 3, px + 3, py + 3], fill=(20, 21, 23))
    small = font(COND_BOLD, 7)
    tw = spaced_width("PEAK LEVEL", small, 1)
    draw_spaced(d, (round((w - tw) / 2), 90), "PEAK LEVEL", small, INK_DIM, 1)
    d.line([(2, 61), (w - 3, 61)], fill=(150, 140, 118))
    d.rounded_rectangle([0, 0, w - 1, h - 1], radius=5, outline=PANEL_EDGE_LO)
    d.line([(2, 62), (w - 3, 62)], fill=PANEL_EDGE_LO)
    bevel(img, box=(1, 1, w - 2, h - 2), hi=(70, 74, 80), lo=(8, 9, 10))
    return img


def about_background():
    w, h = 750, 167
    img = brushed(w, h, (46, 49, 54), 5, 0x5EED)
    img = Image.blend(img, vertical_gradient(w, h, (60, 64, 70), (26, 28, 32)), 0.45)
    d = ImageDraw.Draw(img)
    # Ripples spreading from a point: the reflections of a room.
    ripples = Image.new("L", (w, h), 0)
    dr = ImageDraw.Draw(ripples)
    for k in range(1, 14):
        r = 9 * k + k * k
        dr.arc([60 - r, 84 - r, 60 + r, 84 + r], -75, 75, fill=max(20, 150 - 10 * k), width=2)
    dr.ellipse([54, 78, 66, 90], fill=220)
    ripples = ripples.filter(ImageFilter.GaussianBlur(0.6))
    img.paste(Image.new("RGB", (w, h), AMBER), (0, 0), ripples.point(lambda g: g * 3 // 5))
    # Name and line.
    big = font(SANS_BOLD, 30)
    d.text((112, 50), "ULVETTA", font=big, fill=INK)
    draw_spaced(d, (114, 36), "MORVANE", font(COND_BOLD, 11), AMBER, 3)
    draw_spaced(d, (114, 90), "STEREO DIGITAL REVERBERATION", font(COND_BOLD, 9), INK_DIM, 2)
    d.line([(114, 105), (372, 105)], fill=AMBER_DIM)
    # The credit window: a smooth recessed panel, no texture, so fading text reads well on it.
    win = vertical_gradient(346, 98, (30, 32, 36), (20, 22, 25))
    img.paste(win, (402, 19))
    bevel(img, hi=PANEL_EDGE_LO, lo=PANEL_EDGE_HI, box=(401, 18, 748, 117))
    # Rack ears with screws.
    for x in (8, 741):
        for y in (12, 154):
            d.ellipse([x - 4, y - 4, x + 4, y + 4], fill=(90, 94, 100), outline=PANEL_EDGE_LO)
            d.line([(x - 2, y), (x + 2, y)], fill=(30, 32, 36))
    # The link area (570, 152, 180 x 15) stays plain: the page writes what the link opens there.
    bevel(img, hi=(80, 84, 90), lo=(10, 11, 12))
    return img


# ---- glyph strips ---------------------------------------------------------------------------------------------

def ink_columns(widths):
    """Columns [left, right) of each cell that may hold ink, so that between two inked cells there is always
    one blank column; a 1-pixel glyph fills its cell, and its neighbours keep clear of it."""
    spans = []
    for k, w in enumerate(widths):
        left = 1 if w > 1 else 0
        nxt = widths[k + 1] if k + 1 < len(widths) else 2
        right = w - 1 if (nxt == 1 and w > 2) else w
        spans.append((left, right))
    return spans


def glyph_strip(widths, height, size, baseline, face):
    """White-on-black strip: each character rendered from the font at 4x, fitted into its cell's ink columns
    (narrowed when wider), box-filtered down, so grey levels are the glyph's coverage."""
    s = 4
    fnt = font(face, round(size * s))
    strip = Image.new("L", (sum(widths), height), 0)
    x0 = 0
    for ch, w, (left, right) in zip(CHARSET, widths, ink_columns(widths)):
        if ch != " ":
            box = fnt.getbbox(ch, anchor="ls")
            gw = box[2] - box[0]
            big = Image.new("L", (gw, height * s), 0)
            ImageDraw.Draw(big).text((-box[0], baseline * s), ch, font=fnt, fill=255, anchor="ls")
            room = (right - left) * s
            target = min(gw, room)
            # Whole-pixel ink widths keep stems crisp.
            target = max(s, (target + s // 2) // s * s)
            target = min(target, room)
            if target != gw:
                big = big.resize((target, height * s), Image.Resampling.LANCZOS)
            cell = Image.new("L", (w * s, height * s), 0)
            offset = left * s + ((room - target) // 2) // s * s
            cell.paste(big, (offset, 0))
            strip.paste(cell.resize((w, height), Image.Resampling.BOX), (x0, 0))
        x0 += w
    return strip


# ---- the resource table -------------------------------------------------------------------------------------

def resources():
    logo_cover, logo_colour = logo_shape()
    grey = "L"
    rgb = "RGB"
    table = [
        # id, file name, width, height, bits per pixel (8: grey with a grey palette; 24: colour), picture
        (175, "font-large", 457, 11, 8, glyph_strip(LARGE_WIDTHS, 11, 10, 9, SANS)),
        (178, "return-button", 100, 20, 24, return_button()),
        (179, "return-button-mask", 100, 20, 8, return_button_mask()),
        (186, "thumb-vertical", 22, 15, 24, thumb_vertical()),
        (187, "thumb-horizontal", 15, 22, 24, thumb_horizontal()),
        (188, "thumb-vertical-mask", 22, 15, 8, rounded_mask(22, 15, 3)),
        (189, "thumb-horizontal-mask", 15, 22, 8, rounded_mask(15, 22, 3)),
        (193, "font-small", 383, 9, 8, glyph_strip(SMALL_WIDTHS, 9, 8.5, 7, SANS)),
        (196, "about-background", 750, 167, 24, about_background()),
        (202, "groove-vertical", 3, 112, 24, groove(112, True)),
        (203, "groove-horizontal", 112, 3, 24, groove(112, False)),
        (204, "display-frame", 38, 17, 24, display_frame()),
        (205, "meter-face", 118, 103, 24, meter_face()),
        (206, "label-wet", 34, 13, 24, nameplate(34, 13, "WET")),
        (207, "label-damping", 14, 119, 24, vertical_label("DAMPING")),
        (208, "label-decay", 14, 119, 24, vertical_label("DECAY")),
        (209, "label-diffuse", 14, 119, 24, vertical_label("DIFFUSE")),
        (210, "label-dry", 34, 13, 24, nameplate(34, 13, "DRY")),
        (211, "label-reflections", 14, 119, 24, vertical_label("REFLECTIONS")),
        (212, "label-output-levels", 119, 14, 24, nameplate(119, 14, "OUTPUT LEVELS")),
        (213, "label-predelay", 14, 119, 24, vertical_label("PREDELAY")),
        (214, "label-room-size", 14, 119, 24, vertical_label("ROOM SIZE")),
        (215, "label-colour", 119, 14, 24, nameplate(119, 14, "COLOUR")),
        (216, "label-input", 14, 119, 24, vertical_label("INPUT")),
        (218, "page-button-2-lit", 13, 12, 24, page_button("2", True)),
        (219, "page-button-1-lit", 13, 12, 24, page_button("1", True)),
        (220, "page-button-2-dim", 13, 12, 24, page_button("2", False)),
        (221, "page-button-1-dim", 13, 12, 24, page_button("1", False)),
        (222, "algorithm-box", 119, 14, 24, algorithm_box()),
        (223, "label-high-cut", 14, 119, 24, vertical_label("HIGH CUT")),
        (224, "label-low-cut", 14, 119, 24, vertical_label("LOW CUT")),
        (225, "label-notch-freq", 14, 119, 24, vertical_label("NOTCH FREQ")),
        (226, "label-notch-gain", 14, 119, 24, vertical_label("NOTCH GAIN")),
        (227, "label-notch-q", 14, 119, 24, vertical_label("NOTCH Q")),
        (228, "meter-source", 324, 15, 24, source_strip()),
        (229, "load-bar", 119, 4, 24, load_bar_trough()),
        (230, "logo-mask", 131, 26, 8, logo_cover),
        (231, "logo", 131, 26, 24, logo_colour),
        (233, "label-page", 28, 12, 24, nameplate(28, 12, "PAGE", size=8, spacing=1)),
    ]
    for rid, _, w, h, bits, img in table:
        assert img.size == (w, h) and img.mode == (grey if bits == 8 else rgb), rid
    return table


def bmp_bytes(img):
    """BITMAPFILEHEADER + BITMAPINFOHEADER, bottom-up rows padded to 4 bytes; 8-bit grey with a 256-entry
    palette for "L" pictures, 24-bit BGR for colour ones."""
    w, h = img.size
    grey = img.mode == "L"
    bits = 8 if grey else 24
    stride = (w * bits // 8 + 3) & ~3
    palette = b"".join(bytes((g, g, g, 0)) for g in range(256)) if grey else b""
    raw = img.tobytes()
    rows = []
    for y in range(h - 1, -1, -1):
        if grey:
            row = raw[y * w:(y + 1) * w]
        else:
            rgb_row = raw[y * w * 3:(y + 1) * w * 3]
            row = bytes(b for i in range(0, len(rgb_row), 3) for b in (rgb_row[i + 2], rgb_row[i + 1], rgb_row[i]))
        rows.append(row + b"\0" * (stride - len(row)))
    pixels = b"".join(rows)
    offset = 14 + 40 + len(palette)
    info = struct.pack("<IiiHHIIiiII", 40, w, h, 1, bits, 0, len(pixels), 0, 0, 256 if grey else 0, 0)
    return struct.pack("<2sIHHI", b"BM", offset + len(pixels), 0, 0, offset) + info + palette + pixels


def main(out_dir):
    os.makedirs(out_dir, exist_ok=True)
    lines = ["// Bitmap resources of the editor, written by make-artwork.py.", ""]
    for rid, name, _, _, _, img in resources():
        fname = "%d-%s.bmp" % (rid, name)
        with open(os.path.join(out_dir, fname), "wb") as f:
            f.write(bmp_bytes(img))
        lines.append('%d BITMAP "%s"' % (rid, fname))
    with open(os.path.join(out_dir, "Artwork.rc"), "w") as f:
        f.write("\n".join(lines) + "\n")


if __name__ == "__main__":
    if len(sys.argv) != 2:
        sys.exit("usage: make-artwork.py OUT_DIR")
    main(sys.argv[1])
