#include "processing/DelayLine.h"

#include <algorithm>

namespace ulvetta {

void PreDelayLine::Create(int32_t n) {
    samples.reset();
    samples.reset(new double[n]);
    std::fill(samples.get(), samples.get() + n, 0.0);
    length = n;
    writeIndex = 0;
}

}  // namespace ulvetta
