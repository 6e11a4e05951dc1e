#include "filter/dshow/ReverbControl.h"

#include "filter/dshow/DShowUtil.h"

#include <algorithm>
#include <cmath>
#include <cstring>

namespace ulvetta {
namespace dshow {

namespace {


// A produced float sample as 16-bit PCM: scaled, truncated toward zero, clamped (never wrapped).
int16_t ToPcm16(float v) {
    const double s = static_cast<double>(v) * 32768.0;
    if (std::isnan(s)) return 0;
    if (s >= 32767.0) return 32767;
    if (s <= -32768.0) return -32768;
    return static_cast<int16_t>(std::trunc(s));
}

void Grow(std::vector<float>& v, size_t n) {
    if (v.size() < n) v.assign(n, 0.0f);
}

}  // namespace

ReverbControl::ReverbControl(IUnknown* outer, IPersistStream* persist, const WAVEFORMATEX* inFormat,
                             const WAVEFORMATEX* outFormat)
    : outer_(outer), persist_(persist), core_(new ReverbCore), inFormat_(inFormat), outFormat_(outFormat) {
    InitializeCriticalSection(&lock_);
    core_->setBusyIndicator(this);
}

ReverbControl::~ReverbControl() {
    core_->stopStreaming();
    core_.reset();
    segments.clear();
    DeleteCriticalSection(&lock_);
}

STDMETHODIMP ReverbControl::GetOption(BYTE* out) {
    if (out == nullptr) return E_POINTER;
    CritSecLock g(lock_);
    *out = option_;
    return S_OK;
}

STDMETHODIMP ReverbControl::SetOption(const BYTE* in) {
    if (in == nullptr) return E_POINTER;
    CritSecLock g(lock_);
    option_ = *in;
    optionChanged_ = true;
    dirty_ = true;
    return S_OK;
}

bool ReverbControl::IsDirty() {
    CritSecLock g(lock_);
    return dirty_;
}

STDMETHODIMP ReverbControl::GetFormat(WAVEFORMATEX* out, int direction) {
    if (out == nullptr) return E_POINTER;
    CritSecLock g(lock_);
    if (direction == 0 && inKnown_) {
        *out = *inFormat_;
        return S_OK;
    }
    if (direction == 1 && outKnown_) {
        *out = *outFormat_;
        return S_OK;
    }
    return VFW_E_NOT_CONNECTED;
}

STDMETHODIMP ReverbControl::RegisterWindow(HWND window, WORD commandId) {
    CritSecLock g(lock_);
    Window* target = nullptr;
    for (Window& w : windows_)
        if (w.window == window) target = &w;
    if (target == nullptr)
        for (Window& w : windows_)
            if (w.window == nullptr) target = &w;  // the last free entry
    if (target == nullptr) return commandId != 0 ? E_OUTOFMEMORY : S_OK;
    target->id = commandId;
    target->window = commandId != 0 ? window : nullptr;
    return S_OK;
}

IPersistStream* STDMETHODCALLTYPE ReverbControl::GetPersistStream() {
    if (persist_) persist_->AddRef();
    return persist_;
}

void ReverbControl::FormatChanged(int direction) {
    {
        CritSecLock g(lock_);
        (direction == 0 ? inKnown_ : outKnown_) = true;
    }
    const WAVEFORMATEX* f = direction == 0 ? inFormat_ : outFormat_;
    const int inChannels = inKnown_ ? inFormat_->nChannels : 2;
    const int outChannels = outKnown_ ? outFormat_->nChannels : 2;
    core_->setFormat(static_cast<float>(f->nSamplesPerSec), 0, inChannels, outChannels);
    core_->applyAll();
    ForEachWindow([direction](HWND window, WORD id) { PostMessageW(window, WM_COMMAND, MAKEWPARAM(id, direction), 0); });
}

void ReverbControl::RedrawWindows() {
    ForEachWindow([](HWND window, WORD) {
        RedrawWindow(window, nullptr, nullptr, RDW_INVALIDATE | RDW_ERASE | RDW_INTERNALPAINT | RDW_UPDATENOW);
    });
}

template <class F>
void ReverbControl::ForEachWindow(F notify) {
    CritSecLock g(lock_);
    for (Window& w : windows_) {
        if (w.window == nullptr) continue;
        if (!IsWindow(w.window)) {  // gone: its entry is freed instead
            w.window = nullptr;
            w.id = 0;
            continue;
        }
        notify(w.window, w.id);
    }
}

bool ReverbControl::StartStreaming() {
    {
        CritSecLock g(lock_);
        inKnown_ = outKnown_ = true;
        optionChanged_ = false;
        started_ = true;
    }
    return core_->startStreaming();
}

void ReverbControl::StopStreaming() { core_->stopStreaming(); }

// The wait cursor (IDC_WAIT) while an algorithm switch rebuilds the network.
void ReverbControl::begin() { previousCursor_ = SetCursor(LoadCursorW(nullptr, MAKEINTRESOURCEW(32514))); }
void ReverbControl::end() { SetCursor(previousCursor_); }

int ReverbControl::Process(int mode, const BYTE* in, int inFrames, BYTE* out, int outCapacity, bool* shortfall) {
    const int frames = in ? std::min(inFrames, outCapacity) : outCapacity;
    if (frames <= 0) {
        *shortfall = frames < (in ? inFrames : outCapacity);
        return 0;
    }
    const size_t samples = static_cast<size_t>(frames) * 2;
    const bool pcm16 = outFormat_->wFormatTag == WAVE_FORMAT_PCM;
    const int restart = mode == kModeDiscontinuity;
    const int flush = mode == kModeDrain;
    int produced;
    if (!pcm16) {
        const float* src;
        if (in) {
            src = reinterpret_cast<const float*>(in);
        } else {
            Grow(silence_, samples);
            src = silence_.data();
        }
        float* dst = reinterpret_cast<float*>(out);
        produced = core_->processStereo(src, src + 1, dst, dst + 1, frames, 2, restart, flush, 0);
    } else {
        Grow(scratchIn_, samples);
        Grow(scratchOut_, samples);
        if (in) {
            const int16_t* s = reinterpret_cast<const int16_t*>(in);
            for (size_t i = 0; i < samples; ++i) scratchIn_[i] = s[i] * 3.0517578125e-5f;
        } else {
            std::fill(scratchIn_.begin(), scratchIn_.begin() + samples, 0.0f);
        }
        produced = core_->processStereo(scratchIn_.data(), scratchIn_.data() + 1, scratchOut_.data(),
                                        scratchOut_.data() + 1, frames, 2, restart, flush, 0);
        int16_t* d = reinterpret_cast<int16_t*>(out);
        for (size_t i = 0; i < static_cast<size_t>(produced) * 2; ++i) d[i] = ToPcm16(scratchOut_[i]);
    }
    *shortfall = produced < frames;
    return produced;
}

}  // namespace dshow
}  // namespace ulvetta
