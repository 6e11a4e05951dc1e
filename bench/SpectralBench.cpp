// Forward-plus-inverse real transform pairs of 2^6 .. 2^17 points: our FFT library, FFTW 3 (single
// precision, FFTW_MEASURE, out of place) and KissFFT (kiss_fftr), registered size by size so that the
// three run side by side under the same machine load. Ends with a table of ns per pair and the ratios.
#include <benchmark/benchmark.h>
#include <fftw3.h>
#include <kiss_fftr.h>

#include <cstdio>
#include <map>
#include <random>
#include <string>
#include <vector>

#include "spectral/FftTables.h"
#include "spectral/Nsp.h"

namespace {

constexpr int kMinOrder = 6;
constexpr int kMaxOrder = 17;

std::vector<float> noise(std::size_t n) {
    std::mt19937 gen(1234);
    std::uniform_real_distribution<float> d(-1.0f, 1.0f);
    std::vector<float> v(n);
    for (auto& x : v) x = d(gen);
    return v;
}

void ulvettaPair(benchmark::State& state) {
    const int order = static_cast<int>(state.range(0));
    std::vector<float> buf = noise(std::size_t(1) << order);
    ulvetta::nspsRealFftl(nullptr, order, ulvetta::FlagInitOnly);
    for (auto _ : state) {
        ulvetta::nspsRealFftl(buf.data(), order, ulvetta::FlagForward | ulvetta::FlagOutPerm);
        ulvetta::nspsCcsFftl(buf.data(), order, ulvetta::FlagInverse | ulvetta::FlagInPerm);
        benchmark::DoNotOptimize(buf.data());
        benchmark::ClobberMemory();
    }
}

// The same with the SSE2 kernels, which every x86-64 processor runs.
void ulvettaSse2Pair(benchmark::State& state) {
    const ulvetta::spectral::Isa before = ulvetta::spectral::activeIsa();
    if (!ulvetta::spectral::selectIsa(ulvetta::spectral::Isa::Sse2)) {
        state.SkipWithError("no SSE2 kernels in this build");
        return;
    }
    ulvettaPair(state);
    ulvetta::spectral::selectIsa(before);
}

void fftwPair(benchmark::State& state) {
    const int order = static_cast<int>(state.range(0));
    const int n = 1 << order;
    float* in = fftwf_alloc_real(n);
    float* out = fftwf_alloc_real(n);
    fftwf_complex* spectrum = fftwf_alloc_complex(n / 2 + 1);
    fftwf_plan fwd = fftwf_plan_dft_r2c_1d(n, in, spectrum, FFTW_MEASURE);
    fftwf_plan inv = fftwf_plan_dft_c2r_1d(n, spectrum, out, FFTW_MEASURE);
    const std::vector<float> x = noise(std::size_t(n));
    std::copy(x.begin(), x.end(), in);
    for (auto _ : state) {
        fftwf_execute(fwd);
        fftwf_execute(inv);  // unscaled; it reads only spectrum, so the input never grows
        benchmark::DoNotOptimize(out);
        benchmark::ClobberMemory();
    }
    fftwf_destroy_plan(fwd);
    fftwf_destroy_plan(inv);
    fftwf_free(in);
    fftwf_free(out);
    fftwf_free(spectrum);
}

void kissPair(benchmark::State& state) {
    const int order = static_cast<int>(state.range(0));
    const int n = 1 << order;
    kiss_fftr_cfg fwd = kiss_fftr_alloc(n, 0, nullptr, nullptr);
    kiss_fftr_cfg inv = kiss_fftr_alloc(n, 1, nullptr, nullptr);
    const std::vector<float> in = noise(std::size_t(n));
    std::vector<float> out(static_cast<std::size_t>(n));
    std::vector<kiss_fft_cpx> spectrum(std::size_t(n) / 2 + 1);
    for (auto _ : state) {
        kiss_fftr(fwd, in.data(), spectrum.data());
        kiss_fftri(inv, spectrum.data(), out.data());
        benchmark::DoNotOptimize(out.data());
        benchmark::ClobberMemory();
    }
    kiss_fftr_free(fwd);
    kiss_fftr_free(inv);
}

void spectrumProduct(benchmark::State& state) {
    const int order = static_cast<int>(state.range(0));
    const std::vector<float> a = noise(std::size_t(1) << order);
    std::vector<float> b = a;
    for (auto _ : state) {
        b = a;
        ulvetta::nspsMpyRCPerm2(a.data(), b.data(), order);
        benchmark::DoNotOptimize(b.data());
    }
}

// One sample through a 64-tap FIR filter, the engine's direct head of each convolution channel.
void firSample(benchmark::State& state) {
    const std::vector<float> taps = noise(64), input = noise(4096);
    ulvetta::FirState fir;
    ulvetta::nspsFirInit(taps.data(), 64, nullptr, &fir);
    std::size_t n = 0;
    for (auto _ : state) {
        benchmark::DoNotOptimize(ulvetta::nspsFir(&fir, input[n]));
        n = (n + 1) & 4095;
    }
    ulvetta::nspFirFree(&fir);
}

// Collects CPU ns per pair by name ("ulvetta/12") while the console reporter prints as usual; a median
// of repetitions, when asked for, wins over single runs. CPU time, because on a shared machine the wall
// clock also counts the time other processes held the core.
class TableReporter : public benchmark::ConsoleReporter {
public:
    void ReportRuns(const std::vector<Run>& runs) override {
        for (const Run& r : runs) {
            if (r.error_occurred) continue;
            const bool median = r.run_type == Run::RT_Aggregate && r.aggregate_name == "median";
            if (r.run_type == Run::RT_Aggregate && !median) continue;
            std::string name = r.benchmark_name();
            name = name.substr(0, name.find("_median"));
            if (median || !medians_.count(name)) times_[name] = r.GetAdjustedCPUTime();
            if (median) medians_[name] = true;
        }
        ConsoleReporter::ReportRuns(runs);
    }
    void printTable() const {
        std::printf("\nReal FFT pairs (forward + inverse), CPU ns per pair, measured side by side; kernels: %s\n",
                    isaName());
        std::printf("%8s %12s %12s %12s %12s %10s %10s %10s\n", "points", "ulvetta", "ulv-sse2", "fftw3f",
                    "kissfft", "ulv/fftw", "sse2/fftw", "kiss/fftw");
        for (int order = kMinOrder; order <= kMaxOrder; ++order) {
            const double u = get("ulvetta", order), s = get("sse2", order), f = get("fftw", order),
                         k = get("kiss", order);
            if (u <= 0 || f <= 0) continue;
            std::printf("%8d %12.0f %12.0f %12.0f %12.0f %10.2f %10.2f %10.2f\n", 1 << order, u, s, f, k, u / f,
                        s / f, k / f);
        }
    }

private:
    double get(const char* who, int order) const {
        const auto it = times_.find(std::string(who) + "/" + std::to_string(order));
        return it == times_.end() ? 0.0 : it->second;
    }
    static const char* isaName() {
        switch (ulvetta::spectral::activeIsa()) {
        case ulvetta::spectral::Isa::Avx2: return "AVX2";
        case ulvetta::spectral::Isa::Sse2: return "SSE2";
        default: return "scalar";
        }
    }
    std::map<std::string, double> times_;
    std::map<std::string, bool> medians_;
};

}  // namespace

int main(int argc, char** argv) {
    for (int order = kMinOrder; order <= kMaxOrder; ++order) {
        benchmark::RegisterBenchmark("ulvetta", ulvettaPair)->Arg(order)->Unit(benchmark::kNanosecond);
        benchmark::RegisterBenchmark("sse2", ulvettaSse2Pair)->Arg(order)->Unit(benchmark::kNanosecond);
        benchmark::RegisterBenchmark("fftw", fftwPair)->Arg(order)->Unit(benchmark::kNanosecond);
        benchmark::RegisterBenchmark("kiss", kissPair)->Arg(order)->Unit(benchmark::kNanosecond);
    }
    benchmark::RegisterBenchmark("fir64", firSample)->Unit(benchmark::kNanosecond);
    benchmark::RegisterBenchmark("product", spectrumProduct)->Arg(10)->Arg(14)->Unit(benchmark::kNanosecond);
    benchmark::Initialize(&argc, argv);
    if (benchmark::ReportUnrecognizedArguments(argc, argv)) return 1;
    TableReporter reporter;
    benchmark::RunSpecifiedBenchmarks(&reporter);
    reporter.printTable();
    benchmark::Shutdown();
    return 0;
}
