// Test set-up shared by the in-process filter tests: wave media types, a filter made by its class
// factory function, and a rig that connects it between two stand-in pins and streams samples through it.
#pragma once

#include <windows.h>
#include <dshow.h>
#include <mmreg.h>

#include <cstring>
#include <functional>
#include <vector>

#include "filter/dshow/ReverbFilter.h"

namespace ulvetta {
namespace test {

using dshow::ComRef;

// Build paths arrive as POSIX paths; Wine maps the root to drive Z:.
inline std::wstring WinePath(const std::string& posix) {
    std::wstring w = L"Z:";
    for (char c : posix) w += (c == '/') ? L'\\' : static_cast<wchar_t>(c);
    return w;
}

template <class I>
inline ComRef<I> Query(IUnknown* u) {
    ComRef<I> p;
    u->QueryInterface(__uuidof(I), reinterpret_cast<void**>(p.put()));
    return p;
}

template <class I>
inline HRESULT Create(REFCLSID clsid, ComRef<I>& out) {
    return CoCreateInstance(clsid, nullptr, CLSCTX_INPROC_SERVER, __uuidof(I), reinterpret_cast<void**>(out.put()));
}

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

// Owns one filter created through its class factory function.
struct FilterHolder {
    IUnknown* inner = nullptr;
    dshow::ReverbFilter* filter = nullptr;
    FilterHolder() {
        HRESULT hr = E_FAIL;
        inner = dshow::ReverbFilter::CreateInstance(nullptr, &hr);
        inner->AddRef();
        filter = static_cast<dshow::ReverbFilter*>(As<IBaseFilter>().get());
    }
    ~FilterHolder() { inner->Release(); }
    FilterHolder(const FilterHolder&) = delete;
    template <class I>
    ComRef<I> As() {
        return Query<I>(inner);
    }
    ReverbCore* Core() { return filter->Control().GetCore(); }
    // Formats of 16-bit stereo at a rate on both sides, dry only, streaming started: ready for direct
    // calls of the processing step.
    void StartDry16(DWORD rate) {
        WaveType pcm(WAVE_FORMAT_PCM, 2, rate, 16);
        filter->SetMediaType(PINDIR_INPUT, pcm);
        filter->SetMediaType(PINDIR_OUTPUT, pcm);
        Dry();
        Core()->startStreaming();
    }
    // No reverb and no pre-delay: the output is the input.
    void Dry() {
        Core()->setValue(kOutputLevelWet, -600);
        Core()->setValue(kPreDelay, 0);
    }
};

// A pin of a filter that does not exist: enough of IPin (and IMemInputPin downstream) to connect to.
// Downstream it offers no allocator but asks for buffers of a given size, and records what it receives.
class StandInPin : public IPin, public IMemInputPin {
public:
    StandInPin(PIN_DIRECTION dir, long bufferBytes) : dir_(dir), bufferBytes_(bufferBytes) {}
    STDMETHODIMP QueryInterface(REFIID riid, void** ppv) override {
        *ppv = riid == IID_IUnknown || riid == IID_IPin ? static_cast<void*>(static_cast<IPin*>(this))
               : riid == IID_IMemInputPin && dir_ == PINDIR_INPUT ? static_cast<IMemInputPin*>(this)
                                                                  : nullptr;
        return *ppv ? S_OK : E_NOINTERFACE;
    }
    STDMETHODIMP_(ULONG) AddRef() override { return 2; }
    STDMETHODIMP_(ULONG) Release() override { return 1; }
    STDMETHODIMP ReceiveConnection(IPin* connector, const AM_MEDIA_TYPE*) override {
        connected = connector;
        return S_OK;
    }
    STDMETHODIMP Disconnect() override { connected = nullptr; return S_OK; }
    STDMETHODIMP ConnectedTo(IPin** pin) override { *pin = connected; return connected ? S_OK : VFW_E_NOT_CONNECTED; }
    STDMETHODIMP QueryPinInfo(PIN_INFO* info) override {
        std::memset(info, 0, sizeof *info);
        info->dir = dir_;
        return S_OK;
    }
    STDMETHODIMP QueryDirection(PIN_DIRECTION* dir) override { *dir = dir_; return S_OK; }
    STDMETHODIMP EndOfStream() override {
        ++endOfStreams;
        if (onEndOfStream) onEndOfStream();
        return S_OK;
    }
    STDMETHODIMP GetAllocatorRequirements(ALLOCATOR_PROPERTIES* p) override {
        *p = ALLOCATOR_PROPERTIES{2, bufferBytes_, 1, 0};
        return S_OK;
    }
    STDMETHODIMP Receive(IMediaSample* s) override {
        if (!recording) return S_OK;
        Delivered d{};
        REFERENCE_TIME stop = 0;
        d.timed = s->GetTime(&d.start, &stop) == S_OK;
        d.discontinuity = s->IsDiscontinuity() == S_OK;
        BYTE* p = nullptr;
        s->GetPointer(&p);
        d.bytes.assign(p, p + s->GetActualDataLength());
        delivered.push_back(d);
        return S_OK;
    }
    // What the filter never needs from its neighbours.
    STDMETHODIMP Connect(IPin*, const AM_MEDIA_TYPE*) override { return E_NOTIMPL; }
    STDMETHODIMP ConnectionMediaType(AM_MEDIA_TYPE*) override { return E_NOTIMPL; }
    STDMETHODIMP QueryId(LPWSTR*) override { return E_NOTIMPL; }
    STDMETHODIMP QueryAccept(const AM_MEDIA_TYPE*) override { return S_OK; }
    STDMETHODIMP EnumMediaTypes(IEnumMediaTypes**) override { return E_NOTIMPL; }
    STDMETHODIMP QueryInternalConnections(IPin**, ULONG*) override { return E_NOTIMPL; }
    STDMETHODIMP BeginFlush() override { return S_OK; }
    STDMETHODIMP EndFlush() override { return S_OK; }
    STDMETHODIMP NewSegment(REFERENCE_TIME, REFERENCE_TIME, double) override { return S_OK; }
    STDMETHODIMP GetAllocator(IMemAllocator**) override { return VFW_E_NO_ALLOCATOR; }
    STDMETHODIMP NotifyAllocator(IMemAllocator*, BOOL) override { return S_OK; }
    STDMETHODIMP ReceiveMultiple(IMediaSample**, long, long*) override { return E_NOTIMPL; }
    STDMETHODIMP ReceiveCanBlock() override { return S_FALSE; }

    struct Delivered { bool timed; REFERENCE_TIME start; bool discontinuity; std::vector<BYTE> bytes; };
    std::vector<Delivered> delivered;
    bool recording = true;  // off: samples are accepted and dropped, nothing is allocated
    int endOfStreams = 0;
    std::function<void()> onEndOfStream;
    IPin* connected = nullptr;

private:
    PIN_DIRECTION dir_;
    long bufferBytes_;
};

// A filter connected between two stand-ins, dry only (the output is the input), paused and ready to
// receive stereo 16-bit PCM or float at a rate.
struct Rig {
    FilterHolder holder;
    dshow::ReverbFilter* filter = holder.filter;
    StandInPin upstream{PINDIR_OUTPUT, 0};
    StandInPin downstream;
    ComRef<IMemAllocator> source;
    WaveType type;

    Rig(DWORD rate, long outputBufferBytes, bool pcm16 = true)
        : downstream(PINDIR_INPUT, outputBufferBytes),
          type(pcm16 ? WAVE_FORMAT_PCM : WAVE_FORMAT_IEEE_FLOAT, 2, rate, pcm16 ? 16 : 32) {
        holder.Dry();
    }
    ~Rig() { filter->Stop(); }
    HRESULT Connect() {
        if (filter->GetPin(0) == nullptr) return E_OUTOFMEMORY;  // the pins are made on first use
        HRESULT hr = filter->GetPin(0)->ReceiveConnection(&upstream, type);
        if (SUCCEEDED(hr)) hr = filter->GetPin(1)->Connect(&downstream, nullptr);
        if (SUCCEEDED(hr)) hr = Create(CLSID_MemoryAllocator, source);
        if (FAILED(hr)) return hr;
        ALLOCATOR_PROPERTIES want{1, 1 << 16, 1, 0}, got{};
        source->SetProperties(&want, &got);
        source->Commit();
        return filter->Pause();
    }
    // Stops, disconnects both sides and connects again.
    HRESULT Reconnect() {
        filter->Stop();
        filter->GetPin(1)->Disconnect();
        filter->GetPin(0)->Disconnect();
        downstream.connected = nullptr;
        return Connect();
    }
    // Sends interleaved samples (int16_t or float, as the format) starting at a sample position.
    template <class T>
    HRESULT Send(const std::vector<T>& samples, int64_t position, bool discontinuity) {
        ComRef<IMediaSample> s;
        HRESULT hr = source->GetBuffer(s.put(), nullptr, nullptr, 0);
        if (FAILED(hr)) return hr;
        BYTE* p = nullptr;
        s->GetPointer(&p);
        std::memcpy(p, samples.data(), samples.size() * sizeof(T));
        s->SetActualDataLength(static_cast<long>(samples.size() * sizeof(T)));
        const DWORD rate = type.wf.Format.nSamplesPerSec;
        REFERENCE_TIME start = position * 10000000 / rate;
        REFERENCE_TIME stop = start + static_cast<REFERENCE_TIME>(samples.size() / 2) * 10000000 / rate;
        s->SetTime(&start, &stop);
        s->SetDiscontinuity(discontinuity);
        return Query<IMemInputPin>(filter->GetPin(0))->Receive(s.get());
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

inline ComRef<IStream> StreamOf(const std::vector<uint8_t>& bytes) {
    ComRef<IStream> s;
    CreateStreamOnHGlobal(nullptr, TRUE, s.put());
    s->Write(bytes.data(), static_cast<ULONG>(bytes.size()), nullptr);
    s->Seek(LARGE_INTEGER{}, STREAM_SEEK_SET, nullptr);
    return s;
}

// Frames of a 16-bit ramp whose two channels share a sign, so the reverb's mono input is not zero.
inline std::vector<int16_t> Ramp(int frames) {
    std::vector<int16_t> v(2 * frames);
    for (int i = 0; i < frames; ++i) {
        v[2 * i] = static_cast<int16_t>(i % 2000 + 1);
        v[2 * i + 1] = static_cast<int16_t>(i % 1500 + 1);
    }
    return v;
}

}  // namespace test
}  // namespace ulvetta
