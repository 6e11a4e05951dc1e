#include <gtest/gtest.h>

#include <atomic>
#include <cmath>
#include <cstring>
#include <memory>
#include <vector>

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
    EXPECT_EQ(c.engineForInspection().damping, 99);
    c.setValue(kEarlyReflections, -600);
    EXPECT_EQ(c.engineForInspection().earlyGain, 0.0);
    c.setValue(kEarlyReflections, -599);
    EXPECT_DOUBLE_EQ(c.engineForInspection().earlyGain, std::pow(10.0, -2.995));
    c.setValue(kNotchQ, 25);
    EXPECT_DOUBLE_EQ(c.engineForInspection().notchQ, 2.5);
    c.setValue(kMeterSource, 2);
    EXPECT_EQ(c.engineForInspection().meterSource, 2);
}

TEST(CoreParameters, UnknownIdsAreRejectedWithoutEffect) {
    ReverbCore c;
    uint8_t before[kCoreStateSize], after[kCoreStateSize];
    c.saveState(before);
    EXPECT_FALSE(c.setValue(17, 5));
    EXPECT_FALSE(c.setValue(-1, 5));
    EXPECT_FALSE(c.setNormalized(1000, 0.5f));
    EXPECT_FALSE(c.setValueText(-7, "12"));
    EXPECT_FALSE(c.setValueAndNotify(17, 1));
    EXPECT_EQ(c.getValue(17), 0);
    EXPECT_EQ(c.getNormalized(17), 0.0f);
    char text[ReverbCore::kTextCapacity] = "junk";
    EXPECT_STREQ(c.getValueText(99, text, true), "");
    c.saveState(after);
    EXPECT_EQ(std::memcmp(before, after, kCoreStateSize), 0);
}

TEST(CoreParameters, NothingReachesTheEngineBeforeTheFirstApply) {
    ReverbCore c;
    EXPECT_EQ(c.engineForInspection().mode, -1);
    EXPECT_EQ(c.engineForInspection().diffusion, -1);
    c.applyAll();
    const ReverbEngine& e = c.engineForInspection();
    EXPECT_EQ(e.mode, 2);
    EXPECT_EQ(e.sampleRate, 44100);
    EXPECT_EQ(e.roomSize, 46);
    EXPECT_EQ(e.meterSource, 1);
    EXPECT_EQ(e.rebuildCount, 1);  // the algorithm comes after every value it depends on
}

TEST(CoreParameters, TextEntryAndNotifiedChangesKeepTheirValue) {
    ReverbCore c;
    EXPECT_TRUE(c.setValueText(kOutputLevelWet, "-17.3"));
    EXPECT_EQ(c.getValue(kOutputLevelWet), -173);
    c.setValueText(kPreDelay, "1e12");
    EXPECT_EQ(c.getValue(kPreDelay), 500);
    char text[ReverbCore::kTextCapacity];
    EXPECT_STREQ(c.getValueText(kOutputLevelWet, text, true), "-17.3");
    EXPECT_STREQ(c.getValueText(kOutputLevelWet, text, false), "-17");
    // The notice applies the value once more through its position, which must give the same value.
    for (int32_t id : {kPreDelay, kRoomSize, kColour, kLowPassFreq, kHighPassFreq, kNotchFreq}) {
        const ParamDesc& d = *findParam(id);
        for (int32_t v = d.minimum; v <= d.maximum; v += (d.maximum - d.minimum) / 37 + 1) {
            c.setValueAndNotify(id, v);
            ASSERT_EQ(c.getValue(id), v) << d.name;
        }
    }
}

// Asks another thread to read the core and waits for it: a report made while the core's lock is still
// held would leave the reader blocked until the wait gives up.
struct CallingBackCapture : CaptureTarget {
    explicit CallingBackCapture(ReverbCore& c) : core(c) {}
    void captureParameter(int32_t id, float position) override {
        reports.emplace_back(id, position);
        answers.push_back(std::make_unique<Event>());
        Event* answered = answers.back().get();
        readers.push_back(std::make_unique<Thread>());
        readers.back()->start([this, id, answered] {
            core.getValue(id);
            answered->set();
        }, 0);
        if (!answered->waitFor(3000)) ++unanswered;
    }
    ReverbCore& core;
    std::vector<std::pair<int32_t, float>> reports;
    std::vector<std::unique_ptr<Event>> answers;
    std::vector<std::unique_ptr<Thread>> readers;
    int unanswered = 0;
};

TEST(CoreParameters, CaptureReportsComeAfterTheLockOncePerChangeInOrder) {
    ReverbCore c;
    CallingBackCapture cap(c);
    c.setCaptureTarget(&cap);
    c.setValueAndNotify(kDecay, 20);
    c.setValueText(kNotchQ, "2.5");
    c.setValue(kDecay, 30);  // not a notified change
    c.notifyHost(kColour, 0.5f);
    c.setValueAndNotify(kAlgorithm, 7);  // the row loads of the switch are not reported
    uint8_t blob[kCoreStateSize];
    c.saveState(blob);
    c.loadState(blob, kCoreStateSize);
    for (auto& r : cap.readers) r->join();  // a deadlocked reader has been freed by now
    EXPECT_EQ(cap.unanswered, 0);
    using Report = std::pair<int32_t, float>;
    EXPECT_EQ(cap.reports, (std::vector<Report>{{kDecay, 0.2f}, {kNotchQ, static_cast<float>(24.0 / 49.0)},
                                                {kColour, 0.5f}, {kAlgorithm, 1.0f}}));
}

TEST(AlgorithmSwitch, LoadsTheClampedRowAndRestoresWhatWasSetBeforeLeaving) {
    ReverbCore c;
    c.setValue(kDecay, 77);
    c.setValue(kNotchFreq, 3000);
    const std::vector<int32_t> edited = soundValues(c);
    c.setValue(kAlgorithm, 7);
    EXPECT_EQ(c.getValue(kDamping), 99);  // 140 in the row
    EXPECT_EQ(c.getValue(kRoomSize), 62);
    EXPECT_EQ(c.engineForInspection().mode, 7);
    c.setValue(kAlgorithm, 12);
    EXPECT_EQ(c.getValue(kAlgorithm), 7);
    c.setValue(kAlgorithm, 2);
    EXPECT_EQ(soundValues(c), edited);
    c.setValue(kAlgorithm, 2);  // the current algorithm again saves and reloads the same row
    EXPECT_EQ(soundValues(c), edited);
    EXPECT_EQ(c.memoryValue(2, 14), 3000);  // column 14 holds Notch Freq
    c.setNormalized(kAlgorithm, 0.0f);  // a position changes only the mode
    EXPECT_EQ(c.getValue(kAlgorithm), 0);
    EXPECT_EQ(c.getValue(kDecay), 77);
}

TEST(CoreStatus, LoadFigureStoppedFlagAndLevel) {
    ReverbCore c;
    c.setValue(kAlgorithm, 1);
    EXPECT_FLOAT_EQ(c.getStatus(kStatusLoad), 0.123f);
    c.setValue(kAlgorithm, 6);
    EXPECT_FLOAT_EQ(c.getStatus(kStatusLoad), 0.092f);
    c.stopStreaming();
    EXPECT_EQ(c.getStatus(kStatusStopped), 1.0f);
    c.startStreaming();
    EXPECT_EQ(c.getStatus(kStatusStopped), 0.0f);
    c.level = 0.2f;
    EXPECT_FLOAT_EQ(c.getStatus(kStatusLevel), 0.2f * 2.235730360023138f);
    c.level = 0.5f;
    EXPECT_EQ(c.getStatus(kStatusLevel), 1.0f);
}

TEST(CoreListeners, RefreshCodes) {
    ReverbCore c;
    RecordingListener a, b;
    c.addListener(&a);
    c.addListener(&b);
    c.addListener(&a);
    c.notifyListeners(kDecay);
    EXPECT_EQ(a.codes, (std::vector<int32_t>{1003, 1003}));
    c.removeListener(&a);  // every entry of it
    c.notifyListeners(kNotchQ);
    EXPECT_EQ(a.codes.size(), 2u);
    EXPECT_EQ(b.codes, (std::vector<int32_t>{1003, 1015}));
    uint8_t blob[kCoreStateSize];
    c.saveState(blob);
    ASSERT_TRUE(c.loadState(blob, kCoreStateSize));
    EXPECT_EQ(b.codes.back(), kRefreshAll);
}

TEST(CoreProcessing, TrackLevelFollowsPeaks) {
    ReverbCore c;
    std::vector<float> loud(100, 1.0f), quiet(100, 0.0f);
    EXPECT_EQ(c.trackLevel(loud.data(), nullptr, 50, 2, 0, 0), 50);
    EXPECT_GT(c.level, 0.5f);
    EXPECT_LT(c.level, 1.0f);
    const float peak = c.level;
    c.trackLevel(quiet.data(), nullptr, 100, 1, 0, 0);
    EXPECT_NEAR(c.level, peak * std::exp(-6.128577478167001e-05 * 100), 1e-5);
}

// The core's lock keeps parameter changes and blocks apart; exercised from two threads.
TEST(CoreProcessing, ParameterChangesWhileStreaming) {
    ReverbCore c;
    c.setFormat(48000.0f, 0, 2, 2);
    c.startStreaming();
    std::atomic<bool> done{false};
    Thread editor;
    ASSERT_TRUE(editor.start([&] {
        for (int i = 0; i < 200; ++i) {
            c.setValue(kDecay, i % 100);
            c.setNormalized(kRoomSize, (i % 10) / 10.0f);
            c.setValue(kAlgorithm, (i / 20) % 2 ? 0 : 7);
        }
        done = true;
    }, 0));
    std::vector<float> in(2 * 256, 0.1f), out(2 * 256);
    int blocks = 0;
    while (!done || blocks < 10) {
        ASSERT_EQ(c.processStereo(in.data(), in.data() + 1, out.data(), out.data() + 1, 256, 2, 0, 0, 0), 256);
        ++blocks;
    }
    editor.join();
    for (float v : out) EXPECT_TRUE(std::isfinite(v));
}
