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

// Frames of scratch before the formats are known: a 40 ms block at 48 kHz.
constexpr size_t kInitialScratchFrames = 2048;

}  // namespace

ReverbControl::ReverbControl(IUnknown* outer, IPersistStream* persist, const WAVEFORMATEX* inFormat,
                             const WAVEFORMATEX* outFormat)
    : outer_(outer), persist_(persist), core_(new ReverbCore), inFormat_(inFormat), outFormat_(outFormat) {
    ReserveFrames(kInitialScratchFrames);
    core_->saveState(cleanState_);
    InitializeCriticalSection(&lock_);
    core_->setBusyIndicator(this);
}

ReverbControl::~ReverbControl() {
    core_->stopStreaming();
    core_.reset();
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
    dirty_ = true;
    return S_OK;
}

bool ReverbControl::IsDirty() {
    uint8_t now[kCoreStateSize];
    core_->saveState(now);
    CritSecLock g(lock_);
    return dirty_ || std::memcmp(now, cleanState_, sizeof now) != 0;
}

void ReverbControl::MarkClean(const uint8_t* savedState) {
    CritSecLock g(lock_);
    std::memcpy(cleanState_, savedState, sizeof cleanState_);
    dirty_ = false;
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
    // A window's code may call back into this object (a redraw runs its paint code at once), so the
    // list is copied under the lock and the windows are called without it.
    Window copy[2];
    {
        CritSecLock g(lock_);
        std::copy(std::begin(windows_), std::end(windows_), copy);
    }
    for (const Window& w : copy) {
        if (w.window == nullptr) continue;
        if (IsWindow(w.window)) {
            notify(w.window, w.id);
            continue;
        }
        CritSecLock g(lock_);  // gone: its entry is freed, unless it was registered anew meanwhile
        for (Window& e : windows_)
            if (e.window == w.window) e = Window{};
    }
}

bool ReverbControl::StartStreaming() {
    {
        CritSecLock g(lock_);
        inKnown_ = outKnown_ = true;
    }
    return core_->startStreaming();
}

void ReverbControl::StopStreaming() { core_->stopStreaming(); }

// The wait cursor (IDC_WAIT) while an algorithm switch rebuilds the network.
void ReverbControl::begin() { previousCursor_ = SetCursor(LoadCursorW(nullptr, MAKEINTRESOURCEW(32514))); }
void ReverbControl::end() { SetCursor(previousCursor_); }

void ReverbControl::ReserveFrames(size_t frames) {
    if (frames <= scratchFrames_) return;
    std::vector<float> in(frames * 2), out(frames * 2);
    scratchIn_.swap(in);
    scratchOut_.swap(out);
    scratchFrames_ = frames;
}

int ReverbControl::Process(int mode, const BYTE* in, int inFrames, BYTE* out, int outCapacity, bool* shortfall) {
    const int frames = in ? std::min(inFrames, outCapacity) : outCapacity;
    const bool pcm16 = outFormat_->wFormatTag == WAVE_FORMAT_PCM;
    const size_t inBytes = pcm16 ? 4 : 8;  // one stereo frame
    // Float input goes to the core directly in one call; anything that passes through the scratch is
    // processed in pieces of its size.
    const int piece = (pcm16 || in == nullptr) ? static_cast<int>(scratchFrames_) : std::max(frames, 1);
    int produced = 0;
    for (int done = 0; done < frames;) {
        const int n = std::min(piece, frames - done);
        const int got = ProcessPiece(mode, done == 0, in ? in + done * inBytes : nullptr, out + produced * inBytes, n);
        produced += got;
        done += n;
        if (got < n) break;  // the tail has ended: nothing more comes out of this block
    }
    *shortfall = produced < frames || (frames <= 0 && (in ? inFrames : outCapacity) > 0);
    return produced;
}

int ReverbControl::ProcessPiece(int mode, bool first, const BYTE* in, BYTE* out, int frames) {
    const size_t samples = static_cast<size_t>(frames) * 2;
    const int restart = mode == kModeDiscontinuity && first;
    const int flush = mode == kModeDrain;
    if (in == nullptr) std::fill(scratchIn_.begin(), scratchIn_.begin() + samples, 0.0f);
    if (outFormat_->wFormatTag != WAVE_FORMAT_PCM) {
        const float* src = in ? reinterpret_cast<const float*>(in) : scratchIn_.data();
        float* dst = reinterpret_cast<float*>(out);
        return core_->processStereo(src, src + 1, dst, dst + 1, frames, 2, restart, flush, 0);
    }
    if (in) {
        const int16_t* s = reinterpret_cast<const int16_t*>(in);
        for (size_t i = 0; i < samples; ++i) scratchIn_[i] = s[i] * 3.0517578125e-5f;
    }
    const int produced = core_->processStereo(scratchIn_.data(), scratchIn_.data() + 1, scratchOut_.data(),
                                              scratchOut_.data() + 1, frames, 2, restart, flush, 0);
    int16_t* d = reinterpret_cast<int16_t*>(out);
    for (size_t i = 0; i < static_cast<size_t>(produced) * 2; ++i) d[i] = ToPcm16(scratchOut_[i]);
    return produced;
}

}  // namespace dshow
}  // namespace ulvetta
