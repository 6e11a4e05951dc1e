// Automation: parameter envelopes in sample time and their playback in 5 ms chunks, for any host that
// receives timed segments. The host converts its times to samples and holds one lock around every call.
//
// Allocation: add reserves room before it changes anything; prune, remove and the chunk walk never
// allocate, so playback on the audio thread allocates nothing.
#pragma once

#include <cstdint>
#include <vector>

#include "filter/ParamTable.h"

namespace ulvetta {

class ReverbCore;

// A reference time (100 ns units) as a sample position at rate: milliseconds first, truncating at each
// division. A time whose product would overflow gives the largest position any other time can give, with
// its sign, so every position stays within +-INT64_MAX / 1000 and a block's frames can be added to it.
inline int64_t refTimeToSamples(int64_t time, uint32_t rate) {
    const int64_t ms = time / 10000;
    const int64_t r = rate;
    if (r != 0 && (ms > INT64_MAX / r || ms < -(INT64_MAX / r))) return (ms > 0 ? INT64_MAX : -INT64_MAX) / 1000;
    return ms * r / 1000;
}

// One envelope segment in samples of the input stream.
struct EnvelopeSegment {
    int32_t paramId;
    int64_t startSample;  // 64-bit so that long streams at high rates cannot wrap
    int64_t endSample;
    float startValue;  // position 0..1, or the integer value for parameters automated by value
    float endValue;
    bool jump;  // bit 0 of the segment's curve type; stored, not used by the playback
};

// What the chunk walk drives: sets a parameter from an automation value and redraws it in the editor.
class AutomationSink {
public:
    virtual ~AutomationSink() = default;
    virtual void apply(int32_t id, float value) = 0;
    virtual void refresh(int32_t id) = 0;
};

// Sets a core's sound parameters from automation values: by integer value for switch and list
// parameters, by position for the others. The kind is read from the constant parameter table, so applying
// a value copies no description.
class CoreAutomationSink : public AutomationSink {
public:
    explicit CoreAutomationSink(ReverbCore& core);
    void apply(int32_t id, float value) override;
    void refresh(int32_t id) override;
    // The value a host sees: the integer value for parameters set by value, else the position.
    float read(int32_t id) const;

private:
    ReverbCore& core_;
};

class Automation {
public:
    // During a ramp the editor is refreshed every this many chunks (350 ms).
    static constexpr int32_t kRefreshEveryChunks = 70;

    // The chunk length for a sample rate: 5 ms, at least one frame.
    void setSampleRate(uint32_t rate);
    int32_t chunkFrames() const { return step_; }

    // For each parameter first..last and each segment in order: removes the parameter's segments that
    // intersect it, then appends it for that parameter (its paramId is ignored). Either everything is
    // added or, when memory runs out (std::bad_alloc), the list is unchanged.
    void add(int32_t first, int32_t last, const EnvelopeSegment* segments, size_t count);
    // Removes the segments of parameters first..last that intersect [s0, s1].
    void remove(int32_t first, int32_t last, int64_t s0, int64_t s1);

    // Starts a block of frames at a stream position: drops the segments that ended before it and tells
    // whether any remaining one overlaps the block.
    bool beginBlock(int64_t position, int32_t frames);
    // A new stream: the ramp refresh count starts again.
    void restartRefreshCount() { refreshCount_ = 0; }

    // Applies the segments that cover the chunk at position t, whose length is the smaller of step,
    // remaining and room, and returns that length. remaining is the block's frames from t on: the chunk
    // after this one decides whether a segment ends here.
    int32_t applyChunk(int64_t t, int32_t remaining, int32_t room, AutomationSink& sink);

    const std::vector<EnvelopeSegment>& segments() const { return segments_; }

private:
    std::vector<EnvelopeSegment> segments_;
    int32_t step_ = 1;
    int32_t refreshCount_ = 0;
};

}  // namespace ulvetta
