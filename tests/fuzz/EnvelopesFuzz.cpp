// Plays arbitrary automation envelopes through a core, as the filter does with a host's media-parameter
// calls. The input picks a stream rate, then runs operations: add segments (any times in 100 ns units, any
// values and curve bits) to one or all sound parameters, flush a time range, or process a block at any
// time position in chunks no larger than an output buffer of any size. Every chunk must be 1 frame or
// more and fit what is left of the block and the buffer, every value must stay in its range, and the
// output must stay finite.
#include <algorithm>
#include <cmath>
#include <vector>

#include "FuzzBytes.h"
#include "filter/Automation.h"
#include "filter/ReverbCore.h"

using namespace ulvetta;

namespace {

constexpr uint32_t kRates[] = {8000, 44100, 48000, 96000, 768000};
constexpr int kRateCount = sizeof kRates / sizeof kRates[0];
constexpr uint32_t kAllParams = 0xFFFFFFFFu;  // the host's index for every parameter
constexpr int kMaxFrames = 1024;

// One core per rate, kept from run to run so that a rate's networks are built once.
ReverbCore& coreAt(int rateIndex) {
    static ReverbCore* cores[kRateCount] = {};
    if (cores[rateIndex] == nullptr) {
        cores[rateIndex] = new ReverbCore;
        cores[rateIndex]->setFormat(static_cast<float>(kRates[rateIndex]), 0, 2, 2);
        cores[rateIndex]->startStreaming();
    }
    return *cores[rateIndex];
}

// The parameters an index addresses: one sound parameter, all of them, or none for another index.
bool targets(uint32_t index, int32_t* first, int32_t* last) {
    if (index == kAllParams) {
        *first = 0;
        *last = kSoundParamCount - 1;
        return true;
    }
    *first = *last = static_cast<int32_t>(index);
    return index < static_cast<uint32_t>(kSoundParamCount);
}

uint32_t indexFrom(uint8_t b) { return b >= 0xF0 ? kAllParams : b % 20u; }

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    fuzz::FuzzBytes input(data, size);
    const int rateIndex = input.take<uint8_t>() % kRateCount;
    const uint32_t rate = kRates[rateIndex];
    ReverbCore& core = coreAt(rateIndex);
    CoreAutomationSink sink(core);
    Automation automation;
    automation.setSampleRate(rate);
    static std::vector<float> in(2 * kMaxFrames), out(2 * kMaxFrames);

    for (int op = 0; op < 32 && !input.empty(); ++op) {
        const uint8_t kind = input.take<uint8_t>() % 3;
        int32_t first, last;
        if (kind == 0) {
            const bool known = targets(indexFrom(input.take<uint8_t>()), &first, &last);
            std::vector<EnvelopeSegment> segments(input.take<uint8_t>() % 8);
            for (EnvelopeSegment& s : segments) {
                const int64_t start = input.take<int64_t>(), end = input.take<int64_t>();
                s = EnvelopeSegment{0, refTimeToSamples(start, rate), refTimeToSamples(end, rate),
                                    input.take<float>(), input.take<float>(), (input.take<uint8_t>() & 1) != 0};
            }
            if (known) automation.add(first, last, segments.data(), segments.size());
        } else if (kind == 1) {
            const bool known = targets(indexFrom(input.take<uint8_t>()), &first, &last);
            const int64_t start = input.take<int64_t>(), end = input.take<int64_t>();
            if (known) automation.remove(first, last, refTimeToSamples(start, rate), refTimeToSamples(end, rate));
        } else {
            const int64_t position = refTimeToSamples(input.take<int64_t>(), rate);
            const int frames = input.take<uint16_t>() % (kMaxFrames + 1);
            const int room = 1 + input.take<uint16_t>() % kMaxFrames;
            std::fill(in.begin(), in.begin() + 2 * frames, 0.25f);
            const bool active = automation.beginBlock(position, frames);
            for (int offset = 0; offset < frames;) {
                int length = std::min(frames - offset, room);
                if (active) {
                    const int chunk = automation.applyChunk(position + offset, frames - offset, length, sink);
                    FUZZ_CHECK(chunk >= 1 && chunk <= length);
                    length = chunk;
                }
                core.processStereo(in.data() + 2 * offset, in.data() + 2 * offset + 1, out.data() + 2 * offset,
                                   out.data() + 2 * offset + 1, length, 2, 0, 0, 0);
                offset += length;
            }
            FUZZ_CHECK(std::all_of(out.begin(), out.begin() + 2 * frames, [](float x) { return std::isfinite(x); }));
        }
    }
    for (int32_t id = 0; id < kParamCount; ++id) {
        const int32_t v = core.getValue(id);
        FUZZ_CHECK(v >= kParamTable[id].minimum && v <= kParamTable[id].maximum);
    }
    return 0;
}
