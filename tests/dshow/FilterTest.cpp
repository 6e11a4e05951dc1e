// The filter object in process, without a graph: formats, saved state and its dirty flag, envelopes,
// capture and the registration path.
#include <gtest/gtest.h>

#include <string>

#include "FilterRig.h"
#include "filter/CoreState.h"
#include "filter/dshow/Registration.h"

using namespace ulvetta;
using namespace ulvetta::dshow;
using namespace ulvetta::test;

namespace {

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

TEST(FilterFormats, AcceptsStereo16BitAndFloatOnly) {
    FilterHolder f;
    ReverbFilter* r = f.filter;
    const struct { WORD tag, channels; DWORD rate; WORD bits; bool extensible; GUID sub; HRESULT expected; } cases[] = {
        {WAVE_FORMAT_PCM, 2, 1, 16, false, GUID_NULL, S_OK},
        {WAVE_FORMAT_IEEE_FLOAT, 2, 768000, 32, false, GUID_NULL, S_OK},
        {0, 2, 48000, 16, true, MEDIASUBTYPE_PCM, S_OK},
        {0, 2, 48000, 32, true, MEDIASUBTYPE_IEEE_FLOAT, S_OK},
        {WAVE_FORMAT_PCM, 1, 44100, 16, false, GUID_NULL, E_INVALIDARG},
        {WAVE_FORMAT_PCM, 2, 44100, 8, false, GUID_NULL, E_INVALIDARG},
        {WAVE_FORMAT_PCM, 2, 44100, 24, false, GUID_NULL, E_INVALIDARG},
        {WAVE_FORMAT_PCM, 2, 44100, 48, false, GUID_NULL, E_INVALIDARG},
        {WAVE_FORMAT_IEEE_FLOAT, 2, 44100, 64, false, GUID_NULL, E_INVALIDARG},
        {WAVE_FORMAT_PCM, 2, 0, 16, false, GUID_NULL, E_INVALIDARG},
        {WAVE_FORMAT_PCM, 2, 768001, 16, false, GUID_NULL, E_INVALIDARG},
        {0, 2, 48000, 16, true, MEDIATYPE_Video, E_INVALIDARG},
    };
    for (const auto& c : cases)
        EXPECT_EQ(r->CheckInputType(WaveType(c.tag, c.channels, c.rate, c.bits, c.extensible, c.sub)), c.expected)
            << c.tag << "/" << c.channels << "/" << c.rate << "/" << c.bits;
    WaveType shortExtensible(0, 2, 48000, 16, true, MEDIASUBTYPE_PCM);
    shortExtensible.mt.cbFormat = sizeof(WAVEFORMATEX) + 4;  // claims extensible, block too short
    EXPECT_EQ(r->CheckInputType(&shortExtensible.mt), E_INVALIDARG);
    WaveType compressed(WAVE_FORMAT_PCM, 2, 44100, 16);
    compressed.mt.bTemporalCompression = TRUE;
    EXPECT_EQ(r->CheckInputType(&compressed.mt), E_INVALIDARG);

    WaveType in(0, 2, 48000, 32, true, MEDIASUBTYPE_IEEE_FLOAT);
    EXPECT_EQ(r->CheckTransform(&in.mt, WaveType(WAVE_FORMAT_IEEE_FLOAT, 2, 48000, 32)), S_OK);
    EXPECT_EQ(r->CheckTransform(&in.mt, WaveType(WAVE_FORMAT_IEEE_FLOAT, 2, 44100, 32)), E_INVALIDARG);
    EXPECT_EQ(r->CheckTransform(&in.mt, WaveType(WAVE_FORMAT_PCM, 2, 48000, 16)), E_INVALIDARG);
    EXPECT_EQ(r->CheckTransform(&in.mt, WaveType(WAVE_FORMAT_IEEE_FLOAT, 1, 48000, 32)), E_INVALIDARG);
}

TEST(FilterState, SaveLoadRoundTripAndTheDirtyFlag) {
    FilterHolder a, b;
    a.Core()->setValue(kAlgorithm, 6);
    a.Core()->setValue(kNotchFreq, 4321);
    auto pa = a.As<IPersistStream>();
    EXPECT_EQ(pa->IsDirty(), S_OK);  // the option set at construction
    ComRef<IStream> s = StreamOf({});
    ASSERT_EQ(pa->Save(StreamOf({}).get(), FALSE), S_OK);
    EXPECT_EQ(pa->IsDirty(), S_OK);  // saved without clearing
    ASSERT_EQ(pa->Save(s.get(), TRUE), S_OK);
    EXPECT_EQ(PositionOf(s.get()), 88u);
    std::vector<int32_t> saved;
    for (int id = 0; id < kParamCount; ++id) saved.push_back(a.Core()->getValue(id));
    EXPECT_EQ(pa->IsDirty(), S_FALSE);
    a.Core()->setValue(kDecay, a.Core()->getValue(kDecay) + 1);  // as the editor would
    EXPECT_EQ(pa->IsDirty(), S_OK);

    s->Seek(LARGE_INTEGER{}, STREAM_SEEK_SET, nullptr);
    auto pb = b.As<IPersistStream>();
    pb->Save(StreamOf({}).get(), TRUE);
    ASSERT_EQ(pb->Load(s.get()), S_OK);
    EXPECT_EQ(pb->IsDirty(), S_OK);  // loading changed its settings
    for (int id = 0; id < kParamCount; ++id) EXPECT_EQ(b.Core()->getValue(id), saved[id]) << id;
}

TEST(FilterState, BadRecordsFailWithoutChangingAnythingOrAllocatingTheirClaim) {
    FilterHolder f;
    f.Core()->setValue(kDecay, 77);
    auto p = f.As<IPersistStream>();
    const struct { uint32_t sizeField; size_t streamBytes; uint64_t expectedPosition; } cases[] = {
        {16, 200, 20},              // too small: only the header is read
        {92, 200, 92},              // another size: consumed whole
        {88, 60, 60},               // truncated record
        {4096, 5000, 4096},         // larger than any record: consumed in chunks
        {0xFFFFFFFFu, 3000, 3000},  // 4 GB claimed: read to the stream's end, never allocated
    };
    for (const auto& c : cases) {
        ComRef<IStream> s = StreamOf(StateWithSizeField(c.sizeField, c.streamBytes));
        EXPECT_EQ(p->Load(s.get()), E_UNEXPECTED) << c.sizeField;
        EXPECT_EQ(PositionOf(s.get()), c.expectedPosition) << c.sizeField;
        EXPECT_EQ(f.Core()->getValue(kDecay), 77);
    }
    std::vector<uint8_t> wrongGuid = StateWithSizeField(88, 88);
    wrongGuid[5] ^= 0xff;
    EXPECT_EQ(p->Load(StreamOf(wrongGuid).get()), E_UNEXPECTED);
    EXPECT_EQ(f.Core()->getValue(kDecay), 77);
}

TEST(FilterAutomation, EnvelopesConvertTimesToSamplesOfTheInput) {
    FilterHolder f;
    auto params = f.As<IMediaParams>();
    MP_ENVELOPE_SEGMENT seg{};
    seg.rtStart = 10000000;  // 1.0 s
    seg.rtEnd = 20000000;    // 2.0 s
    seg.iCurve = MP_CURVE_JUMP;
    f.filter->SetMediaType(PINDIR_INPUT, WaveType(WAVE_FORMAT_PCM, 2, 44100, 16));
    ASSERT_EQ(params->AddEnvelope(kDecay, 1, &seg), S_OK);
    const auto& segs = f.filter->AutomationForInspection().segments();
    ASSERT_EQ(segs.size(), 1u);
    EXPECT_EQ(segs[0].startSample, 44100);
    EXPECT_EQ(segs[0].endSample, 88200);
    ASSERT_EQ(params->FlushEnvelope(kAllParams, 0, 15000000), S_OK);
    EXPECT_TRUE(segs.empty());
}

namespace {
struct RecordingCallback : ICaptureCallback {
    std::vector<std::string> calls;
    std::vector<float> values;
    long refs = 0;
    STDMETHODIMP QueryInterface(REFIID, void**) override { return E_NOINTERFACE; }
    STDMETHODIMP_(ULONG) AddRef() override { return ++refs; }
    STDMETHODIMP_(ULONG) Release() override { return --refs; }
    STDMETHODIMP BeginCapture(DWORD* k, DWORD n) override { return Log("begin", *k, n); }
    STDMETHODIMP Changed(DWORD* k, DWORD n, MP_DATA* v) override {
        values.push_back(*v);
        return Log("changed", *k, n);
    }
    STDMETHODIMP EndCapture(DWORD* k, DWORD n) override { return Log("end", *k, n); }
    HRESULT Log(const char* what, DWORD k, DWORD n) {
        return calls.push_back(std::string(what) + " " + std::to_string(k) + "/" + std::to_string(n)), S_OK;
    }
};
}  // namespace

TEST(FilterAutomation, CaptureReportsEditorChangesAndHoldsItsCallback) {
    RecordingCallback cb, other;
    {
        FilterHolder f;
        auto setter = f.As<ICaptureCallbackSetter>();
        ASSERT_EQ(setter->SetCaptureCallback(&cb), S_OK);
        EXPECT_EQ(cb.refs, 1);
        f.Core()->setValueAndNotify(kRoomSize, 100);
        ASSERT_EQ(cb.calls, (std::vector<std::string>{"begin 4/1", "changed 4/1", "end 4/1"}));
        EXPECT_FLOAT_EQ(cb.values[0], f.Core()->getNormalized(kRoomSize));
        f.Core()->setValueAndNotify(kAlgorithm, 3);  // not a media parameter: no report of its own
        f.As<IMediaParams>()->SetParam(kDecay, 0.5f);  // the host's own changes are not reported back
        EXPECT_EQ(cb.calls.size(), 3u);
        setter->SetCaptureCallback(&other);
        EXPECT_EQ(cb.refs, 0);
        EXPECT_EQ(other.refs, 1);
    }
    EXPECT_EQ(other.refs, 0);  // released with the filter
}

TEST(Registration, AModulePathThatDoesNotFitIsAnError) {
    wchar_t path[MAX_PATH];
    EXPECT_EQ(ModulePath(nullptr, path, MAX_PATH), S_OK);
    EXPECT_TRUE(FAILED(ModulePath(nullptr, path, 4)));
}
