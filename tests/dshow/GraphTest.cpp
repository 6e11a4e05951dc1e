// Ulvetta.ax registered and run in real graphs of the platform's DirectShow: output equal to the
// command-line renderer's for the same file and settings, the tail drain, and seeking through the filter.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <fstream>

#include "GraphHost.h"
#include "filter/CoreState.h"
#include "filter/ReverbCore.h"

using namespace ulvetta;
using namespace ulvetta::test;

namespace {

const std::string kCases = ULVETTA_GRAPH_CASES;

HRESULT CallExport(const char* name) {
    static HMODULE module = LoadLibraryW(WinePath(ULVETTA_AX_PATH).c_str());
    auto fn = reinterpret_cast<HRESULT(WINAPI*)()>(reinterpret_cast<void*>(GetProcAddress(module, name)));
    return fn ? fn() : E_NOTIMPL;
}

// Registers the module for the graph tests and removes it afterwards.
class Registered : public ::testing::Environment {
public:
    void SetUp() override { ASSERT_EQ(CallExport("DllRegisterServer"), S_OK); }
    void TearDown() override { CallExport("DllUnregisterServer"); }
};
const auto* const g_env = ::testing::AddGlobalTestEnvironment(new Registered);

std::vector<unsigned char> ReadFile(const std::string& path) {
    std::ifstream f(path, std::ios::binary);
    return std::vector<unsigned char>((std::istreambuf_iterator<char>(f)), std::istreambuf_iterator<char>());
}

}  // namespace

TEST(Server, UnregisteringRemovesEveryKeyAndTheModuleUnloadsOnlyWhenUnused) {
    ASSERT_EQ(CallExport("DllUnregisterServer"), S_OK);
    for (const wchar_t* key : {L"CLSID\\{3818A521-3F15-11D5-9EDA-0010B5071E57}",
                               L"CLSID\\{3818A522-3F15-11D5-9EDA-0010B5071E57}",
                               L"Filter\\{3818A521-3F15-11D5-9EDA-0010B5071E57}"}) {
        HKEY k = nullptr;
        EXPECT_NE(RegOpenKeyExW(HKEY_CLASSES_ROOT, key, 0, KEY_READ, &k), ERROR_SUCCESS) << key;
    }
    ASSERT_EQ(CallExport("DllRegisterServer"), S_OK);
    ComRef<IBaseFilter> filter;
    ASSERT_EQ(Create(CLSID_UlvettaFilter, filter), S_OK);  // through the registered server
    ComRef<IPropertyPage> page;
    EXPECT_EQ(Create(CLSID_UlvettaPropertyPage, page), S_OK);
    EXPECT_EQ(CallExport("DllCanUnloadNow"), S_FALSE);
    filter.reset();
    page.reset();
    EXPECT_EQ(CallExport("DllCanUnloadNow"), S_OK);
}

// Each case: a WAV file, a settings record and the command-line renderer's output for them (raw floats),
// made by the fixture script.
TEST(Graph, OutputEqualsTheCommandLineRendererAndTheTailDrains) {
    std::ifstream list(kCases + "/cases.txt");
    ASSERT_TRUE(list.good()) << "no graph cases in " << kCases;
    int cases = 0;
    for (std::string name, wav, state, ref; list >> name >> wav >> state >> ref;) {
        SCOPED_TRACE(name);
        ++cases;
        GraphOptions options;
        options.state = ReadFile(kCases + "/" + state);
        GraphResult r = RunGraph(WinePath(kCases + "/" + wav), options);
        ASSERT_EQ(r.hr, S_OK) << r.step;
        ASSERT_TRUE(r.completed);
        // Float files reach the filter as WAVE_FORMAT_EXTENSIBLE; downstream gets a copy of that type.
        const bool pcm16 = name.find("s16") != std::string::npos;
        EXPECT_EQ(r.format.wFormatTag, pcm16 ? WAVE_FORMAT_PCM : WAVE_FORMAT_EXTENSIBLE);
        EXPECT_EQ(r.format.cbSize, 0);
        const std::vector<unsigned char> raw = ReadFile(kCases + "/" + ref);
        std::vector<float> expected(raw.size() / 4);
        std::memcpy(expected.data(), raw.data(), raw.size() / 4 * 4);
        ASSERT_GT(expected.size(), 0u);
        // The two builds use different maths libraries (sin, cos, pow, exp): coefficients may differ in the
        // last bit, which can move a 16-bit result across one truncation step, or a float one by far less.
        const float step = 1.0f / 32768.0f;
        const float tolerance = pcm16 ? step + 1e-9f : 2e-6f;
        const size_t common = std::min(expected.size(), r.samples.size());
        for (size_t i = 0; i < common; ++i)
            ASSERT_LE(std::fabs(r.samples[i] - expected[i]), tolerance) << "at sample " << i << " of " << common;
        // The tail ends at a block boundary once a block after the input falls below -313 dB, and the parser
        // and the renderer cut blocks differently: either output may run on past the other's end, with every
        // sample there below one 16-bit step (in a 16-bit stream, at most the one step rounding makes).
        const std::vector<float>& longer = r.samples.size() > expected.size() ? r.samples : expected;
        for (size_t i = common; i < longer.size(); ++i) {
            const float v = std::fabs(longer[i]);
            ASSERT_TRUE(pcm16 ? v <= step : v < step) << "beyond the shorter output, sample " << i << ": " << v;
        }
    }
    EXPECT_GE(cases, 8);
}

TEST(Graph, SeekingPassesThroughAndASeekAfterTheEndPlaysOnUntrimmed) {
    ReverbCore core;
    core.setValue(kOutputLevelWet, -600);  // dry only: every input frame shows in the output
    std::vector<unsigned char> state(kCoreStateSize);
    core.saveState(state.data());
    GraphOptions options;
    options.state = state;
    options.replay = true;
    GraphResult r = RunGraph(WinePath(kCases + "/dc-silence-44100-f32.wav"), options);
    ASSERT_EQ(r.hr, S_OK) << r.step;
    EXPECT_EQ(r.duration, 6000000);  // 0.6 s, from the parser through the output pin's pass-through
    ASSERT_TRUE(r.completed);
    // The file is 26460 frames, the second half silent. After the seek it plays whole once more: its
    // silent blocks are not trimmed away as if they were the tail of the ended stream.
    EXPECT_EQ(r.firstPassSamples, 2u * 26460);
    EXPECT_EQ(r.samples.size() - r.firstPassSamples, 2u * 26460);
    size_t dc = 0;
    for (size_t i = r.firstPassSamples; i < r.samples.size(); ++i) dc += r.samples[i] == 0.5f;
    EXPECT_EQ(dc, 2u * 13230);
}
