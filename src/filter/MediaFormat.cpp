#include "filter/MediaFormat.h"

#include <cstring>

namespace ulvetta {

namespace {

constexpr size_t kExtraSizeOffset = 16;
constexpr size_t kSubFormatOffset = 24;
// The extension's size that covers valid bits, channel mask and sub-format.
constexpr uint16_t kExtensibleExtraSize = 22;

// The PCM and IEEE float sub-format GUIDs ({0000000N-0000-0010-8000-00aa00389b71}) in the in-memory
// GUID layout; they differ only in the first byte.
constexpr uint8_t kSubFormatPcm[16] = {0x01, 0x00, 0x00, 0x00, 0x00, 0x00, 0x10, 0x00,
                                       0x80, 0x00, 0x00, 0xaa, 0x00, 0x38, 0x9b, 0x71};
constexpr uint8_t kSubFormatFloat[16] = {0x03, 0x00, 0x00, 0x00, 0x00, 0x00, 0x10, 0x00,
                                         0x80, 0x00, 0x00, 0xaa, 0x00, 0x38, 0x9b, 0x71};

uint16_t le16(const uint8_t* p) { return static_cast<uint16_t>(p[0] | (p[1] << 8)); }

uint32_t le32(const uint8_t* p) {
    return static_cast<uint32_t>(p[0]) | (static_cast<uint32_t>(p[1]) << 8) | (static_cast<uint32_t>(p[2]) << 16) |
           (static_cast<uint32_t>(p[3]) << 24);
}

void put16(uint8_t* p, uint16_t v) {
    p[0] = static_cast<uint8_t>(v);
    p[1] = static_cast<uint8_t>(v >> 8);
}

void put32(uint8_t* p, uint32_t v) {
    put16(p, static_cast<uint16_t>(v));
    put16(p + 2, static_cast<uint16_t>(v >> 16));
}

}  // namespace

bool MediaFormat::wave(WaveFormat* out) const {
    if (block == nullptr || size < kWaveFormatMinSize) return false;
    out->formatTag = le16(block);
    out->channels = le16(block + 2);
    out->samplesPerSec = le32(block + 4);
    out->avgBytesPerSec = le32(block + 8);
    out->blockAlign = le16(block + 12);
    out->bitsPerSample = le16(block + 14);
    out->extraSize = size >= kExtraSizeOffset + 2 ? le16(block + kExtraSizeOffset) : 0;
    return true;
}

uint16_t MediaFormat::effectiveTag() const {
    WaveFormat f;
    if (!wave(&f)) return 0;
    if (f.formatTag != kWaveFormatExtensible) return f.formatTag;
    if (size < kWaveFormatExtensibleSize || f.extraSize < kExtensibleExtraSize) return 0;
    const uint8_t* sub = block + kSubFormatOffset;
    if (std::memcmp(sub, kSubFormatPcm, sizeof kSubFormatPcm) == 0) return kWaveFormatPcm;
    if (std::memcmp(sub, kSubFormatFloat, sizeof kSubFormatFloat) == 0) return kWaveFormatFloat;
    return 0;
}

bool MediaFormat::acceptableInput() const {
    WaveFormat f;
    if (!audio || temporalCompression || !wave(&f) || f.channels != 2) return false;
    if (f.samplesPerSec == 0 || f.samplesPerSec > kMaxFormatRate) return false;
    const uint16_t tag = effectiveTag();
    return (tag == kWaveFormatPcm && f.bitsPerSample == 16) || (tag == kWaveFormatFloat && f.bitsPerSample == 32);
}

bool MediaFormat::transformsTo(const MediaFormat& out) const {
    WaveFormat fi, fo;
    if (!audio || !out.audio || temporalCompression || out.temporalCompression || !wave(&fi) || !out.wave(&fo))
        return false;
    // Equal tags as written (our own offered copy keeps an extensible tag), or the same sample format.
    const uint16_t tagIn = effectiveTag();
    const bool sameTag = fi.formatTag == fo.formatTag || (tagIn != 0 && tagIn == out.effectiveTag());
    return sameTag && fi.bitsPerSample == fo.bitsPerSample && fi.samplesPerSec == fo.samplesPerSec &&
           fo.channels == 2;
}

WaveFormat MediaFormat::normalised() const {
    WaveFormat f;
    if (!wave(&f)) return WaveFormat{};
    f.formatTag = effectiveTag();
    f.blockAlign = static_cast<uint16_t>(f.bitsPerSample / 8 * f.channels);
    f.avgBytesPerSec = f.samplesPerSec * f.blockAlign;
    f.extraSize = 0;
    return f;
}

void makeStereoBlock(uint8_t* block, size_t size) {
    if (block == nullptr || size < kWaveFormatMinSize) return;
    // A 17-byte block holds only the low byte of the extension's size.
    for (size_t i = kExtraSizeOffset; i < size && i < kExtraSizeOffset + 2; ++i) block[i] = 0;
    const uint16_t bits = le16(block + 14);
    const uint16_t align = static_cast<uint16_t>(bits / 8 * 2);
    put16(block + 2, 2);
    put16(block + 12, align);
    put32(block + 8, le32(block + 4) * align);
}

}  // namespace ulvetta
