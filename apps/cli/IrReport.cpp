#include "IrReport.h"

#include <cstdio>
#include <vector>

#include "ResponseAnalysis.h"
#include "engine/StoredResponses.h"
#include "filter/ParamTable.h"

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

}  // namespace ulvetta
