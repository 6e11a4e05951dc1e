// The filter object in process, without a graph: formats, saved state, presets, pages, the control
// interface, media parameters and capture.
#include <windows.h>
#include <dshow.h>
#include <mmreg.h>

#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <string>
#include <vector>

#include "engine/EngineProbe.h"
#include "filter/CoreState.h"
#include "filter/dshow/ReverbFilter.h"

using namespace ulvetta;
using namespace ulvetta::dshow;

namespace {

// Owns one filter created through its class factory function.
struct FilterHolder {
    IUnknown* inner = nullptr;
    ReverbFilter* filter = nullptr;
    FilterHolder() {
        HRESULT hr = E_FAIL;
        inner = ReverbFilter::CreateInstance(nullptr, &hr);
        inner->AddRef();
        IBaseFilter* base = nullptr;
        inner->QueryInterface(IID_IBaseFilter, reinterpret_cast<void**>(&base));
        filter = static_cast<ReverbFilter*>(base);
        base->Release();
    }
    ~FilterHolder() { inner->Release(); }
    template <class I>
    ComRef<I> As(REFIID iid) {
        ComRef<I> p;
        inner->QueryInterface(iid, reinterpret_cast<void**>(p.put()));
        return p;
    }
};

// An audio media type with a plain or extensible wave format.
struct WaveType {
    AM_MEDIA_TYPE mt{};
    WAVEFORMATEXTENSIBLE wf{};
    WaveType(WORD tag, WORD channels, DWORD rate, WORD bits, bool extensible = false, GUID sub = GUID_NULL) {
        mt.majortype = MEDIATYPE_Audio;
        mt.formattype = FORMAT_WaveFormatEx;
        wf.Format.wFormatTag = extensible ? WAVE_FORMAT_EXTENSIBLE : tag;
        wf.Format.nChannels = channels;
        wf.Format.nSamplesPerSec = rate;
        wf.Format.wBitsPerSample = bits;
        wf.Format.nBlockAlign = static_cast<WORD>(bits / 8 * channels);
        wf.Format.nAvgBytesPerSec = rate * wf.Format.nBlockAlign;
        wf.Format.cbSize = extensible ? 22 : 0;
        wf.Samples.wValidBitsPerSample = bits;
        wf.dwChannelMask = 3;
        wf.SubFormat = sub;
        mt.cbFormat = extensible ? sizeof(WAVEFORMATEXTENSIBLE) : sizeof(WAVEFORMATEX);
        mt.pbFormat = reinterpret_cast<BYTE*>(&wf);
        mt.subtype = extensible ? sub : (tag == WAVE_FORMAT_PCM ? MEDIASUBTYPE_PCM : MEDIASUBTYPE_IEEE_FLOAT);
    }
    WaveType(const WaveType&) = delete;  // mt points into this object
    operator const AM_MEDIA_TYPE*() const { return &mt; }
};

ComRef<IStream> StreamOf(const std::vector<uint8_t>& bytes) {
    ComRef<IStream> s;
    HGLOBAL h = GlobalAlloc(GMEM_MOVEABLE, bytes.empty() ? 1 : bytes.size());
    if (!bytes.empty()) {
        std::memcpy(GlobalLock(h), bytes.data(), bytes.size());
        GlobalUnlock(h);
    }
    CreateStreamOnHGlobal(h, TRUE, s.put());
    ULARGE_INTEGER size;
    size.QuadPart = bytes.size();
    s->SetSize(size);
    return s;
}

uint64_t PositionOf(IStream* s) {
    LARGE_INTEGER zero{};
    ULARGE_INTEGER pos{};
    s->Seek(zero, STREAM_SEEK_CUR, &pos);
    return pos.QuadPart;
}

std::vector<uint8_t> StateWithSizeField(uint32_t size, size_t total) {
    std::vector<uint8_t> b(total, 0);
    putLe32(b.data(), size);
    if (total >= 20) std::memcpy(b.data() + 4, kCoreStateGuid, 16);
    return b;
}

}  // namespace

TEST(FilterFormats, AcceptsStereo16BitAndFloatAtAnyRate) {
    FilterHolder f;
    for (DWORD rate : {1u, 8000u, 44100u, 96000u, 768000u}) {
        EXPECT_EQ(f.filter->CheckInputType(WaveType(WAVE_FORMAT_PCM, 2, rate, 16)), S_OK) << rate;
        EXPECT_EQ(f.filter->CheckInputType(WaveType(WAVE_FORMAT_IEEE_FLOAT, 2, rate, 32)), S_OK) << rate;
    }
    EXPECT_EQ(f.filter->CheckInputType(WaveType(0, 2, 48000, 16, true, MEDIASUBTYPE_PCM)), S_OK);
    EXPECT_EQ(f.filter->CheckInputType(WaveType(0, 2, 48000, 32, true, MEDIASUBTYPE_IEEE_FLOAT)), S_OK);
}

TEST(FilterFormats, RefusesEverythingElse) {
    FilterHolder f;
    ReverbFilter* r = f.filter;
    EXPECT_EQ(r->CheckInputType(WaveType(WAVE_FORMAT_PCM, 1, 44100, 16)), E_INVALIDARG);  // mono
    EXPECT_EQ(r->CheckInputType(WaveType(WAVE_FORMAT_PCM, 6, 44100, 16)), E_INVALIDARG);
    EXPECT_EQ(r->CheckInputType(WaveType(WAVE_FORMAT_PCM, 2, 44100, 8)), E_INVALIDARG);
    EXPECT_EQ(r->CheckInputType(WaveType(WAVE_FORMAT_PCM, 2, 44100, 24)), E_INVALIDARG);
    EXPECT_EQ(r->CheckInputType(WaveType(WAVE_FORMAT_PCM, 2, 44100, 48)), E_INVALIDARG);
    EXPECT_EQ(r->CheckInputType(WaveType(WAVE_FORMAT_IEEE_FLOAT, 2, 44100, 64)), E_INVALIDARG);
    EXPECT_EQ(r->CheckInputType(WaveType(WAVE_FORMAT_IEEE_FLOAT, 2, 44100, 16)), E_INVALIDARG);
    EXPECT_EQ(r->CheckInputType(WaveType(WAVE_FORMAT_PCM, 2, 0, 16)), E_INVALIDARG);
    EXPECT_EQ(r->CheckInputType(WaveType(WAVE_FORMAT_PCM, 2, 768001, 16)), E_INVALIDARG);
    EXPECT_EQ(r->CheckInputType(WaveType(0, 2, 48000, 24, true, MEDIASUBTYPE_PCM)), E_INVALIDARG);
    EXPECT_EQ(r->CheckInputType(WaveType(0, 2, 48000, 32, true, MEDIASUBTYPE_PCM)), E_INVALIDARG);
    EXPECT_EQ(r->CheckInputType(WaveType(0, 2, 48000, 16, true, MEDIATYPE_Video)), E_INVALIDARG);
    WaveType shortExtensible(0, 2, 48000, 16, true, MEDIASUBTYPE_PCM);
    shortExtensible.mt.cbFormat = sizeof(WAVEFORMATEX) + 4;  // claims extensible, block too short
    EXPECT_EQ(r->CheckInputType(&shortExtensible.mt), E_INVALIDARG);
    WaveType video(WAVE_FORMAT_PCM, 2, 44100, 16);
    video.mt.majortype = MEDIATYPE_Video;
    EXPECT_EQ(r->CheckInputType(&video.mt), E_INVALIDARG);
    WaveType compressed(WAVE_FORMAT_PCM, 2, 44100, 16);
    compressed.mt.bTemporalCompression = TRUE;
    EXPECT_EQ(r->CheckInputType(&compressed.mt), E_INVALIDARG);
    WaveType tiny(WAVE_FORMAT_PCM, 2, 44100, 16);
    tiny.mt.cbFormat = 15;
    EXPECT_EQ(r->CheckInputType(&tiny.mt), E_INVALIDARG);
    tiny.mt.pbFormat = nullptr;
    tiny.mt.cbFormat = 18;
    EXPECT_EQ(r->CheckInputType(&tiny.mt), E_INVALIDARG);
    EXPECT_EQ(r->CheckInputType(nullptr), E_POINTER);
}

TEST(FilterFormats, TransformNeedsEqualFormatsAndStereoOut) {
    FilterHolder f;
    WaveType in(0, 2, 48000, 32, true, MEDIASUBTYPE_IEEE_FLOAT);
    EXPECT_EQ(f.filter->CheckTransform(&in.mt, WaveType(WAVE_FORMAT_IEEE_FLOAT, 2, 48000, 32)), S_OK);
    EXPECT_EQ(f.filter->CheckTransform(&in.mt, WaveType(WAVE_FORMAT_IEEE_FLOAT, 2, 44100, 32)), E_INVALIDARG);
    EXPECT_EQ(f.filter->CheckTransform(&in.mt, WaveType(WAVE_FORMAT_PCM, 2, 48000, 16)), E_INVALIDARG);
    EXPECT_EQ(f.filter->CheckTransform(&in.mt, WaveType(WAVE_FORMAT_IEEE_FLOAT, 1, 48000, 32)), E_INVALIDARG);
    AM_MEDIA_TYPE offered{};
    EXPECT_EQ(f.filter->GetMediaType(0, &offered), E_UNEXPECTED);  // input not connected
}

TEST(FilterFormats, SetMediaTypeNormalisesAndReachesTheCore) {
    FilterHolder f;
    WaveType in(0, 2, 96000, 32, true, MEDIASUBTYPE_IEEE_FLOAT);
    ASSERT_EQ(f.filter->SetMediaType(PINDIR_INPUT, &in.mt), S_OK);
    const WAVEFORMATEX& w = f.filter->InputFormat();
    EXPECT_EQ(w.wFormatTag, WAVE_FORMAT_IEEE_FLOAT);
    EXPECT_EQ(w.nBlockAlign, 8);
    EXPECT_EQ(w.nAvgBytesPerSec, 768000u);
    EXPECT_EQ(w.cbSize, 0);
    ReverbCore* core = f.filter->Control().GetCore();
    EXPECT_EQ(EngineProbe(core->engineForInspection()).sampleRate(), 96000);
    EXPECT_EQ(EngineProbe(core->engineForInspection()).mode(), 2);  // every parameter was applied
    WAVEFORMATEX got{};
    EXPECT_EQ(f.filter->Control().GetFormat(&got, 0), S_OK);
    EXPECT_EQ(got.nSamplesPerSec, 96000u);
    EXPECT_EQ(f.filter->Control().GetFormat(&got, 1), VFW_E_NOT_CONNECTED);
    EXPECT_EQ(f.filter->Control().GetFormat(&got, 2), VFW_E_NOT_CONNECTED);
}

TEST(FilterState, SaveLoadRoundTripIntoAFreshFilter) {
    FilterHolder a, b;
    ReverbCore* ca = a.filter->Control().GetCore();
    ca->setValue(kAlgorithm, 6);
    ca->setValue(kPreDelay, 123);
    ca->setValue(kNotchFreq, 4321);
    auto pa = a.As<IPersistStream>(IID_IPersistStream);
    ComRef<IStream> s = StreamOf({});
    ASSERT_EQ(pa->Save(s.get(), TRUE), S_OK);
    EXPECT_EQ(PositionOf(s.get()), 88u);
    LARGE_INTEGER zero{};
    s->Seek(zero, STREAM_SEEK_SET, nullptr);
    auto pb = b.As<IPersistStream>(IID_IPersistStream);
    ASSERT_EQ(pb->Load(s.get()), S_OK);
    ReverbCore* cb = b.filter->Control().GetCore();
    for (int id = 0; id < kParamCount; ++id) EXPECT_EQ(cb->getValue(id), ca->getValue(id)) << id;
    CLSID clsid{};
    EXPECT_EQ(pb->GetClassID(&clsid), S_OK);
    EXPECT_EQ(clsid, CLSID_UlvettaFilter);
    EXPECT_EQ(pb->IsDirty(), S_OK);  // the option set at construction marks it dirty
    ULARGE_INTEGER max{};
    EXPECT_EQ(pb->GetSizeMax(&max), S_OK);
    EXPECT_EQ(max.QuadPart, 88u);
    EXPECT_EQ(pb->Load(nullptr), E_POINTER);
    EXPECT_EQ(pb->Save(nullptr, FALSE), E_POINTER);
}

TEST(FilterState, BadRecordsFailWithoutChangingAnythingOrAllocatingTheirClaim) {
    FilterHolder f;
    ReverbCore* core = f.filter->Control().GetCore();
    core->setValue(kDecay, 77);
    auto p = f.As<IPersistStream>(IID_IPersistStream);
    struct Case {
        uint32_t sizeField;
        size_t streamBytes;
        uint64_t expectedPosition;
    } cases[] = {
        {16, 200, 20},                // too small: only the header is read
        {92, 200, 92},                // another size: consumed whole
        {88, 60, 60},                 // truncated record
        {4096, 5000, 4096},           // larger than any record: consumed in chunks
        {0xFFFFFFFFu, 3000, 3000},    // 4 GB claimed: read to the stream's end, never allocated
    };
    for (const Case& c : cases) {
        ComRef<IStream> s = StreamOf(StateWithSizeField(c.sizeField, c.streamBytes));
        EXPECT_EQ(p->Load(s.get()), E_UNEXPECTED) << c.sizeField;
        EXPECT_EQ(PositionOf(s.get()), c.expectedPosition) << c.sizeField;
        EXPECT_EQ(core->getValue(kDecay), 77);
    }
    std::vector<uint8_t> wrongGuid = StateWithSizeField(88, 88);
    wrongGuid[5] ^= 0xff;
    EXPECT_EQ(p->Load(StreamOf(wrongGuid).get()), E_UNEXPECTED);
    EXPECT_EQ(core->getValue(kDecay), 77);
}

TEST(FilterInterfaces, PagesPresetsAndControl) {
    FilterHolder f;
    auto pages = f.As<ISpecifyPropertyPages>(IID_ISpecifyPropertyPages);
    CAUUID ca{};
    ASSERT_EQ(pages->GetPages(&ca), S_OK);
    ASSERT_EQ(ca.cElems, 1u);
    EXPECT_EQ(ca.pElems[0], CLSID_UlvettaPropertyPage);
    CoTaskMemFree(ca.pElems);
    EXPECT_EQ(pages->GetPages(nullptr), E_POINTER);

    auto presets = f.As<IHostPresets>(__uuidof(IHostPresets));
    DWORD count = 0;
    EXPECT_EQ(presets->GetPresetCount(&count), S_OK);
    EXPECT_EQ(count, 1u);
    WCHAR name[32];
    EXPECT_EQ(presets->GetPresetName(0, name, 32), S_OK);
    EXPECT_STREQ(name, L"(Default)");
    EXPECT_EQ(presets->GetPresetName(0, name, 4), S_OK);
    EXPECT_STREQ(name, L"(De");
    EXPECT_EQ(presets->GetPresetName(1, name, 32), E_INVALIDARG);
    EXPECT_EQ(presets->SetPreset(1), E_INVALIDARG);

    auto control = f.As<IReverbControl>(__uuidof(IReverbControl));
    BYTE option = 7;
    EXPECT_EQ(control->SetOption(&option), S_OK);
    EXPECT_EQ(presets->SetPreset(0), S_OK);
    EXPECT_EQ(control->GetOption(&option), S_OK);
    EXPECT_EQ(option, 0);
    HWND a = reinterpret_cast<HWND>(0x100), b = reinterpret_cast<HWND>(0x200), c = reinterpret_cast<HWND>(0x300);
    EXPECT_EQ(control->RegisterWindow(a, 5), S_OK);
    EXPECT_EQ(control->RegisterWindow(b, 6), S_OK);
    EXPECT_EQ(control->RegisterWindow(c, 7), E_OUTOFMEMORY);
    EXPECT_EQ(control->RegisterWindow(a, 9), S_OK);  // a known window only changes its id
    EXPECT_EQ(control->RegisterWindow(a, 0), S_OK);  // id 0 frees the entry
    EXPECT_EQ(control->RegisterWindow(c, 7), S_OK);
    EXPECT_EQ(control->GetCore(), f.filter->Control().GetCore());
    IPersistStream* ps = control->GetPersistStream();
    ASSERT_NE(ps, nullptr);
    ps->Release();
    // Every interface's IUnknown is the filter's.
    ComRef<IUnknown> viaControl;
    control->QueryInterface(IID_IUnknown, reinterpret_cast<void**>(viaControl.put()));
    EXPECT_EQ(viaControl.get(), f.inner);
}

TEST(FilterAutomation, ParameterInfoAndSetParam) {
    FilterHolder f;
    auto info = f.As<IMediaParamInfo>(__uuidof(IMediaParamInfo));
    auto params = f.As<IMediaParams>(__uuidof(IMediaParams));
    DWORD count = 0;
    EXPECT_EQ(info->GetParamCount(&count), S_OK);
    EXPECT_EQ(count, 15u);
    MP_PARAMINFO pi{};
    ASSERT_EQ(info->GetParamInfo(14, &pi), S_OK);
    EXPECT_STREQ(pi.szLabel, L"Notch Q");
    EXPECT_EQ(pi.mpType, MPT_FLOAT);
    EXPECT_EQ(pi.mopCaps, static_cast<MP_CAPS>(MP_CAPS_CURVE_JUMP | MP_CAPS_CURVE_LINEAR));
    EXPECT_FLOAT_EQ(pi.mpdNeutralValue, (30 - 1) / 49.0f);  // the current position, not a default
    EXPECT_EQ(info->GetParamInfo(15, &pi), E_INVALIDARG);
    EXPECT_EQ(info->GetParamInfo(0, nullptr), E_POINTER);
    WCHAR* text = nullptr;
    ASSERT_EQ(info->GetParamText(12, &text), S_OK);
    EXPECT_STREQ(text, L"Notch Freq");
    EXPECT_STREQ(text + wcslen(text) + 1, L"");
    CoTaskMemFree(text);
    GUID tf{};
    MP_TIMEDATA td = 1;
    EXPECT_EQ(info->GetSupportedTimeFormat(0, &tf), S_OK);
    EXPECT_EQ(info->GetSupportedTimeFormat(1, &tf), E_INVALIDARG);
    EXPECT_EQ(info->GetCurrentTimeFormat(&tf, &td), S_OK);
    EXPECT_EQ(td, 0u);

    ASSERT_EQ(params->SetParam(kAllParams, 0.0f), S_OK);
    ReverbCore* core = f.filter->Control().GetCore();
    EXPECT_EQ(core->getValue(kLowPassFreq), 20);
    char buf[ReverbCore::kTextCapacity];
    EXPECT_STREQ(core->getValueText(kHighPassFreq, buf, false), "Off");
    EXPECT_EQ(core->getValue(kAlgorithm), 2);  // not published
    EXPECT_EQ(params->SetParam(15, 0.5f), E_INVALIDARG);
    MP_DATA v = -1;
    ASSERT_EQ(params->SetParam(kDecay, 0.25f), S_OK);
    EXPECT_EQ(params->GetParam(kDecay, &v), S_OK);
    EXPECT_FLOAT_EQ(v, 0.25f);
    EXPECT_EQ(params->GetParam(15, &v), E_INVALIDARG);
    EXPECT_EQ(params->GetParam(0, nullptr), E_POINTER);
}

TEST(FilterAutomation, EnvelopesConvertTimesAndReplaceOverlaps) {
    FilterHolder f;
    auto params = f.As<IMediaParams>(__uuidof(IMediaParams));
    MP_ENVELOPE_SEGMENT seg{};
    seg.rtStart = 10000000;  // 1.0 s
    seg.rtEnd = 20000000;    // 2.0 s
    seg.valStart = 0.2f;
    seg.valEnd = 0.8f;
    seg.iCurve = MP_CURVE_JUMP;
    EXPECT_NE(params->AddEnvelope(kDecay, 1, &seg), S_OK);  // no input format yet: nothing stored
    EXPECT_TRUE(f.filter->Control().segments.empty());
    WaveType in(WAVE_FORMAT_PCM, 2, 44100, 16);
    f.filter->SetMediaType(PINDIR_INPUT, &in.mt);
    ASSERT_EQ(params->AddEnvelope(kDecay, 1, &seg), S_OK);
    ASSERT_EQ(params->AddEnvelope(kDamping, 1, &seg), S_OK);
    auto& segs = f.filter->Control().segments;
    ASSERT_EQ(segs.size(), 2u);
    EXPECT_EQ(segs[0].startSample, 44100);
    EXPECT_EQ(segs[0].endSample, 88200);
    EXPECT_TRUE(segs[0].jump);
    MP_ENVELOPE_SEGMENT over = seg;
    over.rtStart = 15000000;
    over.rtEnd = 30000000;
    over.iCurve = MP_CURVE_LINEAR;
    ASSERT_EQ(params->AddEnvelope(kDecay, 1, &over), S_OK);
    ASSERT_EQ(segs.size(), 2u);  // the overlapped decay segment is replaced, damping untouched
    EXPECT_EQ(segs[0].paramId, kDamping);
    EXPECT_EQ(segs[1].startSample, 66150);
    EXPECT_FALSE(segs[1].jump);
    EXPECT_EQ(params->AddEnvelope(15, 1, &seg), E_INVALIDARG);
    EXPECT_EQ(params->AddEnvelope(0, 1, nullptr), E_POINTER);
    ASSERT_EQ(params->FlushEnvelope(kAllParams, 0, 40000000), S_OK);
    EXPECT_TRUE(segs.empty());
    ASSERT_EQ(params->AddEnvelope(kAllParams, 1, &seg), S_OK);
    EXPECT_EQ(segs.size(), 15u);
}

namespace {
struct RecordingCallback : ICaptureCallback {
    std::vector<std::string> calls;
    std::vector<float> values;
    STDMETHODIMP QueryInterface(REFIID, void** ppv) override {
        *ppv = nullptr;
        return E_NOINTERFACE;
    }
    STDMETHODIMP_(ULONG) AddRef() override { return 2; }
    STDMETHODIMP_(ULONG) Release() override { return 1; }
    STDMETHODIMP BeginCapture(DWORD* k, DWORD n) override {
        calls.push_back("begin " + std::to_string(*k) + "/" + std::to_string(n));
        return S_OK;
    }
    STDMETHODIMP Changed(DWORD* k, DWORD, MP_DATA* v) override {
        calls.push_back("changed " + std::to_string(*k));
        values.push_back(*v);
        return S_OK;
    }
    STDMETHODIMP EndCapture(DWORD* k, DWORD) override {
        calls.push_back("end " + std::to_string(*k));
        return S_OK;
    }
};
}  // namespace

TEST(FilterAutomation, CaptureReportsEditorChanges) {
    FilterHolder f;
    RecordingCallback cb;
    auto setter = f.As<ICaptureCallbackSetter>(__uuidof(ICaptureCallbackSetter));
    ASSERT_EQ(setter->SetCaptureCallback(&cb), S_OK);
    ReverbCore* core = f.filter->Control().GetCore();
    core->setValueAndNotify(kRoomSize, 100);
    ASSERT_EQ(cb.calls, (std::vector<std::string>{"begin 4/1", "changed 4", "end 4"}));
    EXPECT_FLOAT_EQ(cb.values[0], core->getNormalized(kRoomSize));
    core->setValueAndNotify(kAlgorithm, 3);  // not a media parameter: no report of its own
    EXPECT_EQ(cb.calls.size(), 3u);
    auto params = f.As<IMediaParams>(__uuidof(IMediaParams));
    params->SetParam(kDecay, 0.5f);  // the host's own changes are not reported back
    EXPECT_EQ(cb.calls.size(), 3u);
    setter->SetCaptureCallback(nullptr);
}

TEST(FilterStreaming, SixteenBitOutputClampsAndConvertsLikeTheRenderer) {
    FilterHolder f;
    WaveType pcm(WAVE_FORMAT_PCM, 2, 44100, 16);
    f.filter->SetMediaType(PINDIR_INPUT, pcm);
    f.filter->SetMediaType(PINDIR_OUTPUT, pcm);
    ReverbCore* core = f.filter->Control().GetCore();
    core->setValue(kOutputLevelWet, -600);
    core->setValue(kOutputLevelDry, 60);  // +6 dB
    core->startStreaming();
    const int16_t in[8] = {32767, -32768, 100, -101, 20000, -20000, 0, 1};
    int16_t out[8] = {};
    bool shortfall = true;
    const int produced = f.filter->Control().Process(kModeOrdinary, reinterpret_cast<const BYTE*>(in), 4,
                                                     reinterpret_cast<BYTE*>(out), 4, &shortfall);
    ASSERT_EQ(produced, 4);
    EXPECT_FALSE(shortfall);
    const double g = std::pow(10.0, 0.3);
    EXPECT_EQ(out[0], 32767);   // clamped, never wrapped
    EXPECT_EQ(out[1], -32768);
    EXPECT_EQ(out[2], static_cast<int16_t>(std::trunc(static_cast<float>(100 / 32768.0f * g) * 32768.0)));
    EXPECT_EQ(out[3], static_cast<int16_t>(std::trunc(static_cast<float>(-101 / 32768.0f * g) * 32768.0)));
    EXPECT_EQ(out[4], 32767);
    EXPECT_EQ(out[5], -32768);
    EXPECT_EQ(out[6], 0);
    EXPECT_EQ(out[7], 1);  // 1.995 truncated toward zero
    // The drain processes silence into the whole buffer; with no tail and no pre-delay content it ends at once.
    int16_t tail[64];
    core->setValue(kPreDelay, 0);
    EXPECT_EQ(f.filter->Control().Process(kModeDrain, nullptr, 0, reinterpret_cast<BYTE*>(tail), 32, &shortfall), 0);
    EXPECT_TRUE(shortfall);
}
