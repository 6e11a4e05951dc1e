#include <gtest/gtest.h>

#include <new>
#include <vector>

#include "filter/Automation.h"
#include "filter/ReverbCore.h"

using namespace ulvetta;

namespace {

struct Call {
    int32_t id;
    float value;
    bool refresh;
};

struct RecordingSink : AutomationSink {
    std::vector<Call> calls;
    void apply(int32_t id, float value) override { calls.push_back({id, value, false}); }
    void refresh(int32_t id) override { calls.push_back({id, 0.0f, true}); }
    int refreshes() const {
        int n = 0;
        for (const Call& c : calls) n += c.refresh;
        return n;
    }
};

EnvelopeSegment Segment(int64_t start, int64_t end, float from = 0.0f, float to = 1.0f) {
    return EnvelopeSegment{0, start, end, from, to, false};
}

// Walks a block the way a host does, returning the chunk lengths.
std::vector<int32_t> Walk(Automation& a, int64_t position, int32_t frames, AutomationSink& sink) {
    std::vector<int32_t> lengths;
    for (int32_t offset = 0; offset < frames;)
        offset += lengths.emplace_back(a.applyChunk(position + offset, frames - offset, 1 << 30, sink));
    return lengths;
}

}  // namespace

TEST(Automation, ChunksAreFiveMillisecondsAndSplitAtTheHostsRoom) {
    struct Case {
        uint32_t rate;
        int32_t step;
    } cases[] = {{44100, 220}, {8000, 40}, {100, 1}};
    for (const Case& c : cases) {
        Automation a;
        a.setSampleRate(c.rate);
        EXPECT_EQ(a.chunkFrames(), c.step);
        RecordingSink sink;
        const std::vector<int32_t> lengths = Walk(a, 0, 3 * c.step + 1, sink);
        EXPECT_EQ(lengths, (std::vector<int32_t>{c.step, c.step, c.step, 1})) << c.rate;
    }
    Automation a;
    a.setSampleRate(8000);
    RecordingSink sink;
    EXPECT_EQ(a.applyChunk(0, 100, 25, sink), 25);  // an output buffer with room for 25 frames
}

TEST(Automation, AddingReplacesIntersectingSegmentsOfTheSameParameterOnly) {
    Automation a;
    const EnvelopeSegment first = Segment(100, 200);
    a.add(2, 2, &first, 1);
    a.add(3, 3, &first, 1);
    const EnvelopeSegment later = Segment(400, 500);
    a.add(2, 2, &later, 1);
    const EnvelopeSegment over = Segment(150, 300, 0.5f, 0.25f);
    a.add(2, 2, &over, 1);
    const auto& s = a.segments();
    ASSERT_EQ(s.size(), 3u);
    EXPECT_EQ(s[0].paramId, 3);
    EXPECT_EQ(s[1].startSample, 400);
    EXPECT_EQ(s[2].startSample, 150);
    EXPECT_EQ(s[2].endValue, 0.25f);
    // A range inside a segment, one covering it, and one touching only its end all remove it.
    for (auto range : {std::pair<int64_t, int64_t>{420, 430}, {0, 1000}, {500, 600}}) {
        Automation b;
        b.add(0, 0, &later, 1);
        b.remove(0, 0, range.first, range.second);
        EXPECT_TRUE(b.segments().empty()) << range.first;
    }
    a.remove(0, kSoundParamCount - 1, 0, 99);  // touches nothing
    EXPECT_EQ(a.segments().size(), 3u);
    a.add(0, kSoundParamCount - 1, &first, 1);  // every parameter: the overlapping ones go
    EXPECT_EQ(a.segments().size(), 16u);
}

TEST(Automation, AnImpossibleAdditionLeavesTheListUnchanged) {
    Automation a;
    const EnvelopeSegment s = Segment(0, 10);
    a.add(1, 1, &s, 1);
    EXPECT_THROW(a.add(0, 14, &s, a.segments().max_size()), std::bad_alloc);
    ASSERT_EQ(a.segments().size(), 1u);
    EXPECT_EQ(a.segments()[0].paramId, 1);
}

TEST(Automation, RampAppliesStartInterpolatedAndEndValues) {
    Automation a;
    a.setSampleRate(8000);  // 40-frame chunks
    const EnvelopeSegment s = Segment(0, 200, 0.2f, 0.7f);
    a.add(kDecay, kDecay, &s, 1);
    ASSERT_TRUE(a.beginBlock(0, 400));
    RecordingSink sink;
    Walk(a, 0, 400, sink);
    // t = 0 is the start; t = 40..160 interpolate 0.2 + (t / 200) * 0.5; at t = 200 the next chunk
    // (t = 240) lies past the end, so the end value is applied; later chunks lie outside the segment.
    const std::vector<float> expected = {0.2f, 0.3f, 0.4f, 0.5f, 0.6f, 0.7f};
    std::vector<float> applied;
    for (const Call& c : sink.calls)
        if (!c.refresh) applied.push_back(c.value);
    ASSERT_EQ(applied.size(), expected.size());
    for (size_t i = 0; i < expected.size(); ++i) EXPECT_NEAR(applied[i], expected[i], 1e-6f) << i;
    EXPECT_EQ(sink.refreshes(), 2);  // start and end; interpolated chunks wait for the 70th
}

TEST(Automation, ALongRampRefreshesTheEditorEverySeventiethChunk) {
    Automation a;
    a.setSampleRate(8000);
    const EnvelopeSegment s = Segment(0, 40 * 1000);
    a.add(kDamping, kDamping, &s, 1);
    RecordingSink sink;
    Walk(a, 0, 40 * 101, sink);  // the start chunk, then 100 interpolated chunks
    EXPECT_EQ(sink.refreshes(), 2);
    a.restartRefreshCount();  // a new stream: 69 more chunks bring no refresh, the 70th does
    RecordingSink again;
    Walk(a, 40 * 101, 40 * 69, again);
    EXPECT_EQ(again.refreshes(), 0);
    Walk(a, 40 * 170, 40, again);
    EXPECT_EQ(again.refreshes(), 1);
}

TEST(Automation, BlocksPruneEndedSegmentsAndFindOverlaps) {
    Automation a;
    const EnvelopeSegment early = Segment(0, 99), late = Segment(1000, 1100), edge = Segment(50, 100);
    a.add(0, 0, &early, 1);
    a.add(1, 1, &late, 1);
    a.add(2, 2, &edge, 1);
    EXPECT_TRUE(a.beginBlock(100, 500));  // the early one ended before the block; edge ends at its first frame
    EXPECT_EQ(a.segments().size(), 2u);
    EXPECT_FALSE(a.beginBlock(101, 899));  // frames 101..999: late starts just after
    EXPECT_EQ(a.segments().size(), 1u);
    EXPECT_TRUE(a.beginBlock(101, 900));
    EXPECT_TRUE(a.beginBlock(1050, 10));  // inside the segment
    EXPECT_FALSE(a.beginBlock(1101, 0));
    EXPECT_TRUE(a.segments().empty());
}

TEST(Automation, CoreSinkSetsPositionsAndReadsThemBack) {
    ReverbCore core;
    CoreAutomationSink sink(core);
    sink.apply(kLowPassFreq, 0.0f);
    EXPECT_EQ(core.getValue(kLowPassFreq), 20);  // the range's low end
    sink.apply(kDecay, 0.25f);
    EXPECT_FLOAT_EQ(sink.read(kDecay), core.getNormalized(kDecay));
    sink.apply(kAlgorithm, 5.0f);  // not a sound parameter: ignored
    EXPECT_EQ(core.getValue(kAlgorithm), 2);
}
