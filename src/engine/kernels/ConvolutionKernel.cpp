// The convolution kernel of modes 3, 4 and 5: true stereo, each channel convolved with its own response
// channel without added delay. The first 64 taps run as a direct FIR; partitions of doubling size are
// convolved by FFT once per their own size, at a schedule that plays every response sample at its exact
// distance. Partitions of 4096 samples and more are handed to their worker threads.
#include <algorithm>
#include <cmath>

#include "engine/ReverbEngine.h"
#include "engine/kernels/BlockFrame.h"

namespace ulvetta {

namespace {

// One sample through a filter section with its left state (the kernel runs both channels through it).
inline double sectionStep(BiquadSection& s, double x) {
    const double y = s.b0 * x + s.b1 * s.x1L + s.b2 * s.x2L - s.a1 * s.y1L - s.a2 * s.y2L;
    s.x2L = s.x1L;
    s.x1L = x;
    s.y2L = s.y1L;
    s.y1L = y;
    return y;
}

constexpr int32_t kWorkerPartition = 4096;

// The convolution meters before latching the flush flag, runs its own input stage per frame (stereo, in
// double precision), and ends the stream by counting out its response.
constexpr BlockPolicy kConvolutionBlock = {true, EndOfStream::ResponseLength, InputStage::None, false};

}  // namespace

int ReverbEngine::processConvolution(float* outLeft, float* outRight, const float* inLeft, const float* inRight,
                                     int frames, int stride, int accumulate, int flush) {
    // A response prepared off this thread starts at this block boundary.
    if (preparer_.TakeReady(response_)) StartResponse();
    return RunBlock<kConvolutionBlock, &ReverbEngine::convolutionFrames>(outLeft, outRight, inLeft, inRight, frames,
                                                                        stride, accumulate, flush);
}

ULVETTA_ALWAYS_INLINE void ReverbEngine::convolutionFrames(float* outLeft, float* outRight, const float* inLeft,
                                                           const float* inRight, int frames, int stride,
                                                           int accumulate) {
    const bool ready = response_ != nullptr;
    ConvolutionResponse* r = response_.get();
    for (int i = 0; i < frames; ++i) {
        const int at = i * stride;
        double wetLeft = 0.0, wetRight = 0.0;
        if (ready) {
            // 1-3. Gain, the input sections and the colour low-pass, one state run over left then right.
            double xl = saneInput(inLeft[at]) * inputGain, xr = saneInput(inRight[at]) * inputGain;
            for (int s = 0; s < 3; ++s) xl = sectionStep(filterSections[s], xl);
            for (int s = 0; s < 3; ++s) xr = sectionStep(filterSections[s], xr);
            double cl = xl, cr = xr;
            if (colour != 100) {
                cl = (xl - colourState) * colourCutoff + colourState;
                cr = (xr - cl) * colourCutoff + cl;
                colourState = cr;
            }
            // 4-5. History and the direct head.
            r->historyLeft.Push(static_cast<float>(cl));
            r->historyRight.Push(static_cast<float>(cr));
            headLeft = nspsFir(&firLeft, static_cast<float>(cl));
            headRight = nspsFir(&firRight, static_cast<float>(cr));
            // 6. Every 32 frames: the partitions due take a new window and hand over their last result,
            //    and the next 32 output samples of all partitions are summed at once (their play-out
            //    positions stay aligned to 32, because every size is a multiple of 32).
            const int32_t n = convCounter;
            const int32_t slot = n % 32;
            if (slot == 0) {
                if (n != 0) {
                    for (int32_t k = 1; k < r->partitionCount; ++k) {
                        ConvPartition& p = r->partitions[k];
                        if ((n / 32) % (p.size / 32) != 0 || p.offset > n) continue;
                        const bool worker = p.size >= kWorkerPartition && p.HasWorker();
                        if (worker) p.WaitDone();
                        const int32_t N = p.size;
                        // The finished result becomes the one played; its old buffer takes the next one.
                        std::swap(p.outputLeft, p.nextLeft);
                        std::swap(p.outputRight, p.nextRight);
                        std::copy(p.inputLeft.get() + N, p.inputLeft.get() + 2 * N, p.inputLeft.get());
                        std::copy(p.inputRight.get() + N, p.inputRight.get() + 2 * N, p.inputRight.get());
                        // Frames n - offset .. n - offset + N - 1, oldest first; frame n is the newest.
                        r->historyLeft.CopyOut(p.offset, N, p.inputLeft.get() + N);
                        r->historyRight.CopyOut(p.offset, N, p.inputRight.get() + N);
                        if (worker)
                            p.StartJob();
                        else
                            p.RunJob();
                    }
                }
                std::fill(std::begin(partSumLeft), std::end(partSumLeft), 0.0);
                std::fill(std::begin(partSumRight), std::end(partSumRight), 0.0);
                for (int32_t k = 1; k < r->partitionCount; ++k) {
                    ConvPartition& p = r->partitions[k];
                    const float* ol = p.outputLeft.get() + p.readPos;
                    const float* orr = p.outputRight.get() + p.readPos;
                    for (int j = 0; j < 32; ++j) {
                        partSumLeft[j] += ol[j];
                        partSumRight[j] += orr[j];
                    }
                    p.readPos += 32;
                    if (p.readPos == p.size) p.readPos = 0;
                }
            }
            // 7-8. The counter, then the output of the head and every partition.
            ++convCounter;
            wetLeft = headLeft + partSumLeft[slot];
            wetRight = headRight + partSumRight[slot];
        }
        // 9-10. Mix with the levels, and the wet meter.
        mixOutput(outLeft, outRight, inLeft, inRight, i, stride, accumulate, wetLeft, wetRight, wetLevel, dryLevel);
    }
    // Keep denormals out of the recursive states.
    colourState = flushTiny(colourState);
    for (int s = 0; s < 3; ++s) {
        BiquadSection& f = filterSections[s];
        f.x1L = flushTiny(f.x1L);
        f.x2L = flushTiny(f.x2L);
        f.y1L = flushTiny(f.y1L);
        f.y2L = flushTiny(f.y2L);
    }
}

}  // namespace ulvetta
