// The reverb as a DirectShow transform filter.
//
// Streaming (upstream's streaming thread): Receive converts each input sample (16-bit PCM through float
// scratch sized before streaming starts, float directly), runs it through the core in one call or,
// while automation envelopes are active, in 5 ms chunks with the envelope values applied before each
// chunk, and delivers the result in output samples of the downstream allocator's size (an input larger
// than an output buffer continues in further samples without times). EndOfStream feeds silence with the
// flush flag until the core reports that the tail has ended. Nothing on this path allocates.
//
// Control (graph and editor threads): formats, saved state, presets, media parameters and the capture
// callback. Every COM method runs its body through ComBoundary, so no exception reaches a caller.
#include "filter/dshow/ReverbFilter.h"

#include <mmreg.h>

#include <algorithm>
#include <cstring>
#include <new>
#include <vector>

#include "filter/CoreState.h"
#include "filter/MediaFormat.h"
#include "filter/PersistRecord.h"

namespace ulvetta {
namespace dshow {

namespace {


constexpr DWORD kMediaParamCount = kSoundParamCount;
// The longest tail the drain delivers before it ends the stream regardless, in seconds of audio: a
// safety net so that a host can never hang at end of stream.
constexpr int64_t kMaxDrainSeconds = 300;

// The format checks' view of a media type: major type, compression flag and format block.
MediaFormat FormatOf(const AM_MEDIA_TYPE* mt) {
    if (mt == nullptr) return MediaFormat{};
    return MediaFormat{mt->majortype == MEDIATYPE_Audio, mt->bTemporalCompression != FALSE, mt->pbFormat,
                       mt->pbFormat != nullptr ? mt->cbFormat : 0};
}

// The type offered downstream: a copy of the input type rewritten as a stereo type.
HRESULT StereoCopyOf(const AM_MEDIA_TYPE* src, AM_MEDIA_TYPE* dst) {
    WaveFormat f;
    if (!FormatOf(src).wave(&f)) return E_INVALIDARG;
    HRESULT hr = CopyMediaType(dst, src);
    if (FAILED(hr)) return hr;
    makeStereoBlock(dst->pbFormat, dst->cbFormat);
    return S_OK;
}

// The description of a media parameter: a pointer into the constant table, null for an index beyond it.
const ParamDesc* Describe(DWORD index) {
    return index < kMediaParamCount ? findParam(static_cast<int32_t>(index)) : nullptr;
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

// An IStream as the source of a settings record; keeps the result of the last read.
struct StreamReader : RecordSource {
    explicit StreamReader(IStream* s) : stream(s) {}
    bool read(uint8_t* data, uint32_t count, uint32_t* got) override {
        ULONG n = 0;
        result = stream->Read(data, count, &n);
        *got = n;
        return SUCCEEDED(result);
    }
    IStream* stream;
    HRESULT result = S_OK;
};

}  // namespace

IUnknown* ReverbFilter::CreateInstance(IUnknown* outer, HRESULT* hr) {
    try {
        auto* f = new ReverbFilter(outer);
        *hr = S_OK;
        return f->InnerUnknown();
    } catch (const std::bad_alloc&) {
        *hr = E_OUTOFMEMORY;
    } catch (...) {
        *hr = E_FAIL;
    }
    return nullptr;
}

ReverbFilter::ReverbFilter(IUnknown* outer)
    : TransformFilter(CLSID_UlvettaFilter, outer),
      control_(new ReverbControl(outer_, static_cast<IPersistStream*>(this), &inputFormat_, &outputFormat_)),
      automationSink_(*control_->GetCore()) {
    InitializeCriticalSection(&paramLock_);
    InitializeCriticalSection(&callbackLock_);
    const BYTE defaultOption = 0;  // the option byte of the "(Default)" host preset
    control_->SetOption(&defaultOption);
}

ReverbFilter::~ReverbFilter() {
    control_->GetCore()->setCaptureTarget(nullptr);
    if (uiCallback_) uiCallback_->Release();
    DeleteCriticalSection(&callbackLock_);
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
    return FormatOf(mt).acceptableInput() ? S_OK : E_INVALIDARG;
}

HRESULT ReverbFilter::CheckTransform(const AM_MEDIA_TYPE* in, const AM_MEDIA_TYPE* out) {
    if (in == nullptr || out == nullptr) return E_POINTER;
    return FormatOf(in).transformsTo(FormatOf(out)) ? S_OK : E_INVALIDARG;
}

HRESULT ReverbFilter::GetMediaType(int position, AM_MEDIA_TYPE* mt) {
    if (mt == nullptr) return E_POINTER;
    TransformInputPin* in = InputPin();
    if (in == nullptr || !in->IsConnected()) return E_UNEXPECTED;
    if (position < 0) return E_INVALIDARG;
    if (position > 0) return VFW_S_NO_MORE_ITEMS;
    return StereoCopyOf(&in->MediaType(), mt);
}

HRESULT ReverbFilter::CheckInputPinMediaType(const AM_MEDIA_TYPE* mt) {
    HRESULT hr = CheckInputType(mt);
    if (hr != S_OK) return hr;
    TransformOutputPin* out = OutputPin();
    if (out && out->IsConnected() && CheckTransform(mt, &out->MediaType()) != S_OK) {
        // Ask downstream whether it would take the format this input would produce.
        AM_MEDIA_TYPE proposed{};
        hr = StereoCopyOf(mt, &proposed);
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
    const MediaFormat format = FormatOf(mt);
    WaveFormat f;
    if (!format.wave(&f)) return E_INVALIDARG;
    f = format.normalised();
    // The output's sample format is the input's: our offered copy of an extensible input keeps its tag
    // with no extension, which names no sample format of its own.
    if (dir == PINDIR_OUTPUT && f.formatTag == 0) f.formatTag = inputFormat_.wFormatTag;
    WAVEFORMATEX& target = dir == PINDIR_INPUT ? inputFormat_ : outputFormat_;
    target.wFormatTag = f.formatTag;
    target.nChannels = f.channels;
    target.nSamplesPerSec = f.samplesPerSec;
    target.wBitsPerSample = f.bitsPerSample;
    target.nBlockAlign = f.blockAlign;
    target.nAvgBytesPerSec = f.avgBytesPerSec;
    target.cbSize = 0;
    if (dir == PINDIR_INPUT) {
        CritSecLock g(paramLock_);
        automation_.setSampleRate(target.nSamplesPerSec);
    }
    ChangeCore([&] { control_->FormatChanged(dir == PINDIR_INPUT ? 0 : 1); });
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
    ReserveScratch();
    return hr;
}

void ReverbFilter::ReserveScratch() {
    // The output allocator copies the input's properties, but each is asked so that a differing
    // downstream allocator is covered too; a larger sample still works, in pieces.
    long bytes = 0;
    ALLOCATOR_PROPERTIES p{};
    TransformInputPin* in = InputPin();
    if (in && in->Allocator() && SUCCEEDED(in->Allocator()->GetProperties(&p))) bytes = std::max(bytes, p.cbBuffer);
    TransformOutputPin* out = OutputPin();
    if (out && out->Allocator() && SUCCEEDED(out->Allocator()->GetProperties(&p))) bytes = std::max(bytes, p.cbBuffer);
    const WORD align = std::max<WORD>(1, std::min(inputFormat_.nBlockAlign, outputFormat_.nBlockAlign));
    if (bytes > 0) control_->ReserveFrames(static_cast<size_t>(bytes) / align);
}

HRESULT ReverbFilter::StartStreaming() {
    ReserveScratch();
    streamStarted_ = true;
    if (!ChangeCore([&] { return control_->StartStreaming(); })) return E_OUTOFMEMORY;
    rebuildPending_ = false;  // starting rebuilt the network whole
    return S_OK;
}

HRESULT ReverbFilter::StopStreaming() {
    control_->StopStreaming();
    return S_OK;
}

// ---- streaming ----

HRESULT ReverbFilter::Receive(IMediaSample* sample) {
    REFERENCE_TIME start = 0, stop = 0;
    const HRESULT timeResult = sample->GetTime(&start, &stop);
    if (FAILED(timeResult)) start = 0;
    const bool timed = timeResult == S_OK;
    blockPosition_ = refTimeToSamples(start, inputFormat_.nSamplesPerSec);
    BYTE* in = nullptr;
    HRESULT hr = sample->GetPointer(&in);
    if (FAILED(hr)) return hr;
    const long length = sample->GetActualDataLength();
    const int frames = inputFormat_.nBlockAlign ? static_cast<int>(length / inputFormat_.nBlockAlign) : 0;
    const int mode = sample->IsDiscontinuity() == S_OK ? kModeDiscontinuity : kModeOrdinary;
    return ProcessChunked(in, frames, mode, timed, sample);
}

HRESULT ReverbFilter::RebuildIfPending() {
    if (!rebuildPending_) return S_OK;
    // Starting the stream again rebuilds the whole network (it allocates, as a failure is being mended).
    const HRESULT hr = ComBoundary([&] { return control_->GetCore()->startStreaming() ? S_OK : E_OUTOFMEMORY; });
    if (SUCCEEDED(hr)) rebuildPending_ = false;
    return hr;
}

HRESULT ReverbFilter::ProcessChunked(const BYTE* in, int frames, int mode, bool timed, IMediaSample* source) {
    HRESULT hr = RebuildIfPending();
    if (FAILED(hr)) return hr;
    const int inAlign = inputFormat_.nBlockAlign;
    const int outAlign = outputFormat_.nBlockAlign;
    bool active;
    {
        CritSecLock g(paramLock_);
        if (streamStarted_) {
            automation_.restartRefreshCount();
            streamStarted_ = false;
        }
        active = automation_.beginBlock(blockPosition_, frames);
    }
    REFERENCE_TIME start = 0, stop = 0;
    source->GetTime(&start, &stop);
    int offset = 0;
    bool first = true;
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
                CritSecLock g(paramLock_);
                length = ChangeCore(
                    [&] { return automation_.applyChunk(blockPosition_ + offset, frames - offset, length, automationSink_); });
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
    const WORD align = outputFormat_.nBlockAlign;
    HRESULT rebuilt = RebuildIfPending();
    if (FAILED(rebuilt)) return rebuilt;
    int64_t drained = 0;
    for (;;) {
        ComRef<IMediaSample> out;
        HRESULT hr = outPin->GetDeliveryBuffer(out.put(), nullptr, nullptr, 0);
        if (FAILED(hr)) return hr;
        out->SetTime(nullptr, nullptr);
        BYTE* dst = nullptr;
        hr = out->GetPointer(&dst);
        if (FAILED(hr)) return hr;
        const int capacity = align ? static_cast<int>(out->GetSize() / align) : 0;
        bool shortfall = false;
        const int produced = control_->Process(kModeDrain, nullptr, 0, dst, capacity, &shortfall);
        drained += produced;
        const bool last = shortfall || drained >= limit;
        if (!last || produced > 0) {
            out->SetActualDataLength(produced * align);
            hr = outPin->Deliver(out.get());
        }
        out.reset();
        if (last || FAILED(hr)) {
            const HRESULT eos = outPin->DeliverEndOfStream();
            return FAILED(hr) ? hr : eos;
        }
    }
}

HRESULT ReverbFilter::EndFlush() {
    // A flush precedes new data from another position: a stream that had ended plays on untrimmed.
    control_->GetCore()->resumeAfterFlush();
    return TransformFilter::EndFlush();
}

// ---- IPersistStream ----

STDMETHODIMP ReverbFilter::IsDirty() {
    return ComBoundary([&] { return control_->IsDirty() ? S_OK : S_FALSE; });
}

STDMETHODIMP ReverbFilter::Load(IStream* stream) {
    if (stream == nullptr) return E_POINTER;
    return ComBoundary([&]() -> HRESULT {
        StreamReader reader(stream);
        PersistRecord record;
        switch (record.read(reader)) {
            case PersistRecord::Result::StreamError: return reader.result;
            case PersistRecord::Result::Refused: return E_UNEXPECTED;
            case PersistRecord::Result::Complete: break;
        }
        if (!ChangeCore([&] { return control_->GetCore()->loadState(record.bytes(), record.size()); }))
            return E_UNEXPECTED;
        control_->RedrawWindows();
        return reader.result;
    });
}

STDMETHODIMP ReverbFilter::Save(IStream* stream, BOOL clearDirty) {
    if (stream == nullptr) return E_POINTER;
    return ComBoundary([&]() -> HRESULT {
        ReverbCore* core = control_->GetCore();
        uint8_t buffer[kCoreStateSize];
        if (core->stateSize() != kCoreStateSize || !core->saveState(buffer)) return E_UNEXPECTED;
        const HRESULT hr = stream->Write(buffer, kCoreStateSize, nullptr);
        if (SUCCEEDED(hr) && clearDirty) control_->MarkClean(buffer);
        return hr;
    });
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
    return ComBoundary([&]() -> HRESULT {
        CritSecLock g(paramLock_);
        ReverbCore* core = control_->GetCore();
        const ParamDesc* found = Describe(index);
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
        AnsiToWide(automatedByValue(d) ? d.label : "", info->szUnitText, 32);
        return S_OK;
    });
}

STDMETHODIMP ReverbFilter::GetParamText(DWORD index, WCHAR** text) {
    if (index >= kMediaParamCount) return E_INVALIDARG;
    if (text == nullptr) return E_POINTER;
    return ComBoundary([&]() -> HRESULT {
        CritSecLock g(paramLock_);
        const ParamDesc* found = Describe(index);
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
        append(automatedByValue(d) ? d.label : "");
        *text = block;
        return S_OK;
    });
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
    return ComBoundary([&] {
        *value = automationSink_.read(static_cast<int32_t>(index));
        return S_OK;
    });
}

STDMETHODIMP ReverbFilter::SetParam(DWORD index, MP_DATA value) {
    if (index != kAllParams && index >= kMediaParamCount) return E_INVALIDARG;
    return ComBoundary([&] {
        CritSecLock g(paramLock_);
        const DWORD first = index == kAllParams ? 0 : index;
        const DWORD last = index == kAllParams ? kMediaParamCount - 1 : index;
        for (DWORD k = first; k <= last; ++k) {
            ChangeCore([&] { automationSink_.apply(static_cast<int32_t>(k), value); });
            automationSink_.refresh(static_cast<int32_t>(k));
        }
        return S_OK;
    });
}

STDMETHODIMP ReverbFilter::AddEnvelope(DWORD index, DWORD count, MP_ENVELOPE_SEGMENT* segments) {
    if (index != kAllParams && index >= kMediaParamCount) return E_INVALIDARG;
    if (segments == nullptr) return E_POINTER;
    return ComBoundary([&]() -> HRESULT {
        CritSecLock g(paramLock_);
        // Times become samples at the input rate: without an input format there is nothing to convert with.
        const DWORD rate = inputFormat_.nSamplesPerSec;
        if (rate == 0) return VFW_E_NOT_CONNECTED;
        if (static_cast<LONG>(count) <= 0) return S_OK;
        std::vector<EnvelopeSegment> converted(count);
        for (DWORD i = 0; i < count; ++i) {
            const MP_ENVELOPE_SEGMENT& s = segments[i];
            converted[i] = EnvelopeSegment{0, refTimeToSamples(s.rtStart, rate), refTimeToSamples(s.rtEnd, rate),
                                           s.valStart, s.valEnd, (s.iCurve & 1) != 0};
        }
        const int32_t first = index == kAllParams ? 0 : static_cast<int32_t>(index);
        const int32_t last = index == kAllParams ? kMediaParamCount - 1 : static_cast<int32_t>(index);
        automation_.add(first, last, converted.data(), converted.size());
        return S_OK;
    });
}

STDMETHODIMP ReverbFilter::FlushEnvelope(DWORD index, REFERENCE_TIME start, REFERENCE_TIME stop) {
    return ComBoundary([&]() -> HRESULT {
        CritSecLock g(paramLock_);
        const DWORD rate = inputFormat_.nSamplesPerSec;
        if (rate == 0) return S_OK;  // no segment can exist yet
        if (index != kAllParams && index >= kMediaParamCount) return E_INVALIDARG;
        const int32_t first = index == kAllParams ? 0 : static_cast<int32_t>(index);
        const int32_t last = index == kAllParams ? kMediaParamCount - 1 : static_cast<int32_t>(index);
        automation_.remove(first, last, refTimeToSamples(start, rate), refTimeToSamples(stop, rate));
        return S_OK;
    });
}

STDMETHODIMP ReverbFilter::SetTimeFormat(GUID, MP_TIMEDATA) { return S_OK; }

STDMETHODIMP ReverbFilter::SetCaptureCallback(ICaptureCallback* callback) {
    return ComBoundary([&] {
        if (callback) callback->AddRef();
        ICaptureCallback* old;
        {
            CritSecLock g(callbackLock_);
            old = uiCallback_;
            uiCallback_ = callback;
        }
        if (old) old->Release();
        control_->GetCore()->setCaptureTarget(this);
        return S_OK;
    });
}

void ReverbFilter::captureParameter(int32_t id, float) {
    if (id < 0 || id >= static_cast<int32_t>(kMediaParamCount)) return;
    ICaptureCallback* callback;
    {
        CritSecLock g(callbackLock_);
        callback = uiCallback_;
        if (callback) callback->AddRef();
    }
    if (callback == nullptr) return;
    DWORD k = static_cast<DWORD>(id);  // media-parameter index k is parameter id k
    MP_DATA value = 0;
    GetParam(k, &value);
    callback->BeginCapture(&k, 1);
    callback->Changed(&k, 1, &value);
    callback->EndCapture(&k, 1);
    callback->Release();
}

}  // namespace dshow
}  // namespace ulvetta
