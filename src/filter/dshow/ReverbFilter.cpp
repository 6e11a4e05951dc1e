// The reverb as a DirectShow transform filter.
//
// Streaming: Receive converts each input sample (16-bit PCM through float scratch, float directly), runs
// it through the core in one call or, while automation envelopes are active, in 5 ms chunks with the
// envelope values applied before each chunk, and delivers the result in output samples of the
// downstream allocator's size (an input larger than an output buffer continues in further samples without
// times). EndOfStream feeds silence with the flush flag until the core reports that the tail has ended.
#include "filter/dshow/ReverbFilter.h"

#include <mmreg.h>

#include <algorithm>
#include <cstring>
#include <new>
#include <vector>

#include "filter/CoreState.h"

namespace ulvetta {
namespace dshow {

namespace {


constexpr DWORD kMediaParamCount = kSoundParamCount;
// The longest tail the drain delivers before it ends the stream regardless, in seconds of audio: a
// safety net so that a host can never hang at end of stream.
constexpr int64_t kMaxDrainSeconds = 300;
// During a ramp the editor is refreshed every this many chunks.
constexpr int32_t kRefreshEveryChunks = 70;

// Builds the plain stereo type offered downstream from a (plain or extensible) input type.
HRESULT BuildStereoType(const AM_MEDIA_TYPE* src, AM_MEDIA_TYPE* dst) {
    const WAVEFORMATEX* f = WaveFormatOf(src);
    if (f == nullptr) return E_INVALIDARG;
    auto* w = static_cast<WAVEFORMATEX*>(CoTaskMemAlloc(sizeof(WAVEFORMATEX)));
    if (w == nullptr) return E_OUTOFMEMORY;
    std::memcpy(w, f, 16);
    w->wFormatTag = EffectiveFormatTag(src);
    w->nChannels = 2;
    w->nBlockAlign = static_cast<WORD>(w->wBitsPerSample / 8 * 2);
    w->nAvgBytesPerSec = w->nSamplesPerSec * w->nBlockAlign;
    w->cbSize = 0;
    *dst = *src;
    dst->pUnk = nullptr;
    dst->formattype = FORMAT_WaveFormatEx;
    if (w->wFormatTag == WAVE_FORMAT_PCM) dst->subtype = MEDIASUBTYPE_PCM;
    if (w->wFormatTag == WAVE_FORMAT_IEEE_FLOAT) dst->subtype = MEDIASUBTYPE_IEEE_FLOAT;
    dst->bFixedSizeSamples = TRUE;
    dst->lSampleSize = w->nBlockAlign;
    dst->cbFormat = sizeof(WAVEFORMATEX);
    dst->pbFormat = reinterpret_cast<BYTE*>(w);
    return S_OK;
}

// Copies ANSI text into a wide buffer of capacity characters, always terminated.
void AnsiToWide(const char* text, WCHAR* out, int capacity) {
    if (capacity <= 0) return;
    out[0] = L'\0';
    WCHAR wide[256];
    const int n = MultiByteToWideChar(CP_ACP, 0, text, -1, wide, 256);
    if (n <= 0) return;
    const int keep = std::min(n - 1, capacity - 1);
    std::memcpy(out, wide, keep * sizeof(WCHAR));
    out[keep] = L'\0';
}

}  // namespace

WORD EffectiveFormatTag(const AM_MEDIA_TYPE* mt) {
    const WAVEFORMATEX* f = WaveFormatOf(mt);
    if (f == nullptr) return 0;
    if (f->wFormatTag != WAVE_FORMAT_EXTENSIBLE) return f->wFormatTag;
    if (mt->cbFormat < sizeof(WAVEFORMATEXTENSIBLE) || f->cbSize < 22) return 0;
    const auto* x = reinterpret_cast<const WAVEFORMATEXTENSIBLE*>(f);
    // The KSDATAFORMAT subtypes are byte-identical to the DirectShow media subtypes.
    if (x->SubFormat == MEDIASUBTYPE_PCM) return WAVE_FORMAT_PCM;
    if (x->SubFormat == MEDIASUBTYPE_IEEE_FLOAT) return WAVE_FORMAT_IEEE_FLOAT;
    return 0;
}

IUnknown* ReverbFilter::CreateInstance(IUnknown* outer, HRESULT* hr) {
    try {
        auto* f = new ReverbFilter(outer, hr);
        if (FAILED(*hr)) {
            delete f;
            return nullptr;
        }
        return f->InnerUnknown();
    } catch (const std::bad_alloc&) {
        *hr = E_OUTOFMEMORY;
        return nullptr;
    }
}

ReverbFilter::ReverbFilter(IUnknown* outer, HRESULT* hr) : TransformFilter(CLSID_UlvettaFilter, outer) {
    InitializeCriticalSection(&paramLock_);
    control_.reset(new ReverbControl(outer_, static_cast<IPersistStream*>(this), &inputFormat_, &outputFormat_));
    const BYTE defaultOption = 0;  // the option byte of the "(Default)" host preset
    control_->SetOption(&defaultOption);
    *hr = S_OK;
}

ReverbFilter::~ReverbFilter() {
    DeleteCriticalSection(&paramLock_);
    control_.reset();
}

HRESULT STDMETHODCALLTYPE ReverbFilter::NonDelegatingQueryInterface(REFIID riid, void** ppv) {
    if (ppv == nullptr) return E_POINTER;
    void* p = nullptr;
    if (riid == __uuidof(IReverbControl))
        p = static_cast<IReverbControl*>(control_.get());
    else if (riid == IID_ISpecifyPropertyPages)
        p = static_cast<ISpecifyPropertyPages*>(this);
    else if (riid == IID_IPersistStream)
        p = static_cast<IPersistStream*>(this);
    else if (riid == __uuidof(IHostPresets))
        p = static_cast<IHostPresets*>(this);
    else if (riid == __uuidof(IMediaParamInfo))
        p = static_cast<IMediaParamInfo*>(this);
    else if (riid == __uuidof(IMediaParams))
        p = static_cast<IMediaParams*>(this);
    else if (riid == __uuidof(ICaptureCallbackSetter))
        p = static_cast<ICaptureCallbackSetter*>(this);
    if (p == nullptr) return TransformFilter::NonDelegatingQueryInterface(riid, ppv);
    *ppv = p;
    AddRef();
    return S_OK;
}

// ---- formats ----

HRESULT ReverbFilter::CheckInputType(const AM_MEDIA_TYPE* mt) {
    if (mt == nullptr) return E_POINTER;
    if (mt->majortype != MEDIATYPE_Audio || mt->bTemporalCompression) return E_INVALIDARG;
    const WAVEFORMATEX* f = WaveFormatOf(mt);
    if (f == nullptr || f->nChannels != 2) return E_INVALIDARG;
    if (f->nSamplesPerSec == 0 || f->nSamplesPerSec > kMaxSampleRate) return E_INVALIDARG;
    const WORD tag = EffectiveFormatTag(mt);
    if (tag == WAVE_FORMAT_PCM && f->wBitsPerSample == 16) return S_OK;
    if (tag == WAVE_FORMAT_IEEE_FLOAT && f->wBitsPerSample == 32) return S_OK;
    return E_INVALIDARG;
}

HRESULT ReverbFilter::CheckTransform(const AM_MEDIA_TYPE* in, const AM_MEDIA_TYPE* out) {
    if (in == nullptr || out == nullptr) return E_POINTER;
    if (in->majortype != MEDIATYPE_Audio || out->majortype != MEDIATYPE_Audio) return E_INVALIDARG;
    const WAVEFORMATEX* fi = WaveFormatOf(in);
    const WAVEFORMATEX* fo = WaveFormatOf(out);
    if (fi == nullptr || fo == nullptr || in->bTemporalCompression || out->bTemporalCompression) return E_INVALIDARG;
    if (EffectiveFormatTag(in) != EffectiveFormatTag(out) || fi->wBitsPerSample != fo->wBitsPerSample ||
        fi->nSamplesPerSec != fo->nSamplesPerSec || fo->nChannels != 2)
        return E_INVALIDARG;
    return S_OK;
}

HRESULT ReverbFilter::GetMediaType(int position, AM_MEDIA_TYPE* mt) {
    if (mt == nullptr) return E_POINTER;
    TransformInputPin* in = InputPin();
    if (in == nullptr || !in->IsConnected()) return E_UNEXPECTED;
    if (position < 0) return E_INVALIDARG;
    if (position > 0) return VFW_S_NO_MORE_ITEMS;
    return BuildStereoType(&in->MediaType(), mt);
}

HRESULT ReverbFilter::CheckInputPinMediaType(const AM_MEDIA_TYPE* mt) {
    HRESULT hr = CheckInputType(mt);
    if (hr != S_OK) return hr;
    TransformOutputPin* out = OutputPin();
    if (out && out->IsConnected() && CheckTransform(mt, &out->MediaType()) != S_OK) {
        // Ask downstream whether it would take the format this input would produce.
        AM_MEDIA_TYPE proposed{};
        hr = BuildStereoType(mt, &proposed);
        if (FAILED(hr)) return hr;
        hr = out->Connected()->QueryAccept(&proposed);
        FreeMediaType(proposed);
        return hr;
    }
    return S_OK;
}

HRESULT ReverbFilter::CompleteConnect(PIN_DIRECTION dir, IPin*) {
    if (dir == PINDIR_OUTPUT) return S_OK;
    TransformOutputPin* out = OutputPin();
    if (out && out->IsConnected() && CheckTransform(&InputPin()->MediaType(), &out->MediaType()) != S_OK) {
        if (Graph() == nullptr) return VFW_E_NOT_IN_GRAPH;
        return Graph()->Reconnect(out);
    }
    return S_OK;
}

HRESULT ReverbFilter::SetMediaType(PIN_DIRECTION dir, const AM_MEDIA_TYPE* mt) {
    const WAVEFORMATEX* f = WaveFormatOf(mt);
    if (f == nullptr) return E_INVALIDARG;
    WAVEFORMATEX& target = dir == PINDIR_INPUT ? inputFormat_ : outputFormat_;
    target.wFormatTag = EffectiveFormatTag(mt);
    target.nChannels = f->nChannels;
    target.nSamplesPerSec = f->nSamplesPerSec;
    target.wBitsPerSample = f->wBitsPerSample;
    target.nBlockAlign = static_cast<WORD>(f->wBitsPerSample / 8 * f->nChannels);
    target.nAvgBytesPerSec = target.nSamplesPerSec * target.nBlockAlign;
    target.cbSize = 0;
    control_->FormatChanged(dir == PINDIR_INPUT ? 0 : 1);
    return S_OK;
}

HRESULT ReverbFilter::DecideBufferSize(IMemAllocator* allocator, ALLOCATOR_PROPERTIES* request) {
    if (allocator == nullptr || request == nullptr) return E_POINTER;
    TransformInputPin* in = InputPin();
    if (in && in->IsConnected() && in->Allocator()) {
        ALLOCATOR_PROPERTIES upstream{};
        if (SUCCEEDED(in->Allocator()->GetProperties(&upstream))) *request = upstream;
    }
    if (request->cbAlign == 0) request->cbAlign = 1;
    ALLOCATOR_PROPERTIES actual{};
    HRESULT hr = allocator->SetProperties(request, &actual);
    if (FAILED(hr)) return hr;
    *request = actual;
    if (actual.cbBuffer < 512) return E_FAIL;
    return hr;
}

HRESULT ReverbFilter::StartStreaming() {
    streamStarted_ = true;
    return control_->StartStreaming() ? S_OK : E_OUTOFMEMORY;
}

HRESULT ReverbFilter::StopStreaming() {
    control_->StopStreaming();
    return S_OK;
}

// ---- streaming ----

void ReverbFilter::ApplyAutomationValue(int32_t id, float value) {
    ReverbCore* core = control_->GetCore();
    const ParamDesc* d = findParam(id);
    if (d == nullptr) return;
    if (d->automationType == 2 || d->automationType == 3)
        core->setValue(id, static_cast<int32_t>(value));
    else
        core->setNormalized(id, value);
}

bool ReverbFilter::AutomationActive(int64_t first, int64_t last) {
    for (const EnvelopeSegment& s : control_->segments) {
        const bool startInside = s.startSample >= first && s.startSample <= last;
        const bool endInside = s.endSample >= first && s.endSample <= last;
        const bool covers = s.startSample <= first && s.endSample >= last;
        if (startInside || endInside || covers) return true;
    }
    return false;
}

HRESULT ReverbFilter::Receive(IMediaSample* sample) {
    REFERENCE_TIME start = 0, stop = 0;
    const HRESULT timeResult = sample->GetTime(&start, &stop);
    if (FAILED(timeResult)) start = 0;
    const bool timed = timeResult == S_OK;
    blockPosition_ = RefTimeToSamples(start, inputFormat_.nSamplesPerSec);
    if (streamStarted_) {
        notifyCounter_ = 0;
        streamStarted_ = false;
    }
    BYTE* in = nullptr;
    HRESULT hr = sample->GetPointer(&in);
    if (FAILED(hr)) return hr;
    const long length = sample->GetActualDataLength();
    const int frames = inputFormat_.nBlockAlign ? static_cast<int>(length / inputFormat_.nBlockAlign) : 0;
    const int mode = sample->IsDiscontinuity() == S_OK ? kModeDiscontinuity : kModeOrdinary;
    return ProcessChunked(in, frames, mode, start, timed, sample);
}

HRESULT ReverbFilter::ProcessChunked(const BYTE* in, int frames, int mode, REFERENCE_TIME start,
                                     bool timed, IMediaSample* source) {
    const int inAlign = inputFormat_.nBlockAlign;
    const int outAlign = outputFormat_.nBlockAlign;
    // The automation chunk: 5 ms of input (at least one frame).
    const int step = std::max<int>(1, static_cast<int>(inputFormat_.nSamplesPerSec / 200));
    bool active;
    {
        CritSecLock g(paramLock_);
        auto& segs = control_->segments;
        segs.erase(std::remove_if(segs.begin(), segs.end(),
                                  [&](const EnvelopeSegment& s) { return s.endSample < blockPosition_; }),
                   segs.end());
        active = frames > 0 && AutomationActive(blockPosition_, blockPosition_ + frames - 1);
    }
    REFERENCE_TIME stop = 0;
    source->GetTime(&start, &stop);
    int offset = 0;
    bool first = true;
    HRESULT hr = S_OK;
    do {
        ComRef<IMediaSample> out;
        if (first) {
            hr = OutputPin()->GetDeliveryBuffer(out.put(), timed ? &start : nullptr, timed ? &stop : nullptr, 0);
            if (FAILED(hr)) return hr;
            out->SetTime(timed ? &start : nullptr, timed ? &stop : nullptr);
            out->SetSyncPoint(source->IsSyncPoint() == S_OK);
            out->SetDiscontinuity(source->IsDiscontinuity() == S_OK);
            LONGLONG mediaStart, mediaStop;
            if (source->GetMediaTime(&mediaStart, &mediaStop) == S_OK) out->SetMediaTime(&mediaStart, &mediaStop);
        } else {
            hr = OutputPin()->GetDeliveryBuffer(out.put(), nullptr, nullptr, 0);
            if (FAILED(hr)) return hr;
            out->SetTime(nullptr, nullptr);
        }
        BYTE* dst = nullptr;
        hr = out->GetPointer(&dst);
        if (FAILED(hr)) return hr;
        const int capacity = outAlign ? static_cast<int>(out->GetSize() / outAlign) : 0;
        if (capacity <= 0) return E_FAIL;
        int filled = 0;
        while (offset < frames && filled < capacity) {
            int length = std::min(frames - offset, capacity - filled);
            if (active) {
                length = std::min(length, step);
                const int64_t t = blockPosition_ + offset;
                const int64_t next = std::min<int64_t>(frames - offset - length, step);
                CritSecLock g(paramLock_);
                for (const EnvelopeSegment& s : control_->segments) {
                    if (t < s.startSample || t > s.endSample) continue;
                    ReverbCore* core = control_->GetCore();
                    if (t + next > s.endSample) {
                        ApplyAutomationValue(s.paramId, s.endValue);
                        core->notifyListeners(s.paramId);
                    } else if (t == s.startSample) {
                        ApplyAutomationValue(s.paramId, s.startValue);
                        core->notifyListeners(s.paramId);
                    } else {
                        const double span = static_cast<double>(s.endSample - s.startSample);
                        const double along = 1.0 - static_cast<double>(s.endSample - t) / span;
                        ApplyAutomationValue(s.paramId,
                                             static_cast<float>(s.startValue + along * (s.endValue - s.startValue)));
                        if (++notifyCounter_ >= kRefreshEveryChunks) {
                            notifyCounter_ = 0;
                            core->notifyListeners(s.paramId);
                        }
                    }
                }
            }
            bool shortfall = false;
            const int produced = control_->Process(mode, in + static_cast<size_t>(offset) * inAlign, length,
                                                   dst + static_cast<size_t>(filled) * outAlign, length, &shortfall);
            // Every frame handed to the core counts as consumed, also when it reports fewer: it has already
            // processed them, and handing them over again would run them twice (or loop for ever after the
            // tail trimming of an ended stream).
            offset += length;
            filled += produced;
        }
        out->SetActualDataLength(filled * outAlign);
        hr = OutputPin()->Deliver(out.get());
        if (FAILED(hr)) return hr;
        first = false;
        mode = kModeOrdinary;
    } while (offset < frames);
    return hr;
}

HRESULT ReverbFilter::EndOfStream() {
    TransformOutputPin* outPin = OutputPin();
    if (outPin == nullptr || !outPin->IsConnected()) return S_OK;
    const int64_t limit = kMaxDrainSeconds * static_cast<int64_t>(std::max<DWORD>(1, outputFormat_.nSamplesPerSec));
    int64_t drained = 0;
    for (;;) {
        ComRef<IMediaSample> out;
        HRESULT hr = outPin->GetDeliveryBuffer(out.put(), nullptr, nullptr, 0);
        if (FAILED(hr)) return hr;
        out->SetTime(nullptr, nullptr);
        BYTE* dst = nullptr;
        hr = out->GetPointer(&dst);
        if (FAILED(hr)) return hr;
        const int capacity = outputFormat_.nBlockAlign ? static_cast<int>(out->GetSize() / outputFormat_.nBlockAlign) : 0;
        bool shortfall = false;
        const int produced = control_->Process(kModeDrain, nullptr, 0, dst, capacity, &shortfall);
        drained += produced;
        if (shortfall || drained >= limit) {
            HRESULT delivered = S_OK;
            if (produced > 0) {
                out->SetActualDataLength(produced * outputFormat_.nBlockAlign);
                delivered = outPin->Deliver(out.get());
            }
            out.reset();
            const HRESULT eos = outPin->DeliverEndOfStream();
            return FAILED(delivered) ? delivered : eos;
        }
        out->SetActualDataLength(produced * outputFormat_.nBlockAlign);
        hr = outPin->Deliver(out.get());
        out.reset();
        if (FAILED(hr)) {
            outPin->DeliverEndOfStream();
            return hr;
        }
    }
}

HRESULT ReverbFilter::EndFlush() {
    // A flush precedes new data from another position: a stream that had ended plays on untrimmed.
    control_->GetCore()->resumeAfterFlush();
    return TransformFilter::EndFlush();
}

// ---- IPersistStream ----

STDMETHODIMP ReverbFilter::IsDirty() { return control_->IsDirty() ? S_OK : S_FALSE; }

STDMETHODIMP ReverbFilter::Load(IStream* stream) {
    if (stream == nullptr) return E_POINTER;
    BYTE buffer[1024] = {};
    ULONG got = 0;
    HRESULT hr = stream->Read(buffer, 20, &got);
    if (FAILED(hr)) return hr;
    const uint32_t size = getLe32(buffer);
    if (size <= 20) return E_UNEXPECTED;
    uint64_t wanted = size - 20;
    uint64_t read = 0;
    if (size <= sizeof buffer) {
        hr = stream->Read(buffer + 20, static_cast<ULONG>(wanted), &got);
        if (FAILED(hr)) return hr;
        read = got;
    } else {
        // A record larger than ours cannot be valid: consume it in bounded chunks without holding it.
        BYTE discard[1024];
        while (read < wanted) {
            const ULONG n = static_cast<ULONG>(std::min<uint64_t>(sizeof discard, wanted - read));
            got = 0;
            hr = stream->Read(discard, n, &got);
            if (FAILED(hr)) return hr;
            if (got == 0) break;  // the stream ended early
            read += got;
        }
    }
    // A record larger than the buffer is not ours; a short read leaves part of a record unknown. Both are
    // refused like any other invalid record, without changing a parameter.
    if (size > sizeof buffer || read < wanted) return E_UNEXPECTED;
    if (!control_->GetCore()->loadState(buffer, static_cast<int32_t>(size))) return E_UNEXPECTED;
    control_->RedrawWindows();
    return hr;
}

STDMETHODIMP ReverbFilter::Save(IStream* stream, BOOL) {
    if (stream == nullptr) return E_POINTER;
    ReverbCore* core = control_->GetCore();
    std::vector<uint8_t> buffer(core->stateSize());
    if (!core->saveState(buffer.data())) return E_UNEXPECTED;
    return stream->Write(buffer.data(), static_cast<ULONG>(buffer.size()), nullptr);
}

STDMETHODIMP ReverbFilter::GetSizeMax(ULARGE_INTEGER* size) {
    if (size == nullptr) return E_POINTER;
    size->LowPart = kCoreStateSize;
    size->HighPart = 0;
    return S_OK;
}

// ---- ISpecifyPropertyPages, IHostPresets ----

STDMETHODIMP ReverbFilter::GetPages(CAUUID* pages) {
    if (pages == nullptr) return E_POINTER;
    pages->cElems = 1;
    pages->pElems = static_cast<GUID*>(CoTaskMemAlloc(sizeof(GUID)));
    if (pages->pElems == nullptr) return E_OUTOFMEMORY;
    pages->pElems[0] = CLSID_UlvettaPropertyPage;
    return S_OK;
}

STDMETHODIMP ReverbFilter::GetPresetCount(DWORD* count) {
    if (count == nullptr) return E_POINTER;
    *count = 1;
    return S_OK;
}

STDMETHODIMP ReverbFilter::GetPresetName(DWORD index, WCHAR* buffer, int length) {
    if (index != 0) return E_INVALIDARG;
    if (buffer == nullptr) return E_POINTER;
    AnsiToWide("(Default)", buffer, length);
    return S_OK;
}

STDMETHODIMP ReverbFilter::SetPreset(DWORD index) {
    if (index != 0) return E_INVALIDARG;
    const BYTE option = 0;
    return control_->SetOption(&option);
}

// ---- media parameters ----

STDMETHODIMP ReverbFilter::GetParamCount(DWORD* count) {
    if (count == nullptr) return E_POINTER;
    *count = kMediaParamCount;
    return S_OK;
}

STDMETHODIMP ReverbFilter::GetParamInfo(DWORD index, MP_PARAMINFO* info) {
    if (index >= kMediaParamCount) return E_INVALIDARG;
    if (info == nullptr) return E_POINTER;
    CritSecLock g(paramLock_);
    ReverbCore* core = control_->GetCore();
    const ParamDesc* found = findParam(static_cast<int32_t>(index));
    if (found == nullptr) return E_INVALIDARG;
    const ParamDesc& d = *found;
    std::memset(info, 0, sizeof *info);
    if (d.automationType == 2) {
        info->mpType = MPT_BOOL;
        info->mopCaps = MP_CAPS_CURVE_JUMP;
        info->mpdMinValue = 0.0f;
        info->mpdMaxValue = 1.0f;
        info->mpdNeutralValue = core->getNormalized(d.id);
    } else if (d.automationType == 3) {
        info->mpType = MPT_ENUM;
        info->mopCaps = MP_CAPS_CURVE_JUMP;
        info->mpdMinValue = static_cast<MP_DATA>(d.minimum);
        info->mpdMaxValue = static_cast<MP_DATA>(d.maximum);
        info->mpdNeutralValue = static_cast<MP_DATA>(core->getValue(d.id));
    } else {
        info->mpType = MPT_FLOAT;
        info->mopCaps = MP_CAPS_CURVE_JUMP | MP_CAPS_CURVE_LINEAR;
        info->mpdMinValue = 0.0f;
        info->mpdMaxValue = 1.0f;
        info->mpdNeutralValue = core->getNormalized(d.id);
    }
    AnsiToWide(d.name, info->szLabel, 32);
    AnsiToWide((d.automationType == 2 || d.automationType == 3) ? d.label : "", info->szUnitText, 32);
    return S_OK;
}

STDMETHODIMP ReverbFilter::GetParamText(DWORD index, WCHAR** text) {
    if (index >= kMediaParamCount) return E_INVALIDARG;
    if (text == nullptr) return E_POINTER;
    CritSecLock g(paramLock_);
    const ParamDesc* found = findParam(static_cast<int32_t>(index));
    if (found == nullptr) return E_INVALIDARG;
    const ParamDesc& d = *found;
    constexpr int kChars = 256;  // a 512-byte block
    auto* block = static_cast<WCHAR*>(CoTaskMemAlloc(kChars * sizeof(WCHAR)));
    if (block == nullptr) return E_OUTOFMEMORY;
    std::memset(block, 0, kChars * sizeof(WCHAR));
    int at = 0;
    auto append = [&](const char* s) {
        if (at >= kChars - 1) return;
        AnsiToWide(s, block + at, kChars - 1 - at);
        at += static_cast<int>(wcslen(block + at)) + 1;
    };
    append(d.name);
    append((d.automationType == 2 || d.automationType == 3) ? d.label : "");
    *text = block;
    return S_OK;
}

STDMETHODIMP ReverbFilter::GetNumTimeFormats(DWORD* count) {
    if (count == nullptr) return E_POINTER;
    *count = 1;
    return S_OK;
}

STDMETHODIMP ReverbFilter::GetSupportedTimeFormat(DWORD index, GUID* format) {
    if (format == nullptr) return E_POINTER;
    if (index != 0) return E_INVALIDARG;
    *format = GUID_UlvettaTimeReference;
    return S_OK;
}

STDMETHODIMP ReverbFilter::GetCurrentTimeFormat(GUID* format, MP_TIMEDATA* data) {
    if (format == nullptr || data == nullptr) return E_POINTER;
    *format = GUID_UlvettaTimeReference;
    *data = 0;
    return S_OK;
}

STDMETHODIMP ReverbFilter::GetParam(DWORD index, MP_DATA* value) {
    if (index >= kMediaParamCount) return E_INVALIDARG;
    if (value == nullptr) return E_POINTER;
    ReverbCore* core = control_->GetCore();
    const ParamDesc* d = findParam(static_cast<int32_t>(index));
    if (d == nullptr) return E_INVALIDARG;
    *value = (d->automationType == 2 || d->automationType == 3) ? static_cast<MP_DATA>(core->getValue(d->id))
                                                                : core->getNormalized(d->id);
    return S_OK;
}

STDMETHODIMP ReverbFilter::SetParam(DWORD index, MP_DATA value) {
    if (index != kAllParams && index >= kMediaParamCount) return E_INVALIDARG;
    CritSecLock g(paramLock_);
    const DWORD first = index == kAllParams ? 0 : index;
    const DWORD last = index == kAllParams ? kMediaParamCount - 1 : index;
    for (DWORD k = first; k <= last; ++k) {
        ApplyAutomationValue(static_cast<int32_t>(k), value);
        control_->GetCore()->notifyListeners(static_cast<int32_t>(k));
    }
    return S_OK;
}

void ReverbFilter::RemoveSegments(int32_t id, int64_t s0, int64_t s1) {
    auto& segs = control_->segments;
    segs.erase(std::remove_if(segs.begin(), segs.end(),
                              [&](const EnvelopeSegment& s) {
                                  if (s.paramId != id) return false;
                                  const bool s0In = s0 >= s.startSample && s0 <= s.endSample;
                                  const bool s1In = s1 >= s.startSample && s1 <= s.endSample;
                                  const bool inside = s0 < s.startSample && s1 > s.endSample;
                                  return s0In || s1In || inside;
                              }),
               segs.end());
}

STDMETHODIMP ReverbFilter::AddEnvelope(DWORD index, DWORD count, MP_ENVELOPE_SEGMENT* segments) {
    if (index != kAllParams && index >= kMediaParamCount) return E_INVALIDARG;
    if (segments == nullptr) return E_POINTER;
    CritSecLock g(paramLock_);
    // Times become samples at the input rate: without an input format there is nothing to convert with.
    const DWORD rate = inputFormat_.nSamplesPerSec;
    if (rate == 0) return VFW_E_NOT_CONNECTED;
    if (static_cast<LONG>(count) <= 0) return S_OK;
    const DWORD first = index == kAllParams ? 0 : index;
    const DWORD last = index == kAllParams ? kMediaParamCount - 1 : index;
    for (DWORD k = first; k <= last; ++k) {
        for (DWORD i = 0; i < count; ++i) {
            const MP_ENVELOPE_SEGMENT& s = segments[i];
            EnvelopeSegment e{static_cast<int32_t>(k), RefTimeToSamples(s.rtStart, rate), RefTimeToSamples(s.rtEnd, rate),
                              s.valStart, s.valEnd, (s.iCurve & 1) != 0};
            RemoveSegments(e.paramId, e.startSample, e.endSample);
            control_->segments.push_back(e);
        }
    }
    return S_OK;
}

STDMETHODIMP ReverbFilter::FlushEnvelope(DWORD index, REFERENCE_TIME start, REFERENCE_TIME stop) {
    if (index != kAllParams && index >= kMediaParamCount) return E_INVALIDARG;
    CritSecLock g(paramLock_);
    const DWORD rate = inputFormat_.nSamplesPerSec;
    if (rate == 0) return S_OK;
    const int64_t s0 = RefTimeToSamples(start, rate), s1 = RefTimeToSamples(stop, rate);
    const DWORD first = index == kAllParams ? 0 : index;
    const DWORD last = index == kAllParams ? kMediaParamCount - 1 : index;
    for (DWORD k = first; k <= last; ++k) RemoveSegments(static_cast<int32_t>(k), s0, s1);
    return S_OK;
}

STDMETHODIMP ReverbFilter::SetTimeFormat(GUID, MP_TIMEDATA) { return S_OK; }

STDMETHODIMP ReverbFilter::SetCaptureCallback(ICaptureCallback* callback) {
    uiCallback_ = callback;
    control_->GetCore()->setCaptureTarget(this);
    return S_OK;
}

void ReverbFilter::captureParameter(int32_t id, float) {
    if (uiCallback_ == nullptr || id < 0 || id >= static_cast<int32_t>(kMediaParamCount)) return;
    DWORD k = static_cast<DWORD>(id);  // media-parameter index k is parameter id k
    MP_DATA value = 0;
    GetParam(k, &value);
    uiCallback_->BeginCapture(&k, 1);
    uiCallback_->Changed(&k, 1, &value);
    uiCallback_->EndCapture(&k, 1);
}

}  // namespace dshow
}  // namespace ulvetta
