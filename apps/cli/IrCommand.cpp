#include "IrCommand.h"

#include <cstdio>
#include <vector>

#include "AudioInput.h"
#include "AudioOutput.h"
#include "CliSetup.h"
#include "ResponseAnalysis.h"
#include "engine/StoredResponses.h"
#include "filter/ReverbCore.h"

namespace ulvetta {

std::string storedResponsesReport() {
    std::string out = "response          mode  frames   seconds  peak    T60 250 Hz  1 kHz  4 kHz  dB/s   L/R corr\n";
    for (int mode : {3, 4, 5}) {
        const StoredResponse s = storedResponse(mode);
        std::vector<float> l(s.count), r(s.count);
        for (int32_t i = 0; i < s.count; ++i) {
            l[i] = s.frames[2 * i];
            r[i] = s.frames[2 * i + 1];
        }
        const ResponseReport rep = analyseResponse(l.data(), r.data(), s.count, 44100.0);
        char line[256];
        std::snprintf(line, sizeof line, "%-17s %4d  %7d  %6.3f   %.4f  %6.2f s   %5.2f  %5.2f  %5.1f  %6.3f\n",
                      kAlgorithmNames[mode], mode, s.count, s.count / 44100.0, rep.peak, rep.t60_250, rep.t60_1k,
                      rep.t60_4k, rep.decayDbPerSecond, rep.tailCorrelation);
        out += line;
    }
    return out;
}

void exportResponse(ReverbCore& core, int rate, const std::string& path) {
    if (rate < kMinSampleRate || rate > kMaxSampleRate)
        throw CliError("--rate takes a sample rate from " + std::to_string(kMinSampleRate) + " to " +
                       std::to_string(kMaxSampleRate) + " Hz");
    const int algorithm = core.getValue(kAlgorithm);
    if (algorithm < 3 || algorithm > 5)
        throw CliError("algorithm " + std::to_string(algorithm) + " (" + kAlgorithmNames[algorithm] +
                       ") is not a convolution reverb; choose 3, 4 or 5");
    core.setFormat(static_cast<float>(rate), 0, 2, 2);
    core.applyAll();
    std::vector<float> left, right;
    if (!core.preparedResponse(left, right))
        throw CliError("no response was prepared for algorithm " + std::to_string(algorithm), kExitFailure);
    AudioOutput out(path, rate, true, SF_FORMAT_WAV);
    std::vector<float> frames(2 * left.size());
    for (size_t i = 0; i < left.size(); ++i) {
        frames[2 * i] = left[i];
        frames[2 * i + 1] = right[i];
    }
    out.write(frames.data(), static_cast<long long>(left.size()));
    out.finish();
}

}  // namespace ulvetta
