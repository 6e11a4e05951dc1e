// Speed of the delay-network algorithms at 44100 Hz in 512-frame stereo blocks, reported as a real-time
// factor: seconds of audio processed per CPU second ("rtf"). Three loads per algorithm:
//   Music       - continuous full-band input;
//   SilentTail  - silence after a short burst, timed from the burst on, so the run covers the decaying
//                 tail down into the range where unflushed values would turn denormal;
//   Silence     - silence long after the tail has ended.
// The algorithm is chosen by the benchmark argument (the engine's mode).
#include <benchmark/benchmark.h>

#include <cmath>
#include <random>
#include <vector>

#include "engine/ReverbEngine.h"

namespace {

using ulvetta::ReverbEngine;

constexpr int kRate = 44100;
constexpr int kBlock = 512;

// Factory settings of each algorithm: diffusion, pre-delay ms, decay, damping, room size, early/wet/dry
// levels (tenths of a dB), colour.
struct Factory {
    int diffusion, preDelay, decay, damping, room, early, wet, dry, colour;
};

Factory FactoryOf(int mode) {
    switch (mode) {
        case 0: return {17, 15, 55, 5, 38, -100, -170, 0, 90};
        case 1: return {100, 19, 58, 33, 41, -250, -160, 0, 36};
        case 2: return {100, 32, 47, 30, 46, 0, -180, 0, 56};
        case 6: return {100, 87, 20, 80, 29, -400, -140, 0, 40};
        default: return {100, 12, 41, 99, 62, 0, -180, 0, 61};
    }
}

double Gain(int tenthsDb) { return std::pow(10.0, tenthsDb * 0.005); }

void Setup(ReverbEngine& e, int mode) {
    const Factory f = FactoryOf(mode);
    e.SetSampleRate(kRate);
    e.SetDiffusion(f.diffusion);
    e.SetPreDelay(f.preDelay);
    e.SetDecay(f.decay);
    e.SetDamping(f.damping);
    e.SetRoomSize(f.room);
    e.SetEarlyLevel(Gain(f.early));
    e.SetWetLevel(Gain(f.wet));
    e.SetDryLevel(Gain(f.dry));
    e.SetColour(f.colour);
    e.SetInputGain(0);
    e.SetLowPassFreq(10000);
    e.SetHighPassFreq(125);
    e.SetNotchFreq(2000);
    e.SetNotchGain(0.0);
    e.SetNotchQ(3.0);
    e.SetMode(mode);
    e.SetMeterSource(1);  // the output meter, as the effect core sets it by default
    e.ResetState();
}

std::vector<float> NoiseBlock(unsigned seed) {
    std::vector<float> v(2 * kBlock);
    std::mt19937 rng(seed);
    std::uniform_real_distribution<float> u(-0.5f, 0.5f);
    for (float& x : v) x = u(rng);
    return v;
}

void Run(benchmark::State& state, ReverbEngine& e, const std::vector<float>& in) {
    std::vector<float> out(2 * kBlock);
    for (auto _ : state) {
        const int n = e.ProcessBlock(out.data(), out.data() + 1, in.data(), in.data() + 1, kBlock, 2, 0, 0);
        benchmark::DoNotOptimize(n);
        benchmark::DoNotOptimize(out.data());
    }
    state.counters["rtf"] = benchmark::Counter(static_cast<double>(state.iterations()) * kBlock / kRate,
                                               benchmark::Counter::kIsRate);
    state.SetItemsProcessed(state.iterations() * kBlock);
}

void Music(benchmark::State& state) {
    ReverbEngine e;
    Setup(e, static_cast<int>(state.range(0)));
    // A few different blocks in turn would cost a copy per block; one block of noise is full-band input.
    Run(state, e, NoiseBlock(1));
}

void SilentTail(benchmark::State& state) {
    ReverbEngine e;
    Setup(e, static_cast<int>(state.range(0)));
    const std::vector<float> burst = NoiseBlock(2), silence(2 * kBlock, 0.0f);
    std::vector<float> out(2 * kBlock);
    for (int i = 0; i < 100; ++i)
        e.ProcessBlock(out.data(), out.data() + 1, burst.data(), burst.data() + 1, kBlock, 2, 0, 0);
    Run(state, e, silence);
}

void Silence(benchmark::State& state) {
    ReverbEngine e;
    Setup(e, static_cast<int>(state.range(0)));
    const std::vector<float> burst = NoiseBlock(3), silence(2 * kBlock, 0.0f);
    std::vector<float> out(2 * kBlock);
    for (int i = 0; i < 100; ++i)
        e.ProcessBlock(out.data(), out.data() + 1, burst.data(), burst.data() + 1, kBlock, 2, 0, 0);
    // Ten minutes of audio: every value of the tail has decayed through the denormal range to zero.
    for (int i = 0; i < 600 * kRate / kBlock; ++i)
        e.ProcessBlock(out.data(), out.data() + 1, silence.data(), silence.data() + 1, kBlock, 2, 0, 0);
    Run(state, e, silence);
}

void Algorithms(benchmark::internal::Benchmark* b) {
    for (int mode : {0, 1, 2, 6, 7}) b->Arg(mode);
    b->ArgName("mode");
}

BENCHMARK(Music)->Apply(Algorithms);
BENCHMARK(SilentTail)->Apply(Algorithms);
BENCHMARK(Silence)->Apply(Algorithms);

}  // namespace

BENCHMARK_MAIN();
