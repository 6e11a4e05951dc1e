// Network sizing: rebuilds the delay lines, early-reflection lines, modulators and output taps of the
// current algorithm mode for the sample rate and room size. Allocates; called from the setters and the
// stream-start reset, never from the audio path.
#include <algorithm>
#include <cmath>

#include "engine/NetworkTables.h"
#include "engine/ReverbEngine.h"

namespace ulvetta {

namespace {

constexpr double kMilli = 0.0010000000474974513;  // 0.001f

// Points taps 0..tapCount-1 at their positions in lines that have just been configured; a position past the
// end of a short line wraps around.
void configureTaps(OutputTap* taps, const DelayLine* lines, int lineCount, int tapCount) {
    for (int i = 0; i < tapCount; ++i) {
        const int line = network::kTapLine[i];
        if (line >= lineCount) continue;
        taps[i].length = lines[line].length;
        taps[i].index = network::kTapPosition[i] % taps[i].length;
    }
}

}  // namespace

void ReverbEngine::Recalculate() {
    if (roomSize == -1 || mode == -1) return;
    if (IsConvolution(mode)) {
        // Prepared once for a whole group of changes (EndChanges), or now.
        if (batchDepth_ > 0)
            responseStale_ = true;
        else
            CommitResponse(true);
        return;
    }
    ++rebuildCount;
    const int r = sampleRate;
    const int R = roomSize;
    DropResponse();

    if (mode == 7) {
        // Diffused delay: the pre-delay line becomes the echo memory, two entries (left, right) per frame of
        // the echo period.
        const int p = std::max(preDelay, 1);
        const int n = static_cast<int>(std::round(static_cast<double>(r * p) * kMilli));
        preDelayLine.Create(2 * n);
        diffusionCoef = diffusion * 0.005;
        echoFeedback = decay * 0.004166666666666667;  // decay / 240
        for (int i = 0; i < 12; ++i)
            delayLines[i].ConfigureLine(r, R, network::kBaseLength[i], network::kGain[i], 0, 0.0, true);
        configureTaps(outputTaps, delayLines, 12, 14);
        return;
    }

    int lines = 0;
    if (mode == 0) {
        lines = 16;
    } else if (mode == 2 || mode == 6) {
        lines = 20;
    } else if (mode == 1) {
        lines = 12;
    }
    for (int i = 0; i < lines; ++i) {
        if (mode == 1)
            delayLines[i].ConfigureLine(r, R, network::kBaseLength[i], network::kMode1Gain[i],
                                        network::kMode1Depth[i], network::kMode1Rate[i], true);
        else
            delayLines[i].ConfigureLine(r, R, network::kBaseLength[i], network::kGain[i], 0, 0.0, true);
    }
    if (lines > 0) {
        for (int i = 0; i < kEarlyLines; ++i)
            earlyLines[i].ConfigureLine(r, R, network::kEarlyBaseLength[i], network::kEarlyGain[i], 0, 0.0, false);
    }
    configureTaps(outputTaps, delayLines, lines, kOutputTaps);
}

}  // namespace ulvetta
