// Runs the pin format checks on arbitrary media types: a flags byte (audio and temporal compression of
// the input and the output type), the input block's length and bytes, then the output block. Each block
// lies in an allocation of exactly its length, so a read or write past it is caught. An accepted input
// must be a stereo 16-bit or float format at a usable rate; the stereo copy offered downstream must be
// accepted by the transform check and differ from the input only in the fields it rewrites.
#include <algorithm>
#include <cstring>
#include <memory>

#include "FuzzBytes.h"
#include "filter/MediaFormat.h"

using namespace ulvetta;

namespace {

// A block in a heap allocation of exactly its size (none at all for size 0).
struct Block {
    explicit Block(const std::string& bytes)
        : data(bytes.empty() ? nullptr : new uint8_t[bytes.size()]), size(bytes.size()) {
        std::copy(bytes.begin(), bytes.end(), data.get());
    }
    std::unique_ptr<uint8_t[]> data;
    size_t size;
};

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    fuzz::FuzzBytes input(data, size);
    const uint8_t flags = input.take<uint8_t>();
    const std::string inBytes = input.bytes(input.take<uint16_t>());
    Block inBlock(inBytes), outBlock(input.rest()), offered(inBytes);
    const MediaFormat in{(flags & 1) != 0, (flags & 2) != 0, inBlock.data.get(), inBlock.size};
    const MediaFormat out{(flags & 4) != 0, (flags & 8) != 0, outBlock.data.get(), outBlock.size};

    WaveFormat f, g;
    const bool accepted = in.acceptableInput();
    if (accepted) {
        FUZZ_CHECK(in.wave(&f) && f.channels == 2 && f.samplesPerSec >= 1 && f.samplesPerSec <= kMaxFormatRate);
        const WaveFormat n = in.normalised();
        FUZZ_CHECK((n.bitsPerSample == 16 && n.blockAlign == 4) || (n.bitsPerSample == 32 && n.blockAlign == 8));
        FUZZ_CHECK(n.avgBytesPerSec == n.samplesPerSec * n.blockAlign);
    }
    if (in.transformsTo(out))
        FUZZ_CHECK(in.wave(&f) && out.wave(&g) && g.channels == 2 && f.samplesPerSec == g.samplesPerSec &&
                   f.bitsPerSample == g.bitsPerSample);

    makeStereoBlock(offered.data.get(), offered.size);
    if (inBytes.size() < kWaveFormatMinSize) {
        FUZZ_CHECK(inBytes.empty() || std::memcmp(inBytes.data(), offered.data.get(), inBytes.size()) == 0);
        return 0;
    }
    // Only channels (2..3), byte rate (8..11), block align (12..13) and the extension size (16..17) change.
    for (size_t i = 0; i < inBytes.size(); ++i)
        if (i < 2 || (i >= 4 && i < 8) || i == 14 || i == 15 || i >= 18)
            FUZZ_CHECK(static_cast<uint8_t>(inBytes[i]) == offered.data[i]);
    const MediaFormat copy{in.audio, in.temporalCompression, offered.data.get(), offered.size};
    FUZZ_CHECK(copy.wave(&g) && g.channels == 2 && g.extraSize == 0);
    if (accepted) FUZZ_CHECK(in.transformsTo(copy) && copy.normalised().blockAlign == in.normalised().blockAlign);
    return 0;
}
