// Ulvetta.ax registered and run in real graphs of the platform's DirectShow: registration, the class
// factory, output equal to the command-line renderer's for the same file and settings, the tail drain,
// and seeking through the filter.
#include <windows.h>
#include <dshow.h>
#include <mmreg.h>

#include <gtest/gtest.h>

#include <cmath>
#include <algorithm>
#include <cstring>
#include <fstream>
#include <sstream>
#include <string>
#include <vector>

#include "GraphHost.h"
#include "filter/CoreState.h"
#include "filter/ReverbCore.h"
#include "filter/dshow/DShowUtil.h"
#include "filter/dshow/Interfaces.h"

using namespace ulvetta;
using namespace ulvetta::test;

namespace {

// Build paths arrive as POSIX paths; Wine maps the root to drive Z:.
std::wstring WinePath(const std::string& posix) {
    std::wstring w = L"Z:";
    for (char c : posix) w += (c == '/') ? L'\\' : static_cast<wchar_t>(c);
    return w;
}

std::string CasesDir() { return ULVETTA_GRAPH_CASES; }

using RegisterFn = HRESULT(WINAPI*)();

HMODULE Module() {
    static HMODULE m = LoadLibraryW(ModulePath().c_str());
    return m;
}

HRESULT CallExport(const char* name) {
    auto fn = reinterpret_cast<RegisterFn>(reinterpret_cast<void*>(GetProcAddress(Module(), name)));
    return fn ? fn() : E_NOTIMPL;
}

bool KeyExists(const std::wstring& path) {
    HKEY k = nullptr;
    if (RegOpenKeyExW(HKEY_CLASSES_ROOT, path.c_str(), 0, KEY_READ, &k) != ERROR_SUCCESS) return false;
    RegCloseKey(k);
    return true;
}

std::wstring StringValue(const std::wstring& path, const wchar_t* name) {
    wchar_t data[1024] = {};
    DWORD bytes = sizeof data;
    if (RegGetValueW(HKEY_CLASSES_ROOT, path.c_str(), name, RRF_RT_REG_SZ, nullptr, data, &bytes) != ERROR_SUCCESS)
        return L"<missing>";
    return data;
}

const std::wstring kFilterKey = L"CLSID\\{3818A521-3F15-11D5-9EDA-0010B5071E57}";
const std::wstring kPageKey = L"CLSID\\{3818A522-3F15-11D5-9EDA-0010B5071E57}";

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

std::vector<float> ReadRawFloats(const std::string& path) {
    std::vector<unsigned char> b = ReadFile(path);
    std::vector<float> v(b.size() / 4);
    std::memcpy(v.data(), b.data(), v.size() * 4);
    return v;
}

}  // namespace

namespace ulvetta {
namespace test {
std::wstring ModulePath() { return WinePath(ULVETTA_AX_PATH); }
}  // namespace test
}  // namespace ulvetta

TEST(Registration, WritesOneSetOfKeysAndRemovesThemAll) {
    ASSERT_EQ(CallExport("DllRegisterServer"), S_OK);  // a second time
    EXPECT_EQ(StringValue(kFilterKey, nullptr), L"Morvane Ulvetta");
    EXPECT_EQ(StringValue(kPageKey, nullptr), L"Morvane Ulvetta Property Page");
    EXPECT_EQ(_wcsicmp(StringValue(kFilterKey + L"\\InprocServer32", nullptr).c_str(), ModulePath().c_str()), 0);
    EXPECT_EQ(StringValue(kFilterKey + L"\\InprocServer32", L"ThreadingModel"), L"Both");
    EXPECT_EQ(StringValue(kPageKey + L"\\InprocServer32", L"ThreadingModel"), L"Both");
    EXPECT_TRUE(KeyExists(L"Filter\\{3818A521-3F15-11D5-9EDA-0010B5071E57}"));  // the filter-mapper record
    EXPECT_TRUE(KeyExists(kFilterKey + L"\\Pins\\Input"));
    EXPECT_TRUE(KeyExists(kFilterKey + L"\\Pins\\Output"));

    ASSERT_EQ(CallExport("DllUnregisterServer"), S_OK);
    EXPECT_FALSE(KeyExists(kFilterKey));
    EXPECT_FALSE(KeyExists(kPageKey));
    EXPECT_FALSE(KeyExists(L"Filter\\{3818A521-3F15-11D5-9EDA-0010B5071E57}"));
    ASSERT_EQ(CallExport("DllRegisterServer"), S_OK);
}

TEST(Server, ClassFactoryAndUnloading) {
    using GetClassObjectFn = HRESULT(WINAPI*)(REFCLSID, REFIID, void**);
    auto getClassObject =
        reinterpret_cast<GetClassObjectFn>(reinterpret_cast<void*>(GetProcAddress(Module(), "DllGetClassObject")));
    ASSERT_NE(getClassObject, nullptr);
    dshow::ComRef<IClassFactory> factory;
    ASSERT_EQ(getClassObject(CLSID_UlvettaFilter, IID_IClassFactory, reinterpret_cast<void**>(factory.put())), S_OK);
    EXPECT_EQ(CallExport("DllCanUnloadNow"), S_FALSE);
    dshow::ComRef<IBaseFilter> filter;
    ASSERT_EQ(factory->CreateInstance(nullptr, IID_IBaseFilter, reinterpret_cast<void**>(filter.put())), S_OK);
    IUnknown* outer = reinterpret_cast<IUnknown*>(0x1);
    void* p = nullptr;
    EXPECT_EQ(factory->CreateInstance(outer, IID_IBaseFilter, &p), E_NOINTERFACE);
    dshow::ComRef<IClassFactory> pageFactory;
    ASSERT_EQ(getClassObject(CLSID_UlvettaPropertyPage, IID_IClassFactory, reinterpret_cast<void**>(pageFactory.put())),
              S_OK);
    EXPECT_EQ(pageFactory->CreateInstance(nullptr, IID_IUnknown, &p), CLASS_E_CLASSNOTAVAILABLE);
    EXPECT_EQ(getClassObject(GUID_NULL, IID_IClassFactory, &p), CLASS_E_CLASSNOTAVAILABLE);
    filter.reset();
    factory.reset();
    pageFactory.reset();
    EXPECT_EQ(CallExport("DllCanUnloadNow"), S_OK);
}

// Each case: a WAV file, a settings record and the command-line renderer's output for them (raw floats),
// made by the fixture script.
TEST(Graph, OutputEqualsTheCommandLineRendererAndTheTailDrains) {
    std::ifstream list(CasesDir() + "/cases.txt");
    ASSERT_TRUE(list.good()) << "no graph cases in " << CasesDir();
    std::string line;
    int cases = 0;
    while (std::getline(list, line)) {
        std::istringstream fields(line);
        std::string name, wav, state, ref;
        fields >> name >> wav >> state >> ref;
        if (name.empty()) continue;
        SCOPED_TRACE(name);
        ++cases;
        GraphResult r = RunGraph(WinePath(CasesDir() + "/" + wav), ReadFile(CasesDir() + "/" + state));
        ASSERT_EQ(r.hr, S_OK) << r.step;
        ASSERT_TRUE(r.completed);
        // Float files reach the filter as WAVE_FORMAT_EXTENSIBLE; downstream gets a copy of that type.
        const bool pcm16 = name.find("s16") != std::string::npos;
        EXPECT_EQ(r.format.wFormatTag, pcm16 ? WAVE_FORMAT_PCM : WAVE_FORMAT_EXTENSIBLE);
        EXPECT_EQ(r.format.cbSize, 0);
        const std::vector<float> expected = ReadRawFloats(CasesDir() + "/" + ref);
        ASSERT_GT(expected.size(), 0u);
        // The two builds use different maths libraries (sin, cos, pow, exp): coefficients may differ in the
        // last bit, which can move a 16-bit result across one truncation step, or a float one by far less.
        const float step = 1.0f / 32768.0f;
        const float tolerance = pcm16 ? step + 1e-9f : 2e-6f;
        const size_t common = std::min(expected.size(), r.samples.size());
        size_t worst = 0;
        float worstDiff = 0.0f;
        for (size_t i = 0; i < common; ++i) {
            const float d = std::fabs(r.samples[i] - expected[i]);
            if (d > worstDiff) {
                worstDiff = d;
                worst = i;
            }
        }
        EXPECT_LE(worstDiff, tolerance) << "at sample " << worst << " of " << common;
        // Where the tail ends depends on block boundaries: a block whose last frames fall below -313 dB
        // after the input has ended is cut there and ends the stream. The WAVE parser cuts its samples
        // differently from run to run, and the renderer cuts in its own blocks, so either output may
        // run on past the other's end, with a tail that has died away: every sample there is below one
        // 16-bit step (in a 16-bit stream, at most the one step that rounding makes of it).
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
    GraphResult r = RunGraph(WinePath(CasesDir() + "/dc-silence-44100-f32.wav"), state, true);
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
