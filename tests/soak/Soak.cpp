// ulvetta-soak: every algorithm streams audio offline through one ReverbCore in blocks of random sizes while a
// second thread changes every parameter at random (values, texts, positions, state loads, algorithm switches)
// and a third reads meters, status and texts as the editor does. Runs change the rate between them. It checks
// that the output stays finite and free of denormals, that nothing deadlocks (a watchdog), that every tail ends
// once the changes stop, and that memory stays flat; it prints the peak resident size over time.
//
// ulvetta-soak [--plate-hours H] [--room-hours H] [--seed N]: H hours of audio per plate-like algorithm (0, 1,
// 2, 6, 7) and per convolution room (3, 4, 5). Exit status 0 when every check held.
#include <atomic>
#include <chrono>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <mutex>
#include <random>
#include <string>
#include <thread>
#include <vector>

#include <unistd.h>

#include "filter/CoreState.h"
#include "filter/ParamTable.h"
#include "filter/ReverbCore.h"

namespace {

using namespace ulvetta;
using Clock = std::chrono::steady_clock;

constexpr int kRates[] = {8000, 22050, 32000, 44100, 44101, 48000, 88200, 96000, 192000};
constexpr int kMaxBlock = 4096;
// The longest tail the settings allow (Decay 100, no damping, the largest room) runs over two minutes; the
// renderer gives a tail ten minutes, and so does the soak.
constexpr double kTailLimitSeconds = 600.0;

std::atomic<long long> gProgress{0};  // frames processed, for the watchdog
std::atomic<bool> gFailed{false};

void fail(const char* what, int algorithm, int rate, long long frame) {
  std::fprintf(stderr, "ulvetta-soak: %s (algorithm %d, %d Hz, frame %lld)\n", what, algorithm, rate, frame);
  gFailed = true;
}

long residentKiB() {
  std::ifstream statm("/proc/self/statm");
  long pages = 0, resident = 0;
  statm >> pages >> resident;
  return resident * (sysconf(_SC_PAGESIZE) / 1024);
}

bool bad(float v) { return !std::isfinite(v) || (v != 0.0f && std::fabs(v) < 1.17549435e-38f); }

// Changes parameters at random until told to stop; paused (and idle) while a tail is being drained.
void changeParameters(ReverbCore& core, std::atomic<bool>& stop, std::atomic<bool>& pause, unsigned seed) {
  std::mt19937 gen(seed);
  auto pick = [&](int n) { return static_cast<int>(gen() % static_cast<unsigned>(n)); };
  const char* texts[] = {"0", "-Inf.", "Off", "12.5", "-3", "1e9", "-1e9", "nan", "", "abc", "0.05", "99999", "."};
  uint8_t record[kCoreStateSize];
  while (!stop) {
    if (pause) {
      std::this_thread::sleep_for(std::chrono::milliseconds(1));
      continue;
    }
    const int32_t id = pick(kParamCount);
    const ParamDesc& d = kParamTable[id];
    switch (pick(7)) {
      case 0: core.setValue(id, d.minimum + pick(d.maximum - d.minimum + 1)); break;
      case 1: core.setValueText(id, texts[pick(static_cast<int>(std::size(texts)))]); break;
      case 2: core.setNormalized(id, std::uniform_real_distribution<float>(-0.5f, 1.5f)(gen)); break;
      case 3: core.notifyHost(id, std::uniform_real_distribution<float>(0.0f, 1.0f)(gen)); break;
      case 4:
        // A state record: the current one with a value changed, or one damaged at random.
        core.saveState(record);
        record[20 + 4 * pick(kParamCount) + pick(4)] = static_cast<uint8_t>(gen());
        if (pick(4) == 0) record[pick(kCoreStateSize)] ^= static_cast<uint8_t>(1u << pick(8));
        core.loadState(record, kCoreStateSize);
        break;
      case 5: core.setValueAndNotify(id, d.minimum + pick(d.maximum - d.minimum + 1)); break;
      default: std::this_thread::sleep_for(std::chrono::microseconds(pick(2000))); break;
    }
  }
}

// Reads what the editor reads, as often as a busy editor might.
void readStatus(ReverbCore& core, std::atomic<bool>& stop) {
  char text[ReverbCore::kTextCapacity];
  uint8_t record[kCoreStateSize];
  while (!stop) {
    core.getStatus(kStatusLevel);
    core.getStatus(kStatusLoad);
    core.getStatus(kStatusStopped);
    for (int32_t id = 0; id < kParamCount; ++id) {
      core.getValueText(id, text, id & 1);
      core.getNormalized(id);
    }
    core.saveState(record);
    std::this_thread::sleep_for(std::chrono::milliseconds(5));
  }
}

// One run: algorithm at rate for frames of audio with changes from the other threads, then its tail.
void run(ReverbCore& core, int algorithm, int rate, long long frames, std::mt19937& gen, std::atomic<bool>& pause) {
  pause = true;
  core.stopStreaming();
  core.setFormat(static_cast<float>(rate), 0, 2, 2);
  core.setValue(kAlgorithm, algorithm);
  core.applyAll();
  core.startStreaming();
  pause = false;
  std::vector<float> in(2 * kMaxBlock), out(2 * kMaxBlock);
  std::uniform_real_distribution<float> noise(-1.0f, 1.0f);
  long long done = 0;
  float level = 0.5f;
  while (done < frames && !gFailed) {
    const int n = 1 + static_cast<int>(gen() % kMaxBlock);
    if (gen() % 64 == 0) level = std::pow(10.0f, -static_cast<float>(gen() % 120) / 20.0f) * (gen() % 8 ? 1.0f : 0.0f);
    for (int i = 0; i < 2 * n; ++i) in[i] = level * noise(gen);
    if (gen() % 512 == 0) in[gen() % (2 * n)] = (gen() % 2) ? 3e38f : NAN;  // a wild sample now and then
    // The algorithm may have been switched by the other thread; switch back now and then.
    if (gen() % 256 == 0) core.setValue(kAlgorithm, algorithm);
    core.processStereo(in.data(), in.data() + 1, out.data(), out.data() + 1, n, 2, 0, 0, 0);
    for (int i = 0; i < 2 * n; ++i)
      if (bad(out[i])) return fail("non-finite or denormal output", algorithm, rate, done + i / 2);
    done += n;
    gProgress += n;
  }
  // The tail, with the changes paused: it must end.
  pause = true;
  std::fill(in.begin(), in.end(), 0.0f);
  long long tail = 0;
  for (;;) {
    const int produced = core.processStereo(in.data(), in.data() + 1, out.data(), out.data() + 1, kMaxBlock, 2, 0, 1, 0);
    for (int i = 0; i < 2 * std::max(produced, 0); ++i)
      if (bad(out[i])) return fail("non-finite or denormal output in the tail", algorithm, rate, done + tail + i / 2);
    tail += kMaxBlock;
    gProgress += kMaxBlock;
    if (produced < kMaxBlock) break;
    if (tail > kTailLimitSeconds * rate) return fail("the tail did not end", algorithm, rate, done + tail);
  }
}

}  // namespace

int main(int argc, char** argv) {
  double plateHours = 24.0, roomHours = 1.0;
  unsigned seed = 1;
  for (int i = 1; i + 1 < argc; i += 2) {
    const std::string a = argv[i];
    if (a == "--plate-hours") plateHours = std::atof(argv[i + 1]);
    else if (a == "--room-hours") roomHours = std::atof(argv[i + 1]);
    else if (a == "--seed") seed = static_cast<unsigned>(std::atol(argv[i + 1]));
    else {
      std::fprintf(stderr, "usage: ulvetta-soak [--plate-hours H] [--room-hours H] [--seed N]\n");
      return 2;
    }
  }
  ReverbCore core;
  std::atomic<bool> stop{false}, pause{true};
  std::thread changer(changeParameters, std::ref(core), std::ref(stop), std::ref(pause), seed + 1);
  std::thread reader(readStatus, std::ref(core), std::ref(stop));
  // Watchdog: no frame processed for 60 s means something waits for ever.
  std::thread watchdog([&] {
    long long last = -1;
    auto since = Clock::now();
    while (!stop) {
      std::this_thread::sleep_for(std::chrono::milliseconds(200));
      const long long now = gProgress;
      if (now != last) {
        last = now;
        since = Clock::now();
      } else if (Clock::now() - since > std::chrono::seconds(60)) {
        std::fprintf(stderr, "ulvetta-soak: no progress for 60 s: a deadlock\n");
        std::_Exit(3);
      }
    }
  });

  std::mt19937 gen(seed);
  const auto start = Clock::now();
  long firstPeak = 0, peak = 0;
  for (int algorithm = 0; algorithm < kAlgorithmCount && !gFailed; ++algorithm) {
    const bool room = algorithm >= 3 && algorithm <= 5;
    const double hours = room ? roomHours : plateHours;
    // Runs of up to ten minutes of audio, each at a rate of its own.
    double left = hours * 3600.0;
    while (left > 0.0 && !gFailed) {
      const int rate = kRates[gen() % std::size(kRates)];
      const double seconds = std::min(left, 600.0);
      run(core, algorithm, rate, static_cast<long long>(seconds * rate), gen, pause);
      left -= seconds;
      const long rss = residentKiB();
      peak = std::max(peak, rss);
      if (!firstPeak) firstPeak = rss;
    }
    const double elapsed = std::chrono::duration<double>(Clock::now() - start).count();
    std::printf("algorithm %d: %.2f h of audio, %.0f s elapsed, resident %ld KiB (peak %ld KiB)\n", algorithm,
                hours, elapsed, residentKiB(), peak);
    std::fflush(stdout);
  }
  stop = true;
  changer.join();
  reader.join();
  watchdog.join();
  // Flat memory: the convolution rooms hold their prepared responses, so the bound is the first run's peak
  // plus room for the largest networks and responses at 192 kHz.
  const long bound = firstPeak + 256 * 1024;
  if (peak > bound) {
    std::fprintf(stderr, "ulvetta-soak: resident size grew to %ld KiB (first run %ld KiB)\n", peak, firstPeak);
    return 1;
  }
  if (gFailed) return 1;
  std::printf("ulvetta-soak: every check held (peak resident %ld KiB)\n", peak);
  return 0;
}
