// What parameter changes cost the stream. Stall: the stream processes 512-frame blocks for two seconds of
// wall time while another thread sets random sound parameters as fast as it can (as a host's SetParam
// does); reported are the longest single block (worst_stall_ms), the longest parameter call (worst_set_ms)
// and the audio delivered per second of wall time (x_realtime). Preparation: the time of one response
// preparation at a rate, cold (an algorithm switch, which converts the stored response to the rate) and
// warm (a change of Decay, which reuses the conversion).
#include <benchmark/benchmark.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <random>
#include <vector>

#include "filter/ReverbCore.h"
#include "platform/Thread.h"

using namespace ulvetta;

namespace {

using Clock = std::chrono::steady_clock;

double msSince(Clock::time_point t) { return std::chrono::duration<double, std::milli>(Clock::now() - t).count(); }

void BM_StallUnderParameterChanges(benchmark::State& state) {
    const int mode = static_cast<int>(state.range(0)), rate = static_cast<int>(state.range(1));
    constexpr int kBlock = 512;
    for (auto _ : state) {
        ReverbCore core;
        core.setFormat(static_cast<float>(rate), 0, 2, 2);
        core.setValue(kAlgorithm, mode);
        core.applyAll();
        core.startStreaming();
        std::vector<float> in(2 * kBlock), out(2 * kBlock);
        std::mt19937 noise(1);
        std::uniform_real_distribution<float> u(-0.3f, 0.3f);
        for (float& x : in) x = u(noise);

        std::atomic<bool> stop{false};
        double worstSet = 0.0;
        long changes = 0;
        Thread setter;
        setter.start(
            [&] {
                std::mt19937 rng(7);
                std::uniform_int_distribution<int> id(0, kSoundParamCount - 1);
                std::uniform_real_distribution<float> pos(0.0f, 1.0f);
                while (!stop) {
                    const Clock::time_point t = Clock::now();
                    const int32_t p = id(rng);
                    core.setNormalized(p, pos(rng));
                    core.notifyListeners(p);
                    worstSet = std::max(worstSet, msSince(t));
                    ++changes;
                }
            },
            0);
        double worstBlock = 0.0;
        long blocks = 0;
        const Clock::time_point start = Clock::now();
        while (msSince(start) < 2000.0) {
            const Clock::time_point t = Clock::now();
            core.processStereo(in.data(), in.data() + 1, out.data(), out.data() + 1, kBlock, 2, 0, 0, 0);
            worstBlock = std::max(worstBlock, msSince(t));
            ++blocks;
        }
        const double wall = msSince(start);
        stop = true;
        setter.join();
        state.counters["worst_stall_ms"] = worstBlock;
        state.counters["worst_set_ms"] = worstSet;
        state.counters["x_realtime"] = blocks * kBlock / static_cast<double>(rate) / (wall * 0.001);
        state.counters["changes"] = static_cast<double>(changes);
    }
    state.SetLabel(kAlgorithmNames[mode]);
}

// Each iteration sets the parameter id to one of two values, in turn, in a core applied at the rate.
void alternate(benchmark::State& state, int32_t id, int32_t a, int32_t b) {
    ReverbCore core;
    core.setFormat(static_cast<float>(state.range(0)), 0, 2, 2);
    core.setValue(kAlgorithm, 4);
    core.applyAll();
    int32_t value = a;
    for (auto _ : state) {
        value = value == a ? b : a;
        core.setValue(id, value);
    }
}

// Cold: the algorithm alternates between two convolutions, so every preparation converts its response.
void BM_PrepareCold(benchmark::State& state) { alternate(state, kAlgorithm, 4, 5); }
// Warm: Decay alternates, and the conversion is reused.
void BM_PrepareWarm(benchmark::State& state) { alternate(state, kDecay, 99, 100); }

}  // namespace

BENCHMARK(BM_StallUnderParameterChanges)
    ->ArgsProduct({{0, 1, 2, 3, 4, 5, 6, 7}, {44100, 96000}})
    ->Iterations(1)
    ->UseRealTime()
    ->Unit(benchmark::kMillisecond);
BENCHMARK(BM_PrepareCold)->ArgsProduct({{44100, 44101, 96000, 192000, 192001}})->UseRealTime()->Unit(benchmark::kMillisecond);
BENCHMARK(BM_PrepareWarm)->ArgsProduct({{44100, 44101, 96000, 192000, 192001}})->UseRealTime()->Unit(benchmark::kMillisecond);

BENCHMARK_MAIN();
