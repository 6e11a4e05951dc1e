// The records of the delay networks: a recirculating or early-reflection line with an optional
// modulator, the pre-delay line and an output tap. Sizing (ConfigureLine) allocates; clearing and the
// per-sample elements never do.
#pragma once

#include <cstdint>
#include <memory>

// The per-sample steps of the kernels (the delay elements, the mix) run millions of times per second;
// inlining them always, also into the kernels' large loops and in unoptimised (debug and sanitizer)
// builds, keeps every build fast enough to run long renders in the tests.
#if defined(__GNUC__)
#define ULVETTA_ALWAYS_INLINE inline __attribute__((always_inline))
#else
#define ULVETTA_ALWAYS_INLINE inline
#endif

namespace ulvetta {

// How a kernel reads a network line, when it knows: never modulated (the oldest entry), always modulated
// (the interpolated read), or checked at each read.
enum class Reads { Plain, Modulated, Checked };

// A sine and cosine advanced by a fixed angle per step: a rotation, four multiplications a step.
struct Rotation {
    double sine = 0.0, cosine = 1.0;        // of the current angle
    double stepSin = 0.0, stepCos = 1.0;    // of the step

    void Step() {
        const double s = sine * stepCos + cosine * stepSin;
        cosine = cosine * stepCos - sine * stepSin;
        sine = s;
    }
};

// Swings a line's read point over one positive half sine per period: the excursion is
// depth x sin(pi x phase / periodLength) samples, and the phase wraps to 0 at period.
//
// The sine is advanced by a rotation and recomputed exactly from the phase every kResyncInterval samples
// or sooner, at each wrap and after a change of period; the accumulated rounding stays below 1e-13 of the
// depth. The phase is only moved by Tick, Advance, Skip and the period update.
//
// Two ways to drive it: Tick (and Advance) one sample at a time; or in runs, for a kernel that advances
// its lines in runs of frames: FramesBeforeResync bounds the run, the rotation() is stepped once per frame
// (the excursion being depth x its sine), and Skip moves the phase past the run.
struct Modulator {
    double rate = -1.0;          // Hz; -1 until set
    int32_t sampleRate = -1;     // Hz; -1 until set
    int32_t period = 0;          // samples, sampleRate / rate rounded up
    double periodLength = 0.0;   // period as a double
    int32_t phase = 0;           // sample counter, kept below period
    int32_t depth = -1;          // excursion in samples; -1 until set

    void SetModSampleRate(int32_t r);
    void SetModRate(double f);
    void SetModDepth(int32_t d) { depth = d; }

    // The current excursion in samples; advances the phase.
    double Tick() {
        if (untilResync_ <= 0) Resync();
        const double m = depth * rotation_.sine;
        rotation_.Step();
        --untilResync_;
        if (++phase >= period) phase = 0;
        return m;
    }

    // Advances the phase without computing the excursion (for a line that is never read modulated); the
    // next Tick recomputes the sine from the phase.
    void Advance() {
        if (++phase >= period) phase = 0;
        untilResync_ = 0;
    }

    // Samples the rotation may still be stepped before it must be recomputed: before the next wrap, and
    // within kResyncInterval of the last recomputation. 0 when it is due.
    int32_t FramesBeforeResync() const { return untilResync_ > 0 ? untilResync_ : 0; }
    // Recomputes the sine and cosine exactly from the phase.
    void Resync();
    // Moves the phase past n samples whose rotation steps the caller did (n <= FramesBeforeResync()).
    void Skip(int32_t n) {
        phase += n;
        if (phase >= period) phase = 0;
        untilResync_ -= n;
    }
    Rotation& rotation() { return rotation_; }

private:
    static constexpr int32_t kResyncInterval = 256;
    void Update();

    Rotation rotation_;      // of pi x phase / periodLength, and of one phase step
    int32_t untilResync_ = 0;  // steps left before the sine is recomputed from the phase
};

struct DelayLine {
    int32_t writeIndex = 0;
    int32_t length = 0;
    std::unique_ptr<double[]> samples;  // length doubles; null before the first configuration
    double gain = 0.0;
    std::unique_ptr<Modulator> mod;     // null when the line is not modulated

    // Sizes the line for rate and room size from its length at 29761 Hz and room size 50; allocates and
    // zeroes its storage. A network line has at least 220 samples; an early line is raised to a prime.
    void ConfigureLine(int sampleRate, int roomSize, int baseLength, double gain, int depth, double rate,
                       bool isNetworkLine);
    // Zeroes the stored samples; the write position stays.
    void Zero();
    bool configured() const { return samples != nullptr; }
};

// Circular pre-delay buffer; moves upwards, unlike the network lines.
struct PreDelayLine {
    int32_t length = 0;
    std::unique_ptr<double[]> samples;
    int32_t writeIndex = 0;

    // Frees the old storage and allocates n zeroed samples.
    void Create(int32_t n);
};

struct OutputTap {
    int32_t index = 0;   // read position in its line, below length
    int32_t length = 0;  // length of the line it reads
};

}  // namespace ulvetta
