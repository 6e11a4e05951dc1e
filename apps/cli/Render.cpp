#include "Render.h"

#include <algorithm>
#include <cmath>
#include <csignal>
#include <cstdlib>
#include <vector>

#include "AudioInput.h"
#include "AudioOutput.h"
#include "CliSetup.h"
#include "ProgressBar.h"
#include "TailCut.h"
#include "filter/ReverbCore.h"

namespace ulvetta {

namespace {

volatile std::sig_atomic_t gInterrupted = 0;

void onInterrupt(int) { gInterrupted = 1; }

void checkInterrupted() {
    if (gInterrupted) throw CliError("interrupted; no output was written", 130);
}

}  // namespace

void installInterruptHandlers() {
    std::signal(SIGINT, onInterrupt);
    std::signal(SIGTERM, onInterrupt);
}

double parseTailDb(const std::string& text) {
    const std::string s = trim(text);
    const double db = isDecimalNumber(s) ? std::strtod(s.c_str(), nullptr) : NAN;
    if (!std::isfinite(db) || db > 0.0)
        throw CliError("--tail-db takes a level in dBFS, a finite number of at most 0 such as -90, not " + inQuotes(text));
    return db;
}

void render(ReverbCore& core, const RenderRequest& request, bool progress) {
    AudioInput input(request.input);
    const bool asFloat = request.forceFloat || !input.isPcm16();
    AudioOutput output(request.output, input.sampleRate(), asFloat, AudioOutput::containerOf(request.output));

    core.setFormat(static_cast<float>(input.sampleRate()), 0, 2, 2);
    core.applyAll();
    core.startStreaming();

    const int block = request.blockFrames;
    std::vector<float> in(2 * static_cast<size_t>(block), 0.0f), result(2 * static_cast<size_t>(block), 0.0f);
    const double threshold = request.tailDb ? std::pow(10.0, *request.tailDb / 20.0) : 0.0;
    TailCut cut(output, threshold, input.sampleRate(), block);
    ProgressBar bar(progress, input.frames(), input.sampleRate());

    long long done = 0;
    for (;;) {
        checkInterrupted();
        const int frames = input.read(in.data(), block);
        if (frames == 0) break;
        const int produced = core.processStereo(in.data(), in.data() + 1, result.data(), result.data() + 1, frames, 2, 0, 0, 0);
        cut.addInput(result.data(), std::max(0, std::min(produced, frames)));
        done += frames;
        bar.update(done, false);
    }

    // The tail: silence with the flush flag until a block comes back short or the output has stayed quiet.
    std::fill(in.begin(), in.end(), 0.0f);
    const long long maxTail = static_cast<long long>(kMaxTailSeconds) * input.sampleRate();
    long long tail = 0;
    for (;;) {
        checkInterrupted();
        const int produced = core.processStereo(in.data(), in.data() + 1, result.data(), result.data() + 1, block, 2, 0, 1, 0);
        if (cut.addTail(result.data(), std::max(0, std::min(produced, block)))) break;
        tail += produced;
        bar.update(tail, true);
        if (produced < block) {
            cut.finish();
            break;
        }
        if (tail > maxTail)
            throw CliError("the reverb tail did not end within " + std::to_string(kMaxTailSeconds) +
                           " seconds, so no output was written", kExitFailure);
    }
    core.stopStreaming();
    output.finish();
}

}  // namespace ulvetta
