// The transform-filter base and the filter's streaming, driven in process between two stand-in pins: an
// upstream output pin and a downstream input pin whose allocator requirements ask for small buffers, so
// that one input sample spreads over several output samples.
#include <windows.h>
#include <dshow.h>
#include <mmreg.h>

#include <gtest/gtest.h>

#include <cstring>
#include <vector>

#include "filter/dshow/ReverbFilter.h"

using namespace ulvetta;
using namespace ulvetta::dshow;

namespace {

// A pin of a filter that does not exist: enough of IPin (and IMemInputPin downstream) to connect to.
class StandInPin : public IPin, public IMemInputPin {
public:
    StandInPin(PIN_DIRECTION dir, long bufferBytes) : dir_(dir), bufferBytes_(bufferBytes) {}
    STDMETHODIMP QueryInterface(REFIID riid, void** ppv) override {
        if (riid == IID_IUnknown || riid == IID_IPin)
            *ppv = static_cast<IPin*>(this);
        else if (riid == IID_IMemInputPin && dir_ == PINDIR_INPUT)
            *ppv = static_cast<IMemInputPin*>(this);
        else {
            *ppv = nullptr;
            return E_NOINTERFACE;
        }
        return S_OK;
    }
    STDMETHODIMP_(ULONG) AddRef() override { return 2; }
    STDMETHODIMP_(ULONG) Release() override { return 1; }
    // IPin
    STDMETHODIMP Connect(IPin*, const AM_MEDIA_TYPE*) override { return E_NOTIMPL; }
    STDMETHODIMP ReceiveConnection(IPin* connector, const AM_MEDIA_TYPE* mt) override {
        connected = connector;
        format = *reinterpret_cast<const WAVEFORMATEX*>(mt->pbFormat);
        return S_OK;
    }
    STDMETHODIMP Disconnect() override {
        connected = nullptr;
        return S_OK;
    }
    STDMETHODIMP ConnectedTo(IPin** pin) override {
        *pin = connected;
        return connected ? S_OK : VFW_E_NOT_CONNECTED;
    }
    STDMETHODIMP ConnectionMediaType(AM_MEDIA_TYPE*) override { return E_NOTIMPL; }
    STDMETHODIMP QueryPinInfo(PIN_INFO* info) override {
        std::memset(info, 0, sizeof *info);
        info->dir = dir_;
        return S_OK;
    }
    STDMETHODIMP QueryDirection(PIN_DIRECTION* dir) override {
        *dir = dir_;
        return S_OK;
    }
    STDMETHODIMP QueryId(LPWSTR*) override { return E_NOTIMPL; }
    STDMETHODIMP QueryAccept(const AM_MEDIA_TYPE*) override { return S_OK; }
    STDMETHODIMP EnumMediaTypes(IEnumMediaTypes**) override { return E_NOTIMPL; }
    STDMETHODIMP QueryInternalConnections(IPin**, ULONG*) override { return E_NOTIMPL; }
    STDMETHODIMP EndOfStream() override {
        ++endOfStreams;
        return S_OK;
    }
    STDMETHODIMP BeginFlush() override { return S_OK; }
    STDMETHODIMP EndFlush() override { return S_OK; }
    STDMETHODIMP NewSegment(REFERENCE_TIME, REFERENCE_TIME, double) override { return S_OK; }
    // IMemInputPin: no allocator of its own, but small buffers wanted.
    STDMETHODIMP GetAllocator(IMemAllocator**) override { return VFW_E_NO_ALLOCATOR; }
    STDMETHODIMP NotifyAllocator(IMemAllocator*, BOOL) override { return S_OK; }
    STDMETHODIMP GetAllocatorRequirements(ALLOCATOR_PROPERTIES* p) override {
        p->cBuffers = 2;
        p->cbBuffer = bufferBytes_;
        p->cbAlign = 1;
        p->cbPrefix = 0;
        return S_OK;
    }
    STDMETHODIMP Receive(IMediaSample* s) override {
        Delivered d;
        REFERENCE_TIME a = 0, b = 0;
        d.timed = s->GetTime(&a, &b) == S_OK;
        d.start = a;
        d.discontinuity = s->IsDiscontinuity() == S_OK;
        BYTE* p = nullptr;
        s->GetPointer(&p);
        d.bytes.assign(p, p + s->GetActualDataLength());
        delivered.push_back(d);
        return S_OK;
    }
    STDMETHODIMP ReceiveMultiple(IMediaSample**, long, long*) override { return E_NOTIMPL; }
    STDMETHODIMP ReceiveCanBlock() override { return S_FALSE; }

    struct Delivered {
        bool timed;
        REFERENCE_TIME start;
        bool discontinuity;
        std::vector<BYTE> bytes;
    };
    std::vector<Delivered> delivered;
    int endOfStreams = 0;
    IPin* connected = nullptr;
    WAVEFORMATEX format{};

private:
    PIN_DIRECTION dir_;
    long bufferBytes_;
};

// A filter connected between the two stand-ins, paused and ready to receive 16-bit stereo at a rate.
struct Rig {
    IUnknown* inner = nullptr;
    ReverbFilter* filter = nullptr;
    StandInPin upstream{PINDIR_OUTPUT, 0};
    StandInPin downstream;
    ComRef<IMemAllocator> source;
    WAVEFORMATEX wf{};
    AM_MEDIA_TYPE mt{};

    Rig(DWORD rate, long outputBufferBytes) : downstream(PINDIR_INPUT, outputBufferBytes) {
        HRESULT hr = E_FAIL;
        inner = ReverbFilter::CreateInstance(nullptr, &hr);
        inner->AddRef();
        IBaseFilter* base = nullptr;
        inner->QueryInterface(IID_IBaseFilter, reinterpret_cast<void**>(&base));
        filter = static_cast<ReverbFilter*>(base);
        base->Release();
        wf.wFormatTag = WAVE_FORMAT_PCM;
        wf.nChannels = 2;
        wf.nSamplesPerSec = rate;
        wf.wBitsPerSample = 16;
        wf.nBlockAlign = 4;
        wf.nAvgBytesPerSec = rate * 4;
        mt.majortype = MEDIATYPE_Audio;
        mt.subtype = MEDIASUBTYPE_PCM;
        mt.formattype = FORMAT_WaveFormatEx;
        mt.cbFormat = sizeof wf;
        mt.pbFormat = reinterpret_cast<BYTE*>(&wf);
        // Dry only, so that the output is the input exactly.
        ReverbCore* core = filter->Control().GetCore();
        core->setValue(kOutputLevelWet, -600);
        core->setValue(kPreDelay, 0);
    }
    ~Rig() {
        filter->Stop();
        inner->Release();
    }
    HRESULT Connect() {
        HRESULT hr = filter->GetPin(0)->ReceiveConnection(&upstream, &mt);
        if (FAILED(hr)) return hr;
        hr = filter->GetPin(1)->Connect(&downstream, nullptr);
        if (FAILED(hr)) return hr;
        hr = CoCreateInstance(CLSID_MemoryAllocator, nullptr, CLSCTX_INPROC_SERVER, IID_IMemAllocator,
                              reinterpret_cast<void**>(source.put()));
        if (FAILED(hr)) return hr;
        ALLOCATOR_PROPERTIES want{1, 1 << 16, 1, 0}, got{};
        source->SetProperties(&want, &got);
        source->Commit();
        return filter->Pause();
    }
    // Sends frames of 16-bit stereo starting at a sample position.
    HRESULT Send(const std::vector<int16_t>& samples, int64_t position, bool discontinuity) {
        ComRef<IMediaSample> s;
        HRESULT hr = source->GetBuffer(s.put(), nullptr, nullptr, 0);
        if (FAILED(hr)) return hr;
        BYTE* p = nullptr;
        s->GetPointer(&p);
        std::memcpy(p, samples.data(), samples.size() * 2);
        s->SetActualDataLength(static_cast<long>(samples.size() * 2));
        REFERENCE_TIME start = position * 10000000 / wf.nSamplesPerSec;
        REFERENCE_TIME stop = start + static_cast<REFERENCE_TIME>(samples.size() / 2) * 10000000 / wf.nSamplesPerSec;
        s->SetTime(&start, &stop);
        s->SetDiscontinuity(discontinuity);
        IMemInputPin* in = nullptr;
        filter->GetPin(0)->QueryInterface(IID_IMemInputPin, reinterpret_cast<void**>(&in));
        hr = in->Receive(s.get());
        in->Release();
        return hr;
    }
    std::vector<int16_t> Output() const {
        std::vector<int16_t> all;
        for (const auto& d : downstream.delivered) {
            const auto* v = reinterpret_cast<const int16_t*>(d.bytes.data());
            all.insert(all.end(), v, v + d.bytes.size() / 2);
        }
        return all;
    }
};

std::vector<int16_t> Ramp(int frames) {
    std::vector<int16_t> v(2 * frames);
    for (int i = 0; i < frames; ++i) {
        v[2 * i] = static_cast<int16_t>(i % 2000 + 1);
        v[2 * i + 1] = static_cast<int16_t>(i % 1500 + 1);  // same sign: the mono sum that feeds the reverb is not zero
    }
    return v;
}

}  // namespace

TEST(TransformStreaming, OneInputSampleSpreadsOverSmallOutputBuffers) {
    Rig rig(8000, 1024);  // 256 frames per output buffer
    ASSERT_EQ(rig.Connect(), S_OK);
    EXPECT_EQ(rig.downstream.format.wFormatTag, WAVE_FORMAT_PCM);
    const std::vector<int16_t> in = Ramp(2048);
    ASSERT_EQ(rig.Send(in, 8000, true), S_OK);
    const auto& d = rig.downstream.delivered;
    ASSERT_EQ(d.size(), 8u);
    EXPECT_TRUE(d[0].timed);
    EXPECT_EQ(d[0].start, 10000000);
    EXPECT_TRUE(d[0].discontinuity);
    for (size_t i = 1; i < d.size(); ++i) {
        EXPECT_FALSE(d[i].timed) << i;  // the continuation samples carry no times
        EXPECT_FALSE(d[i].discontinuity) << i;
        EXPECT_EQ(d[i].bytes.size(), 1024u);
    }
    EXPECT_EQ(rig.Output(), in);  // every frame once, in order
}

TEST(TransformStreaming, EndOfStreamDrainsTheTailAndPassesTheEndOn) {
    Rig rig(8000, 1024);
    ASSERT_EQ(rig.Connect(), S_OK);
    ReverbCore* core = rig.filter->Control().GetCore();
    core->setValue(kOutputLevelWet, 0);  // the reverb on: a tail follows the input
    ASSERT_EQ(rig.Send(Ramp(512), 0, true), S_OK);
    const size_t before = rig.downstream.delivered.size();
    ASSERT_EQ(rig.filter->GetPin(0)->EndOfStream(), S_OK);
    EXPECT_EQ(rig.downstream.endOfStreams, 1);
    const auto& d = rig.downstream.delivered;
    ASSERT_GT(d.size(), before);
    // Full buffers of tail, then one partial (or none) before the end of stream.
    for (size_t i = before; i + 1 < d.size(); ++i) EXPECT_EQ(d[i].bytes.size(), 1024u) << i;
    EXPECT_LE(d.back().bytes.size(), 1024u);
    EXPECT_EQ(rig.filter->GetPin(0)->EndOfStream(), S_OK);  // the base passes a second one on as well
}

TEST(TransformStreaming, AutomationAppliesInFiveMillisecondChunks) {
    // At 8000 Hz a chunk is 40 frames: a segment starting inside a chunk takes effect at the next one.
    for (int64_t segmentStart : {1000, 1010}) {
        Rig rig(8000, 1 << 14);
        ASSERT_EQ(rig.Connect(), S_OK);
        ComRef<IMediaParams> params;
        rig.inner->QueryInterface(__uuidof(IMediaParams), reinterpret_cast<void**>(params.put()));
        MP_ENVELOPE_SEGMENT seg{};
        seg.rtStart = segmentStart * 10000000 / 8000;
        seg.rtEnd = seg.rtStart + 1000000;
        seg.valStart = seg.valEnd = 0.0f;  // "Output Level Dry" at -Inf.
        seg.iCurve = MP_CURVE_JUMP;
        ASSERT_EQ(params->AddEnvelope(kOutputLevelDry, 1, &seg), S_OK);
        ASSERT_EQ(rig.Send(Ramp(2000), 0, true), S_OK);
        const std::vector<int16_t> out = rig.Output();
        ASSERT_EQ(out.size(), 4000u);
        int firstSilent = -1;
        for (int i = 0; i < 2000 && firstSilent < 0; ++i)
            if (out[2 * i] == 0) firstSilent = i;
        EXPECT_EQ(firstSilent, segmentStart == 1000 ? 1000 : 1040);
    }
}

TEST(TransformStreaming, StateChangesAndRefusals) {
    Rig rig(44100, 4096);
    FILTER_STATE s;
    EXPECT_EQ(rig.filter->GetState(0, &s), S_OK);
    EXPECT_EQ(s, State_Stopped);
    ASSERT_EQ(rig.Connect(), S_OK);
    EXPECT_EQ(rig.filter->GetState(0, &s), S_OK);
    EXPECT_EQ(s, State_Paused);
    EXPECT_EQ(rig.filter->GetPin(0)->Disconnect(), VFW_E_NOT_STOPPED);
    EXPECT_EQ(rig.filter->Run(0), S_OK);
    EXPECT_EQ(rig.filter->Stop(), S_OK);
    EXPECT_EQ(rig.Send(Ramp(16), 0, false), VFW_E_WRONG_STATE);
    EXPECT_EQ(rig.filter->GetPin(0)->ReceiveConnection(&rig.upstream, &rig.mt), VFW_E_ALREADY_CONNECTED);
    IPin* found = nullptr;
    EXPECT_EQ(rig.filter->FindPin(L"In", &found), S_OK);
    EXPECT_EQ(found, rig.filter->GetPin(0));
    found->Release();
    EXPECT_EQ(rig.filter->FindPin(L"Nope", &found), VFW_E_NOT_FOUND);
    EXPECT_EQ(rig.filter->GetPin(2), nullptr);
    PIN_INFO info{};
    rig.filter->GetPin(1)->QueryPinInfo(&info);
    EXPECT_STREQ(info.achName, L"Output");
    info.pFilter->Release();
    // The offered output type is the plain stereo form of the input.
    AM_MEDIA_TYPE offered{};
    ASSERT_EQ(rig.filter->GetMediaType(0, &offered), S_OK);
    EXPECT_EQ(offered.cbFormat, sizeof(WAVEFORMATEX));
    EXPECT_EQ(reinterpret_cast<WAVEFORMATEX*>(offered.pbFormat)->nBlockAlign, 4);
    FreeMediaType(offered);
    EXPECT_EQ(rig.filter->GetMediaType(1, &offered), VFW_S_NO_MORE_ITEMS);
    EXPECT_EQ(rig.filter->GetMediaType(-1, &offered), E_INVALIDARG);
    EXPECT_EQ(rig.filter->GetPin(1)->Disconnect(), S_OK);
    EXPECT_EQ(rig.filter->GetPin(0)->Disconnect(), S_OK);
}
