// Builds real DirectShow graphs around Ulvetta for the tests: File Source -> WAVE Parser -> Ulvetta ->
// SampleGrabber -> Null Renderer, with no reference clock, and collects what reaches the grabber.
#pragma once

#include <dshow.h>
#include <qedit.h>

#include <cstring>
#include <functional>
#include <mutex>
#include <string>
#include <vector>

#include "FilterRig.h"

namespace ulvetta {
namespace test {

using dshow::ComRef;

struct GraphResult {
    HRESULT hr = E_FAIL;          // the first failure while building or running, else S_OK
    std::string step;             // where it failed
    WAVEFORMATEX format{};        // the grabber's connection format
    std::vector<float> samples;   // interleaved output, 16-bit scaled by 1/32768
    bool completed = false;       // EC_COMPLETE arrived
    LONGLONG duration = -1;       // the graph's duration, asked through the filters' seeking pass-through
    size_t firstPassSamples = 0;  // samples collected before a replay
};

// Neither is declared in the headers; both symbols live in libstrmiids.
inline const CLSID kSampleGrabber = {0xC1F400A0, 0x3F08, 0x11d3, {0x9F, 0x0B, 0x00, 0x60, 0x08, 0x03, 0x9E, 0x37}};
inline const CLSID kNullRenderer = {0xC1F400A4, 0x3F08, 0x11d3, {0x9F, 0x0B, 0x00, 0x60, 0x08, 0x03, 0x9E, 0x37}};

// Collects every buffer the grabber sees. The grabber keeps a raw pointer: this object outlives the graph.
class Collector : public ISampleGrabberCB {
public:
    STDMETHODIMP QueryInterface(REFIID riid, void** ppv) override {
        *ppv = riid == IID_IUnknown || riid == IID_ISampleGrabberCB ? this : nullptr;
        return *ppv ? S_OK : E_NOINTERFACE;
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

// The filter's first pin of a direction, or null.
inline ComRef<IPin> FindPin(IBaseFilter* f, PIN_DIRECTION dir) {
    ComRef<IEnumPins> e;
    f->EnumPins(e.put());
    ComRef<IPin> p;
    PIN_DIRECTION d;
    while (e->Next(1, p.put(), nullptr) == S_OK)
        if (SUCCEEDED(p->QueryDirection(&d)) && d == dir) return p;
    return ComRef<IPin>();
}

// How a graph runs besides its file.
struct GraphOptions {
  std::vector<unsigned char> state;  // an 88-byte settings record to load first (may be empty)
  bool replay = false;  // after the end of the stream, seek back to the start while running and play it once more
  IBaseFilter* filter = nullptr;  // the filter to run; null: one created through the registered server
  bool realTime = false;          // keep the graph's clock: the stream takes as long as it plays
  std::function<void()> whileRunning;  // called once the graph runs, before waiting for its end
};

// Runs a WAV file through the filter.
inline GraphResult RunGraph(const std::wstring& wavPath, const GraphOptions& options) {
  const std::vector<unsigned char>& state = options.state;
  const bool replay = options.replay;
    GraphResult r;
    Collector collector;
    {
        auto ok = [&](const char* step, HRESULT hr) {
            if (FAILED(hr)) r.hr = hr, r.step = step;
            return SUCCEEDED(hr);
        };
        ComRef<IGraphBuilder> graph;
        ComRef<IBaseFilter> source, reverb, grabber, renderer;
        if (!ok("create graph", Create(CLSID_FilterGraph, graph))) return r;
        if (!ok("add source", graph->AddSourceFilter(wavPath.c_str(), L"Source", source.put()))) return r;
        if (options.filter)
            reverb.reset(options.filter);
        else if (!ok("create Ulvetta", Create(CLSID_UlvettaFilter, reverb)))
            return r;
        if (!state.empty() && !ok("load state", Query<IPersistStream>(reverb.get())->Load(StreamOf(state).get())))
            return r;
        if (!ok("add Ulvetta", graph->AddFilter(reverb.get(), L"Ulvetta"))) return r;
        if (!ok("create grabber", Create(kSampleGrabber, grabber))) return r;
        ComRef<ISampleGrabber> grab = Query<ISampleGrabber>(grabber.get());
        grab->SetBufferSamples(FALSE);
        grab->SetCallback(&collector, 1);
        graph->AddFilter(grabber.get(), L"Grabber");
        if (!ok("create renderer", Create(kNullRenderer, renderer))) return r;
        graph->AddFilter(renderer.get(), L"Null");

        ComRef<IPin> sourceOut = FindPin(source.get(), PINDIR_OUTPUT), grabIn = FindPin(grabber.get(), PINDIR_INPUT);
        // The graph brings in the WAVE parser.
        if (!ok("connect parser", graph->Connect(sourceOut.get(), FindPin(reverb.get(), PINDIR_INPUT).get()))) return r;
        if (!ok("connect Ulvetta to grabber",
                graph->ConnectDirect(FindPin(reverb.get(), PINDIR_OUTPUT).get(), grabIn.get(), nullptr)))
            return r;
        ComRef<IPin> grabOut = FindPin(grabber.get(), PINDIR_OUTPUT), nullIn = FindPin(renderer.get(), PINDIR_INPUT);
        if (!ok("connect grabber to renderer", graph->ConnectDirect(grabOut.get(), nullIn.get(), nullptr))) return r;
        AM_MEDIA_TYPE mt{};
        if (SUCCEEDED(grabIn->ConnectionMediaType(&mt)) && mt.pbFormat && mt.cbFormat >= sizeof(WAVEFORMATEX))
            r.format = *reinterpret_cast<WAVEFORMATEX*>(mt.pbFormat);
        dshow::FreeMediaType(mt);

        ComRef<IMediaSeeking> seeking = Query<IMediaSeeking>(graph.get());
        if (seeking) seeking->GetDuration(&r.duration);
        if (!options.realTime) Query<IMediaFilter>(graph.get())->SetSyncSource(nullptr);  // as fast as possible
        ComRef<IMediaControl> control = Query<IMediaControl>(graph.get());
        ComRef<IMediaEvent> events;
        graph->QueryInterface(IID_IMediaEvent, reinterpret_cast<void**>(events.put()));
        if (!ok("run", control->Run())) return r;
        if (options.whileRunning) options.whileRunning();
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
        if (!ok("stream error", waitForCompletion())) return r;
        if (replay && r.completed) {
            {
                std::lock_guard<std::mutex> g(collector.m);
                r.firstPassSamples = collector.bytes.size();
            }
            LONGLONG zero = 0;
            const HRESULT seek = seeking ? seeking->SetPositions(&zero, AM_SEEKING_AbsolutePositioning, nullptr,
                                                                 AM_SEEKING_NoPositioning)
                                         : E_NOINTERFACE;
            if (!ok("seek", seek) || !ok("stream error after the seek", waitForCompletion())) return r;
        }
        control->Stop();
        graph->Disconnect(sourceOut.get());
        r.hr = S_OK;
    }
    const size_t width = r.format.wFormatTag == WAVE_FORMAT_PCM ? 2 : 4;  // bytes per sample
    std::lock_guard<std::mutex> g(collector.m);
    r.firstPassSamples /= width;
    r.samples.resize(collector.bytes.size() / width);
    for (size_t i = 0; i < r.samples.size(); ++i) {
        const unsigned char* p = collector.bytes.data() + i * width;
        int16_t v16;
        if (width == 2) std::memcpy(&v16, p, 2), r.samples[i] = v16 / 32768.0f;
        else std::memcpy(&r.samples[i], p, 4);
    }
    return r;
}

}  // namespace test
}  // namespace ulvetta
