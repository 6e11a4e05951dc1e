#include <algorithm>
#include <cmath>

#include "engine/ReverbEngine.h"
#include "engine/StoredResponses.h"

namespace ulvetta {

namespace {

// Lines 0..19 at 29761 Hz and room size 50, with their coefficients.
constexpr int kBaseLength[20] = {142,  107,  379,  277,  672,  4453, 1800, 3720, 908,  4217,
                                 2656, 3163, 2763, 3567, 7027, 3497, 9173, 5211, 4689, 6713};
constexpr double kGain[20] = {0.81, 0.81, 0.71, 0.71, 0.7, 0, 0.5, 0, 0.7, 0, 0.5, 0, 0, 0, 0, 0, 0, 0, 0, 0};
// The modulated plate (mode 1) uses lines 0..11 with these gains, depths (samples) and rates (Hz).
constexpr double kMode1Gain[12] = {0.75, 0.75, 0.625, 0.625, 0.7, 0, 0.5, 0, 0.7, 0, 0.5, 0};
constexpr int kMode1Depth[12] = {0, 0, 0, 0, 2, 5, 7, 9, 3, 7, 7, 4};
constexpr double kMode1Rate[12] = {0, 0, 0, 0, 0.5, 0.3, 0.7, 0.1, 0.3, 0.27, 0.21, 0.08};

// Early-reflection lines; the gains are single-precision values.
constexpr int kEarlyBaseLength[6] = {342, 619, 59, 39, 518, 379};
constexpr double kEarlyGain[6] = {0.699999988079071, -0.6499999761581421, 0.0, 0.0, -0.699999988079071,
                                  0.800000011920929};

// Output tap i reads line kTapLine[i] at kTapPosition[i] (unscaled; wrapped into short lines).
constexpr int kTapLine[20] = {9, 9, 10, 11, 5, 6, 7, 5, 5, 6, 7, 9, 10, 11, 12, 14, 13, 15, 19, 17};
constexpr int kTapPosition[20] = {266, 2974, 1913, 1996, 1990, 187, 1066, 353,  3627, 1228,
                                  2673, 2111, 335,  121,  897,  359, 375,  729, 527,  698};

constexpr double kMilli = 0.0010000000474974513;  // 0.001f

}  // namespace

void ReverbEngine::Recalculate() {
    if (roomSize == -1 || mode == -1) return;
    ++rebuildCount;
    const int r = sampleRate;
    const int R = roomSize;

    // Every worker stops before anything it uses is rebuilt.
    StopWorkers();
    if (mode == 3 || mode == 4 || mode == 5) {
        const StoredResponse stored = storedResponse(mode);
        PrepareImpulse(stored.count, stored.frames);
        return;
    }

    int lines = 0;
    if (mode == 7) {
        // Diffused delay: the pre-delay line becomes the echo line of twice the pre-delay time.
        const int p = std::max(preDelay, 1);
        const int n = static_cast<int>(std::round(static_cast<double>(r * p) * kMilli));
        preDelayLine.Create(2 * n);
        diffusionCoef = diffusion * 0.005;
        echoFeedback = decay * 0.004166666666666667;
        lines = 12;
        for (int i = 0; i < lines; ++i) delayLines[i].ConfigureLine(r, R, kBaseLength[i], kGain[i], 0, 0.0, true);
        for (int i = 0; i < 14; ++i) {
            outputTaps[i].length = delayLines[kTapLine[i]].length;
            outputTaps[i].index = kTapPosition[i] % outputTaps[i].length;
        }
        return;
    }

    partitions.reset();
    partitionCount = 0;
    if (mode == 0) {
        lines = 16;
    } else if (mode == 2 || mode == 6) {
        lines = 20;
    } else if (mode == 1) {
        lines = 12;
    }
    if (mode == 1) {
        for (int i = 0; i < lines; ++i)
            delayLines[i].ConfigureLine(r, R, kBaseLength[i], kMode1Gain[i], kMode1Depth[i], kMode1Rate[i], true);
    } else {
        for (int i = 0; i < lines; ++i) delayLines[i].ConfigureLine(r, R, kBaseLength[i], kGain[i], 0, 0.0, true);
    }
    if (lines > 0) {
        for (int i = 0; i < kEarlyLines; ++i)
            earlyLines[i].ConfigureLine(r, R, kEarlyBaseLength[i], kEarlyGain[i], 0, 0.0, false);
    }
    for (int i = 0; i < kOutputTaps; ++i) {
        if (kTapLine[i] >= lines) continue;
        outputTaps[i].length = delayLines[kTapLine[i]].length;
        outputTaps[i].index = kTapPosition[i] % outputTaps[i].length;
    }
}

}  // namespace ulvetta
