// The LV2 plugin loaded from the build tree through lilv, as a host loads it: it must sound exactly like
// the renderer, restore a session exactly, ring out when the signal stops and start clean after activation.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <random>
#include <string>
#include <vector>

#include "Lv2Host.h"
#include "Lv2Ports.h"
#include "cli/CliHarness.h"
#include "filter/ReverbCore.h"

namespace ulvetta::testing {
namespace {

using lv2::kParamSymbols;

// Planar stereo.
struct Stereo {
  std::vector<float> left, right;
  size_t frames() const { return left.size(); }
};

// A burst of noise with a different sine on each side, then silence: frames long at rate.
Stereo testSignal(int rate, size_t frames) {
  std::mt19937 gen(7);
  std::uniform_real_distribution<float> noise(-0.5f, 0.5f);
  Stereo s{std::vector<float>(frames), std::vector<float>(frames)};
  for (size_t i = 0; i < frames / 2; ++i) {
    s.left[i] = noise(gen) + 0.25f * std::sin(2.0f * 3.14159265f * 440.0f * i / rate);
    s.right[i] = noise(gen) + 0.25f * std::sin(2.0f * 3.14159265f * 660.0f * i / rate);
  }
  return s;
}

// Runs the signal through the host in blocks of block frames (the last one shorter, as a file ends), then
// silence in whole blocks up to total frames. The cycle boundaries matter: the networks clean their tiny
// states at the end of each block, so the test cuts the cycles where the renderer does.
Stereo runPlugin(Lv2Host& host, const Stereo& in, uint32_t block, size_t total) {
  Stereo out{std::vector<float>(total + block), std::vector<float>(total + block)};
  std::vector<float> l(block), r(block);
  for (size_t done = 0; done < total;) {
    const bool input = done < in.frames();
    const uint32_t n = input ? static_cast<uint32_t>(std::min<size_t>(block, in.frames() - done)) : block;
    std::fill(l.begin(), l.end(), 0.0f);
    std::fill(r.begin(), r.end(), 0.0f);
    if (input) {
      std::copy_n(in.left.begin() + done, n, l.begin());
      std::copy_n(in.right.begin() + done, n, r.begin());
    }
    host.run(l.data(), r.data(), out.left.data() + done, out.right.data() + done, n);
    done += n;
  }
  out.left.resize(total);
  out.right.resize(total);
  return out;
}

// Sets every parameter port to the value a fresh core holds after selecting algorithm, in the port's units.
void setAlgorithmPorts(Lv2Host& host, int algorithm) {
  ReverbCore core;
  core.setValue(kAlgorithm, algorithm);
  for (int32_t id = 0; id < kParamCount; ++id) {
    const double steps = core.getValue(id);
    const double shown = id == kAlgorithm || id == kMeterSource ? steps : steps / kParamTable[id].scale;
    ASSERT_TRUE(host.setControl(kParamSymbols[id], static_cast<float>(shown))) << kParamSymbols[id];
  }
}

class Lv2PluginTest : public CliTest {
 protected:
  // The frames of out that differ from the renderer's interleaved output, and the first of them.
  static std::pair<long long, long long> mismatches(const Stereo& out, const Audio& expected) {
    long long count = 0, first = -1;
    for (long long i = 0; i < expected.frames(); ++i) {
      if (out.left[i] != expected.floats[2 * i] || out.right[i] != expected.floats[2 * i + 1]) {
        if (first < 0) first = i;
        ++count;
      }
    }
    return {count, first};
  }

  // Writes the signal as a float WAV and renders it with ulvetta; returns the renderer's output.
  Audio render(const Stereo& in, int rate, const std::vector<std::string>& options) {
    std::vector<float> interleaved;
    for (size_t i = 0; i < in.frames(); ++i) interleaved.insert(interleaved.end(), {in.left[i], in.right[i]});
    write("in.wav", rate, 2, interleaved);
    std::vector<std::string> args = {"render", "in.wav", "out.wav"};
    args.insert(args.end(), options.begin(), options.end());
    const RunResult r = run(args);
    EXPECT_EQ(r.status, 0) << r.err;
    return read("out.wav");
  }
};

TEST_F(Lv2PluginTest, SoundsExactlyLikeTheRendererForEveryAlgorithmRateAndBlock) {
  for (int rate : {44100, 96000}) {
    const Stereo in = testSignal(rate, static_cast<size_t>(rate / 5));
    for (uint32_t block : {64u, 1000u}) {
      for (int algorithm = 0; algorithm < kAlgorithmCount; ++algorithm) {
        SCOPED_TRACE("rate " + std::to_string(rate) + ", block " + std::to_string(block) + ", algorithm " +
                     std::to_string(algorithm));
        const Audio expected =
            render(in, rate, {"--algorithm", std::to_string(algorithm), "--block", std::to_string(block)});
        ASSERT_EQ(expected.channels, 2);
        Lv2Host host({ULVETTA_LV2_BUNDLE}, lv2::kPluginUri, rate);
        ASSERT_TRUE(host.ok());
        setAlgorithmPorts(host, algorithm);
        host.activate();
        const Stereo out = runPlugin(host, in, block, static_cast<size_t>(expected.frames()));
        const auto [count, first] = mismatches(out, expected);
        EXPECT_EQ(count, 0) << "first differing frame " << first << " of " << expected.frames();
      }
    }
  }
}

// Settings edited as the renderer's --set edits them, saved as a user preset, exported as an LV2 preset and
// applied by the host: the plugin sounds like the renderer given the preset file.
TEST_F(Lv2PluginTest, AnExportedUserPresetSoundsLikeItsSettingsFile) {
  const RunResult saved = run(sets({"presets", "--dir", "p", "save", "Dark Hall", "--algorithm", "5"},
                                   {"Decay=80", "Notch Q=0.7", "Output Level Wet=-9.5", "Low Pass Freq=6500",
                                    "Early Reflections=-Inf.", "Input Gain=-3.5"}));
  ASSERT_EQ(saved.status, 0) << saved.err;
  const RunResult exported = run({"presets", "--dir", "p", "export-lv2", "user.lv2"});
  ASSERT_EQ(exported.status, 0) << exported.err;
  EXPECT_EQ(exported.out, "1 preset written to user.lv2\n");

  const int rate = 44100;
  const Stereo in = testSignal(rate, 10000);
  const Audio expected = render(in, rate, {"--state", "p/Dark Hall.stp", "--block", "500"});
  Lv2Host host({ULVETTA_LV2_BUNDLE, (dir_ / "user.lv2").string()}, lv2::kPluginUri, rate);
  ASSERT_TRUE(host.ok());
  ASSERT_TRUE(host.applyPreset(std::string(lv2::kPluginUri) + ":user-preset:Dark%20Hall"));
  EXPECT_EQ(host.control("decay"), 80.0f);
  host.activate();
  const auto [count, first] = mismatches(runPlugin(host, in, 500, static_cast<size_t>(expected.frames())), expected);
  EXPECT_EQ(count, 0) << "first differing frame " << first << " of " << expected.frames();
}

TEST_F(Lv2PluginTest, ASavedSessionRestoresExactly) {
  const int rate = 48000;
  const Stereo in = testSignal(rate, rate);
  auto configure = [](Lv2Host& host) {
    setAlgorithmPorts(host, 4);
    host.setControl("decay", 80.0f);
    host.setControl("wet", -9.5f);
    host.setControl("notch_q", 0.7f);
    host.setControl("low_pass", 6500.0f);
  };
  Lv2Host original({ULVETTA_LV2_BUNDLE}, lv2::kPluginUri, rate);
  ASSERT_TRUE(original.ok());
  configure(original);
  original.activate();
  const Stereo reference = runPlugin(original, in, 512, in.frames());
  LilvState* saved = original.saveState();
  ASSERT_NE(saved, nullptr);
  char* text = lilv_state_to_string(original.world(), original.urids().map(), original.urids().unmap(), saved,
                                    "urn:ulvetta:test-session", nullptr);
  lilv_state_free(saved);
  ASSERT_NE(text, nullptr);
  EXPECT_NE(std::string(text).find("urn:ulvetta:reverb#settings"), std::string::npos);

  // A new host starts from the defaults and gets the session back.
  Lv2Host restored({ULVETTA_LV2_BUNDLE}, lv2::kPluginUri, rate);
  ASSERT_TRUE(restored.ok());
  LilvState* loaded = lilv_state_new_from_string(restored.world(), restored.urids().map(), text);
  lilv_free(text);
  ASSERT_NE(loaded, nullptr);
  restored.restoreState(loaded);
  lilv_state_free(loaded);
  EXPECT_EQ(restored.control("decay"), 80.0f);
  restored.activate();
  const Stereo again = runPlugin(restored, in, 512, in.frames());
  EXPECT_EQ(again.left, reference.left);
  EXPECT_EQ(again.right, reference.right);
}

TEST_F(Lv2PluginTest, RingsOutAfterTheSignalAndStartsCleanAfterActivation) {
  const int rate = 44100;
  const Stereo in = testSignal(rate, rate / 5);  // 0.1 s of signal, 0.1 s of silence
  Lv2Host host({ULVETTA_LV2_BUNDLE}, lv2::kPluginUri, rate);
  ASSERT_TRUE(host.ok());
  setAlgorithmPorts(host, 0);
  host.activate();
  const Stereo first = runPlugin(host, in, 256, static_cast<size_t>(rate));
  // The tail goes on after the input's last sample and fades.
  auto energy = [&](size_t from, size_t to) {
    double e = 0.0;
    for (size_t i = from; i < to; ++i) e += first.left[i] * first.left[i] + first.right[i] * first.right[i];
    return e;
  };
  EXPECT_GT(energy(rate / 5, rate / 2), 1e-3);
  EXPECT_LT(energy(rate / 2, rate), energy(rate / 5, rate / 2));
  // Deactivated mid-tail and activated again, it starts from silence: the same input gives the same output.
  host.deactivate();
  host.activate();
  const Stereo second = runPlugin(host, in, 256, static_cast<size_t>(rate));
  EXPECT_EQ(second.left, first.left);
  EXPECT_EQ(second.right, first.right);
  EXPECT_GT(host.control("load"), 0.0f);
  EXPECT_EQ(host.control("latency"), 0.0f);
}

}  // namespace
}  // namespace ulvetta::testing
