// MediaFormat: a pin's media type as the format checks see it (major type audio or not, temporal
// compression, and the wave format block as plain little-endian bytes), with the checks that decide
// which formats the filter takes and the normalised copies it keeps and offers. Portable, so that the
// checks run on every platform; the DirectShow pins fill it from their media types.
//
// Block layout: tag (2), channels (2), sample rate (4), byte rate (4), block align (2), bits (2), then an
// 18-byte block adds the extension's size (2); the extensible form (40 bytes) adds valid bits (2), the
// channel mask (4) and the sub-format GUID (16) at offset 24.
#pragma once

#include <cstddef>
#include <cstdint>

namespace ulvetta {

constexpr uint16_t kWaveFormatPcm = 1;
constexpr uint16_t kWaveFormatFloat = 3;
constexpr uint16_t kWaveFormatExtensible = 0xFFFE;
// The shortest block that is a wave format, and the size of the extensible form.
constexpr size_t kWaveFormatMinSize = 16;
constexpr size_t kWaveFormatExtensibleSize = 40;
// Sample rates outside 1..kMaxFormatRate Hz are refused: the engine sizes lines and tables from the rate.
constexpr uint32_t kMaxFormatRate = 768000;

// The fields of a wave format block.
struct WaveFormat {
    uint16_t formatTag = 0;
    uint16_t channels = 0;
    uint32_t samplesPerSec = 0;
    uint32_t avgBytesPerSec = 0;
    uint16_t blockAlign = 0;
    uint16_t bitsPerSample = 0;
    uint16_t extraSize = 0;  // 0 when the block is shorter than 18 bytes
};

struct MediaFormat {
    bool audio = false;
    bool temporalCompression = false;
    const uint8_t* block = nullptr;  // not owned
    size_t size = 0;                 // bytes of block

    // The block's fields; false (and out untouched) when it is absent or shorter than 16 bytes.
    bool wave(WaveFormat* out) const;
    // The sample format: PCM or float for a plain or extensible stereo PCM/float block, otherwise the raw
    // tag; 0 for an absent block or an extensible one that is too short or names another sub-format.
    uint16_t effectiveTag() const;
    // True for stereo 16-bit PCM or 32-bit float audio at 1..kMaxFormatRate Hz, not compressed.
    bool acceptableInput() const;
    // True when this input can become out: both audio, neither compressed, equal tags as written (or the
    // same sample format), equal bits and rate, and a stereo output.
    bool transformsTo(const MediaFormat& out) const;
    // What a pin keeps of the format: the effective tag, channels, rate and bits, with the block align and
    // byte rate recomputed from them and no extension. A block that is not a wave format gives all zeros.
    WaveFormat normalised() const;
};

// Rewrites a copy of the input's format block in place as the stereo type offered downstream: the
// extension's size set to 0 as far as the block holds it, two channels, block align and byte rate
// recomputed. Blocks shorter than 16 bytes are left alone.
void makeStereoBlock(uint8_t* block, size_t size);

}  // namespace ulvetta
