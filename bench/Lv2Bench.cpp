// The LV2 plugin beside Dragonfly's plate and room reverbs (Debian's dragonfly-reverb-lv2), all through the
// same offline lilv host at 44100 Hz in 64-frame blocks, as a host with a small buffer runs them. Each
// iteration processes one second of noise; "rtf" is seconds of audio per CPU second. Ours run with each
// algorithm's factory settings (the argument), the peers with their own defaults.
#include <benchmark/benchmark.h>

#include <random>
#include <string>
#include <vector>

#include "Lv2Ports.h"
#include "filter/ReverbCore.h"
#include "lv2/Lv2Host.h"

namespace {

using ulvetta::testing::Lv2Host;

constexpr int kRate = 44100;
constexpr uint32_t kBlock = 64;

void RunSeconds(benchmark::State& state, Lv2Host& host) {
  if (!host.ok()) {
    state.SkipWithError("the plugin is not installed or did not load");
    return;
  }
  host.activate();
  std::mt19937 gen(1);
  std::uniform_real_distribution<float> noise(-0.5f, 0.5f);
  std::vector<float> inL(kRate), inR(kRate), outL(kBlock), outR(kBlock);
  for (int i = 0; i < kRate; ++i) {
    inL[i] = noise(gen);
    inR[i] = noise(gen);
  }
  for (auto _ : state) {
    for (uint32_t done = 0; done + kBlock <= kRate; done += kBlock)
      host.run(&inL[done], &inR[done], outL.data(), outR.data(), kBlock);
    benchmark::DoNotOptimize(outL.data());
  }
  state.counters["rtf"] = benchmark::Counter(static_cast<double>(state.iterations()), benchmark::Counter::kIsRate);
}

void BM_Ulvetta(benchmark::State& state) {
  Lv2Host host({ULVETTA_LV2_BUNDLE}, ulvetta::lv2::kPluginUri, kRate);
  const int algorithm = static_cast<int>(state.range(0));
  ulvetta::ReverbCore core;
  core.setValue(ulvetta::kAlgorithm, algorithm);
  for (int32_t id = 0; id < ulvetta::kParamCount; ++id)
    host.setControl(ulvetta::lv2::kParamSymbols[id], static_cast<float>(ulvetta::lv2::portValueOf(id, core.getValue(id))));
  state.SetLabel(ulvetta::kAlgorithmNames[algorithm]);
  RunSeconds(state, host);
}
BENCHMARK(BM_Ulvetta)->DenseRange(0, 7)->Unit(benchmark::kMillisecond);

void BM_DragonflyPlate(benchmark::State& state) {
  Lv2Host host({}, "urn:dragonfly:plate", kRate);
  RunSeconds(state, host);
}
BENCHMARK(BM_DragonflyPlate)->Unit(benchmark::kMillisecond);

void BM_DragonflyRoom(benchmark::State& state) {
  Lv2Host host({}, "urn:dragonfly:room", kRate);
  RunSeconds(state, host);
}
BENCHMARK(BM_DragonflyRoom)->Unit(benchmark::kMillisecond);

}  // namespace

BENCHMARK_MAIN();
