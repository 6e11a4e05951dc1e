#include "GraphHost.h"

#include <qedit.h>

#include <mutex>

#include "filter/dshow/DShowUtil.h"
#include "filter/dshow/Interfaces.h"

namespace ulvetta {
namespace test {

using dshow::ComRef;

namespace {

// Neither is declared in the headers; both symbols live in libstrmiids.
const CLSID kSampleGrabber = {0xC1F400A0, 0x3F08, 0x11d3, {0x9F, 0x0B, 0x00, 0x60, 0x08, 0x03, 0x9E, 0x37}};
const CLSID kNullRenderer = {0xC1F400A4, 0x3F08, 0x11d3, {0x9F, 0x0B, 0x00, 0x60, 0x08, 0x03, 0x9E, 0x37}};

// Collects every buffer the grabber sees. The grabber keeps a raw pointer: this object outlives the graph.
class Collector : public ISampleGrabberCB {
public:
    STDMETHODIMP QueryInterface(REFIID riid, void** ppv) override {
        if (riid == IID_IUnknown || riid == IID_ISampleGrabberCB) {
            *ppv = static_cast<ISampleGrabberCB*>(this);
            return S_OK;
        }
        *ppv = nullptr;
        return E_NOINTERFACE;
    }
    STDMETHODIMP_(ULONG) AddRef() override { return 2; }
    STDMETHODIMP_(ULONG) Release() override { return 1; }
    STDMETHODIMP SampleCB(double, IMediaSample*) override { return S_OK; }
    STDMETHODIMP BufferCB(double, BYTE* buffer, long length) override {
        std::lock_guard<std::mutex> g(m);
        bytes.insert(bytes.end(), buffer, buffer + length);
        return S_OK;
    }
    std::mutex m;
    std::vector<unsigned char> bytes;
};

HRESULT FindPin(IBaseFilter* f, PIN_DIRECTION dir, IPin** out) {
    ComRef<IEnumPins> e;
    HRESULT hr = f->EnumPins(e.put());
    if (FAILED(hr)) return hr;
    IPin* p = nullptr;
    while (e->Next(1, &p, nullptr) == S_OK) {
        PIN_DIRECTION d;
        p->QueryDirection(&d);
        if (d == dir) {
            *out = p;
            return S_OK;
        }
        p->Release();
    }
    return VFW_E_NOT_FOUND;
}

}  // namespace

GraphResult RunGraph(const std::wstring& wavPath, const std::vector<unsigned char>& state, bool replay) {
    GraphResult r;
    Collector collector;
    {
        auto fail = [&](const char* step, HRESULT hr) {
            r.hr = hr;
            r.step = step;
            return r;
        };
        ComRef<IGraphBuilder> graph;
        HRESULT hr = CoCreateInstance(CLSID_FilterGraph, nullptr, CLSCTX_INPROC_SERVER, IID_IGraphBuilder,
                                      reinterpret_cast<void**>(graph.put()));
        if (FAILED(hr)) return fail("create graph", hr);
        ComRef<IBaseFilter> source, reverb, grabber, renderer;
        hr = graph->AddSourceFilter(wavPath.c_str(), L"Source", source.put());
        if (FAILED(hr)) return fail("add source", hr);
        hr = CoCreateInstance(CLSID_UlvettaFilter, nullptr, CLSCTX_INPROC_SERVER, IID_IBaseFilter,
                              reinterpret_cast<void**>(reverb.put()));
        if (FAILED(hr)) return fail("create Ulvetta", hr);
        if (!state.empty()) {
            ComRef<IPersistStream> persist;
            ComRef<IStream> stream;
            hr = reverb->QueryInterface(IID_IPersistStream, reinterpret_cast<void**>(persist.put()));
            if (SUCCEEDED(hr)) hr = CreateStreamOnHGlobal(nullptr, TRUE, stream.put());
            if (SUCCEEDED(hr)) hr = stream->Write(state.data(), static_cast<ULONG>(state.size()), nullptr);
            if (SUCCEEDED(hr)) hr = stream->Seek(LARGE_INTEGER{}, STREAM_SEEK_SET, nullptr);
            if (SUCCEEDED(hr)) hr = persist->Load(stream.get());
            if (FAILED(hr)) return fail("load state", hr);
        }
        hr = graph->AddFilter(reverb.get(), L"Ulvetta");
        if (FAILED(hr)) return fail("add Ulvetta", hr);
        hr = CoCreateInstance(kSampleGrabber, nullptr, CLSCTX_INPROC_SERVER, IID_IBaseFilter,
                              reinterpret_cast<void**>(grabber.put()));
        if (FAILED(hr)) return fail("create grabber", hr);
        ComRef<ISampleGrabber> grab;
        grabber->QueryInterface(IID_ISampleGrabber, reinterpret_cast<void**>(grab.put()));
        grab->SetBufferSamples(FALSE);
        grab->SetCallback(&collector, 1);
        graph->AddFilter(grabber.get(), L"Grabber");
        hr = CoCreateInstance(kNullRenderer, nullptr, CLSCTX_INPROC_SERVER, IID_IBaseFilter,
                              reinterpret_cast<void**>(renderer.put()));
        if (FAILED(hr)) return fail("create renderer", hr);
        graph->AddFilter(renderer.get(), L"Null");

        ComRef<IPin> sourceOut, reverbIn, reverbOut, grabIn, grabOut, nullIn;
        FindPin(source.get(), PINDIR_OUTPUT, sourceOut.put());
        FindPin(reverb.get(), PINDIR_INPUT, reverbIn.put());
        FindPin(reverb.get(), PINDIR_OUTPUT, reverbOut.put());
        FindPin(grabber.get(), PINDIR_INPUT, grabIn.put());
        FindPin(grabber.get(), PINDIR_OUTPUT, grabOut.put());
        FindPin(renderer.get(), PINDIR_INPUT, nullIn.put());
        hr = graph->Connect(sourceOut.get(), reverbIn.get());  // brings in the WAVE parser
        if (FAILED(hr)) return fail("connect parser to Ulvetta", hr);
        hr = graph->ConnectDirect(reverbOut.get(), grabIn.get(), nullptr);
        if (FAILED(hr)) return fail("connect Ulvetta to grabber", hr);
        hr = graph->ConnectDirect(grabOut.get(), nullIn.get(), nullptr);
        if (FAILED(hr)) return fail("connect grabber to renderer", hr);
        AM_MEDIA_TYPE mt{};
        if (SUCCEEDED(grabIn->ConnectionMediaType(&mt)) && mt.pbFormat && mt.cbFormat >= sizeof(WAVEFORMATEX))
            r.format = *reinterpret_cast<WAVEFORMATEX*>(mt.pbFormat);
        dshow::FreeMediaType(mt);

        ComRef<IMediaSeeking> seeking;
        if (SUCCEEDED(graph->QueryInterface(IID_IMediaSeeking, reinterpret_cast<void**>(seeking.put()))))
            seeking->GetDuration(&r.duration);

        ComRef<IMediaFilter> mediaFilter;
        graph->QueryInterface(IID_IMediaFilter, reinterpret_cast<void**>(mediaFilter.put()));
        mediaFilter->SetSyncSource(nullptr);  // as fast as the processor allows
        ComRef<IMediaControl> control;
        ComRef<IMediaEvent> events;
        graph->QueryInterface(IID_IMediaControl, reinterpret_cast<void**>(control.put()));
        graph->QueryInterface(IID_IMediaEvent, reinterpret_cast<void**>(events.put()));
        hr = control->Run();
        if (FAILED(hr)) return fail("run", hr);
        // Our own deadline: WaitForCompletion and GetEvent may return early.
        auto waitForCompletion = [&]() -> HRESULT {
            const DWORD deadline = GetTickCount() + 120000;
            r.completed = false;
            while (!r.completed && GetTickCount() < deadline) {
                long code = 0;
                LONG_PTR p1 = 0, p2 = 0;
                if (events->GetEvent(&code, &p1, &p2, 100) == S_OK) {
                    events->FreeEventParams(code, p1, p2);
                    if (code == EC_COMPLETE) r.completed = true;
                    if (code == EC_ERRORABORT) return static_cast<HRESULT>(p1);
                }
            }
            return S_OK;
        };
        hr = waitForCompletion();
        if (FAILED(hr)) return fail("stream error", hr);
        if (replay && r.completed) {
            {
                std::lock_guard<std::mutex> g(collector.m);
                r.firstPassSamples = collector.bytes.size();
            }
            LONGLONG zero = 0;
            hr = seeking ? seeking->SetPositions(&zero, AM_SEEKING_AbsolutePositioning, nullptr,
                                                 AM_SEEKING_NoPositioning)
                         : E_NOINTERFACE;
            if (FAILED(hr)) return fail("seek", hr);
            hr = waitForCompletion();
            if (FAILED(hr)) return fail("stream error after the seek", hr);
        }
        control->Stop();
        graph->Disconnect(sourceOut.get());
        r.hr = S_OK;
    }
    const bool pcm16 = r.format.wFormatTag == WAVE_FORMAT_PCM;
    std::lock_guard<std::mutex> g(collector.m);
    if (pcm16) r.firstPassSamples /= 2; else r.firstPassSamples /= 4;
    if (pcm16) {
        const auto* s = reinterpret_cast<const int16_t*>(collector.bytes.data());
        for (size_t i = 0; i < collector.bytes.size() / 2; ++i) r.samples.push_back(s[i] / 32768.0f);
    } else {
        const auto* s = reinterpret_cast<const float*>(collector.bytes.data());
        r.samples.assign(s, s + collector.bytes.size() / 4);
    }
    return r;
}

}  // namespace test
}  // namespace ulvetta
