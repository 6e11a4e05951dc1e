// Real-time factors of the three convolution reverbs (seconds of stereo audio per second of wall time, with
// the large partitions on their worker threads, so both cores count), the cost of preparing a response,
// and zita-convolver running the same prepared response with its smallest partition of 64 frames.
#include <benchmark/benchmark.h>
#include <zita-convolver.h>

#include <sched.h>

#include <cstring>
#include <map>
#include <memory>
#include <vector>

#include "filter/ReverbCore.h"

using namespace ulvetta;

namespace {

std::vector<float> noise(size_t n) {
    std::vector<float> v(n);
    uint32_t s = 1;
    for (float& x : v) {
        s = s * 1664525u + 1013904223u;
        x = static_cast<float>((s >> 8) / 8388608.0 - 1.0) * 0.25f;
    }
    return v;
}

void setDecay100(ReverbCore& core, int mode, int rate) {
    core.setValue(kAlgorithm, mode);
    core.setValue(kDecay, 100);  // the whole stored response
    core.setFormat(static_cast<float>(rate), 0, 2, 2);
    core.applyAll();
    core.startStreaming();
}

void BM_Ulvetta(benchmark::State& state) {
    const int mode = static_cast<int>(state.range(0)), rate = static_cast<int>(state.range(1)),
              block = static_cast<int>(state.range(2));
    ReverbCore core;
    setDecay100(core, mode, rate);
    const int blocks = 256;
    std::vector<float> in = noise(2 * static_cast<size_t>(block) * blocks), out(2 * static_cast<size_t>(block));
    size_t b = 0;
    for (auto _ : state) {
        const float* src = in.data() + 2 * static_cast<size_t>(block) * (b++ % blocks);
        core.processStereo(src, src + 1, out.data(), out.data() + 1, block, 2, 0, 0, 0);
        benchmark::DoNotOptimize(out.data());
    }
    state.counters["x_realtime"] =
        benchmark::Counter(static_cast<double>(block) / rate, benchmark::Counter::kIsIterationInvariantRate);
    state.SetLabel(kAlgorithmNames[mode]);
}

// One running convolver per configuration for the whole run: zita-convolver's worker threads are not
// stopped between the benchmark's repeated calls (its stop does not return while nothing processes).
struct ZitaSetup {
    Convproc conv;
    std::vector<float> left, right;
};

ZitaSetup* zitaFor(int mode, int rate) {
    static std::map<std::pair<int, int>, std::unique_ptr<ZitaSetup>> setups;
    auto& slot = setups[{mode, rate}];
    if (slot) return slot.get();
    slot.reset(new ZitaSetup);
    ReverbCore core;
    setDecay100(core, mode, rate);
    if (!core.preparedResponse(slot->left, slot->right)) return nullptr;
    const int length = static_cast<int>(slot->left.size());
    Convproc& conv = slot->conv;
    conv.set_options(Convproc::OPT_LATE_CONTIN);
    if (conv.configure(2, 2, length, 64, Convproc::MINPART, Convproc::MAXPART, 0.5f) != 0) return nullptr;
    conv.impdata_create(0, 0, 1, slot->left.data(), 0, length);
    conv.impdata_create(1, 1, 1, slot->right.data(), 0, length);
    if (conv.start_process(0, SCHED_OTHER) != 0 || conv.state() != Convproc::ST_PROC) return nullptr;
    return slot.get();
}

void BM_Zita(benchmark::State& state) {
    const int mode = static_cast<int>(state.range(0)), rate = static_cast<int>(state.range(1)),
              block = static_cast<int>(state.range(2));
    ZitaSetup* z = zitaFor(mode, rate);
    if (z == nullptr) {
        state.SkipWithError("zita-convolver could not start");
        return;
    }
    Convproc& conv = z->conv;
    const int quantum = 64;
    const int blocks = 256;
    std::vector<float> in = noise(2 * static_cast<size_t>(block) * blocks), out(2 * static_cast<size_t>(block));
    size_t b = 0;
    for (auto _ : state) {
        const float* src = in.data() + 2 * static_cast<size_t>(block) * (b++ % blocks);
        for (int at = 0; at < block; at += quantum) {
            float* il = conv.inpdata(0);
            float* ir = conv.inpdata(1);
            for (int i = 0; i < quantum; ++i) {
                il[i] = src[2 * (at + i)];
                ir[i] = src[2 * (at + i) + 1];
            }
            conv.process(true);  // offline: wait for late partitions rather than drop them
            const float* ol = conv.outdata(0);
            const float* orr = conv.outdata(1);
            for (int i = 0; i < quantum; ++i) {
                out[2 * (at + i)] = ol[i];
                out[2 * (at + i) + 1] = orr[i];
            }
        }
        benchmark::DoNotOptimize(out.data());
    }
    state.counters["x_realtime"] =
        benchmark::Counter(static_cast<double>(block) / rate, benchmark::Counter::kIsIterationInvariantRate);
    state.SetLabel(std::string("zita-convolver, ") + kAlgorithmNames[mode]);
}

void BM_Prepare(benchmark::State& state) {
    const int mode = static_cast<int>(state.range(0)), rate = static_cast<int>(state.range(1));
    ReverbCore core;
    setDecay100(core, mode, rate);
    int decay = 100;
    for (auto _ : state) {
        decay = decay == 100 ? 99 : 100;
        core.setValue(kDecay, decay);  // prepares the response again
    }
    state.SetLabel(kAlgorithmNames[mode]);
}

void Sizes(benchmark::internal::Benchmark* b) {
    for (int mode : {3, 4, 5})
        for (int rate : {44100, 48000})
            for (int block : {64, 512, 4096}) b->Args({mode, rate, block});
}

}  // namespace

BENCHMARK(BM_Ulvetta)->Apply(Sizes)->UseRealTime()->Unit(benchmark::kMicrosecond);
BENCHMARK(BM_Zita)->Apply(Sizes)->UseRealTime()->Unit(benchmark::kMicrosecond);
BENCHMARK(BM_Prepare)
    ->ArgsProduct({{3, 4, 5}, {22050, 44100, 48000, 96000}})
    ->UseRealTime()
    ->Unit(benchmark::kMillisecond);

BENCHMARK_MAIN();
