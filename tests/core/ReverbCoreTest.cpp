#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <memory>
#include <vector>

#include "engine/EngineProbe.h"
#include "filter/CoreState.h"
#include "filter/ReverbCore.h"
#include "platform/Event.h"
#include "platform/Thread.h"

using namespace ulvetta;

namespace {

struct RecordingListener : CoreListener {
    std::vector<int32_t> codes;
    void refresh(int32_t code) override { codes.push_back(code); }
};

std::vector<int32_t> soundValues(ReverbCore& c) {
    std::vector<int32_t> v;
    for (int32_t id = 0; id < kSoundParamCount; ++id) v.push_back(c.getValue(id));
    return v;
}

}  // namespace

TEST(CoreParameters, ClampAndApply) {
    ReverbCore c;
    c.setValue(kDamping, 500);
    EXPECT_EQ(c.getValue(kDamping), 99);
    EXPECT_EQ(EngineProbe(c.engineForInspection()).damping(), 99);
    c.setValue(kEarlyReflections, -600);
    EXPECT_EQ(EngineProbe(c.engineForInspection()).earlyGain(), 0.0);
    c.setValue(kEarlyReflections, -599);
    EXPECT_DOUBLE_EQ(EngineProbe(c.engineForInspection()).earlyGain(), std::pow(10.0, -2.995));
    c.setValue(kNotchQ, 25);
    EXPECT_DOUBLE_EQ(EngineProbe(c.engineForInspection()).notchQ(), 2.5);
    c.setValue(kMeterSource, 2);
    EXPECT_EQ(EngineProbe(c.engineForInspection()).meterSource(), 2);
}

TEST(CoreParameters, UnknownIdsAreRejectedWithoutEffect) {
    ReverbCore c;
    uint8_t before[kCoreStateSize], after[kCoreStateSize];
    c.saveState(before);
    EXPECT_FALSE(c.setValue(17, 5) || c.setValue(-1, 5) || c.setNormalized(1000, 0.5f) ||
                 c.setValueText(-7, "12") || c.setValueAndNotify(17, 1));
    EXPECT_EQ(c.getValue(17) + c.getNormalized(17), 0.0f);
    char text[ReverbCore::kTextCapacity] = "junk";
    EXPECT_STREQ(c.getValueText(99, text, true), "");
    c.saveState(after);
    EXPECT_EQ(std::memcmp(before, after, kCoreStateSize), 0);
}

TEST(CoreParameters, NothingReachesTheEngineBeforeTheFirstApply) {
    ReverbCore c;
    EXPECT_EQ(EngineProbe(c.engineForInspection()).mode(), -1);
    EXPECT_EQ(EngineProbe(c.engineForInspection()).diffusion(), -1);
    c.applyAll();
    const EngineProbe e(c.engineForInspection());
    EXPECT_EQ(e.mode(), 2);
    EXPECT_EQ(e.sampleRate(), 44100);
    EXPECT_EQ(e.roomSize(), 46);
    EXPECT_EQ(e.meterSource(), 1);
    EXPECT_EQ(e.rebuildCount(), 1);  // the algorithm comes after every value it depends on
}

// Asks another thread to read the core and waits for it: a report made while the core's lock is still
// held would leave the reader blocked until the wait gives up.
struct CallingBackCapture : CaptureTarget {
    explicit CallingBackCapture(ReverbCore& c) : core(c) {}
    void captureParameter(int32_t id, float position) override {
        reports.emplace_back(id, position);
        Event* answered = answers.emplace_back(std::make_unique<Event>()).get();
        readers.emplace_back(std::make_unique<Thread>())->start([this, id, answered] {
            core.getValue(id);
            answered->set();
        }, 0);
        unanswered += answered->waitFor(3000) ? 0 : 1;
    }
    ReverbCore& core;
    std::vector<std::pair<int32_t, float>> reports;
    std::vector<std::unique_ptr<Event>> answers;
    std::vector<std::unique_ptr<Thread>> readers;
    int unanswered = 0;
};

TEST(CoreNotices, CaptureReportsComeAfterTheLockOncePerChangeInOrder) {
    ReverbCore c;
    CallingBackCapture cap(c);
    c.setCaptureTarget(&cap);
    RecordingListener a, b;
    for (RecordingListener* l : {&a, &b, &a}) c.addListener(l);
    c.removeListener(&a);  // every entry of it
    c.setValueAndNotify(kDecay, 20);
    c.setValueText(kNotchQ, "2.5");
    char text[ReverbCore::kTextCapacity];
    EXPECT_STREQ(c.getValueText(kNotchQ, text, true), "2.5");
    c.setValue(kDecay, 30);  // not a notified change
    c.notifyHost(kColour, 0.5f);
    c.setValueAndNotify(kAlgorithm, 7);  // the row loads of the switch are not reported
    uint8_t blob[kCoreStateSize];
    c.saveState(blob);
    c.loadState(blob, kCoreStateSize);
    for (auto& r : cap.readers) r->join();  // a deadlocked reader has been freed by now
    EXPECT_EQ(cap.unanswered, 0);
    EXPECT_TRUE(a.codes.empty());
    EXPECT_EQ(b.codes, std::vector<int32_t>{kRefreshAll});  // listeners hear of the load, not of each change
    EXPECT_EQ(cap.reports, (std::vector<std::pair<int32_t, float>>{
                               {kDecay, 0.2f}, {kNotchQ, float(24.0 / 49.0)}, {kColour, 0.5f}, {kAlgorithm, 1.0f}}));
}

TEST(AlgorithmSwitch, LoadsTheClampedRowAndRestoresWhatWasSetBeforeLeaving) {
    ReverbCore c;
    c.setValue(kDecay, 77);
    c.setValue(kNotchFreq, 3000);
    const std::vector<int32_t> edited = soundValues(c);
    c.setValue(kAlgorithm, 7);
    EXPECT_EQ(c.getValue(kDamping), 99);  // 140 in the row
    EXPECT_EQ(EngineProbe(c.engineForInspection()).mode(), 7);
    c.setValue(kAlgorithm, 2);
    EXPECT_EQ(soundValues(c), edited);
    c.setValue(kAlgorithm, 2);  // the current algorithm again saves and reloads the same row
    EXPECT_EQ(soundValues(c), edited);
    EXPECT_EQ(c.memoryValue(2, 14), 3000);  // column 14 holds Notch Freq
    c.setNormalized(kAlgorithm, 0.0f);  // a position changes only the mode, loading no row
    EXPECT_EQ(c.getValue(kDecay), 77);
}

// Only the rates a host may give (1..768000 Hz, after rounding) reach the engine; at both ends of that
// range every algorithm gives finite output.
TEST(CoreFormat, OnlyHostRatesAreAccepted) {
    ReverbCore c;
    c.setFormat(48000.0f, 0, 2, 2);
    for (float bad : {0.0f, 0.49f, -44100.0f, 768000.5f, 5e6f, std::nanf(""), INFINITY}) {
        c.setFormat(bad, 0, 2, 2);
        c.applyAll();
        EXPECT_EQ(EngineProbe(c.engineForInspection()).sampleRate(), 48000) << bad;
    }
    std::vector<float> in(2 * 4096), out(in.size());
    for (size_t i = 0; i < in.size(); ++i) in[i] = ((i * 7919) % 200) * 0.005f - 0.5f;
    for (float rate : {1.0f, 768000.0f}) {
        for (int algorithm = 0; algorithm < kAlgorithmCount; ++algorithm) {
            if (rate > 1.0f && (algorithm == 4 || algorithm == 5)) continue;  // one conversion at that rate is enough
            c.setFormat(rate, 0, 2, 2);
            c.setValue(kAlgorithm, algorithm);
            c.startStreaming();
            EXPECT_EQ(EngineProbe(c.engineForInspection()).sampleRate(), static_cast<int32_t>(rate));
            c.processStereo(in.data(), in.data() + 1, out.data(), out.data() + 1, 4096, 2, 0, 0, 0);
            for (float v : out) ASSERT_TRUE(std::isfinite(v)) << rate << " algorithm " << algorithm;
        }
    }
}
