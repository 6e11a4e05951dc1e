#include "engine/ResponsePreparer.h"

#include <algorithm>
#include <cmath>
#include <cstring>
#include <new>

#include "engine/IrResampler.h"
#include "engine/StoredResponses.h"
#include "spectral/Nsp.h"

namespace ulvetta {

namespace {
// Partitions of this many samples and more are transformed by their own worker thread.
constexpr int32_t kWorkerPartition = 4096;
// The workers' stack: the transforms need little, but sanitizer builds need room.
constexpr std::size_t kWorkerStack = 256 * 1024;
constexpr int kHeadTaps = 64;
}  // namespace

ResponsePreparer::~ResponsePreparer() {
    if (!thread_) return;
    stop_ = true;
    wake_.set();
    thread_->join();
}

std::unique_ptr<ConvolutionResponse> ResponsePreparer::Forget() {
    MutexLock l(handoff_);
    ++generation_;
    requestPending_ = false;
    readyFlag_ = false;
    return std::move(ready_);
}

std::unique_ptr<ConvolutionResponse> ResponsePreparer::Prepare(const ResponseKey& key, bool startWorkers) {
    std::unique_ptr<ConvolutionResponse> ready = Forget();
    if (ready && ready->key == key) return ready;
    ready.reset();
    MutexLock b(buildLock_);
    return PrepareImpulse(key, startWorkers);
}

bool ResponsePreparer::Request(const ResponseKey& key, bool startWorkers) {
    {
        MutexLock l(handoff_);
        // The response on its way (being prepared, or finished and waiting) is already this one.
        const bool coming = building_ ? buildingKey_ == key && buildingGeneration_ == generation_
                                      : ready_ != nullptr && ready_->key == key;
        requestPending_ = !coming;
        if (coming) return true;
        requested_ = key;
        requestWorkers_ = startWorkers;
    }
    if (!thread_) {
        thread_.reset(new Thread);
        if (!thread_->start([this] { Loop(); }, 0)) {
            thread_.reset();
            MutexLock l(handoff_);
            requestPending_ = false;
            return false;
        }
    }
    wake_.set();
    return true;
}

void ResponsePreparer::Drop() { Discard(Forget()); }

void ResponsePreparer::Discard(std::unique_ptr<ConvolutionResponse> r) {
    if (!r || !thread_) return;  // without a preparation thread r is destroyed here
    try {
        MutexLock l(handoff_);
        discarded_.push_back(std::move(r));
    } catch (const std::bad_alloc&) {
        return;  // the list could not grow: r, still owned here, is destroyed here
    }
    wake_.set();
}

void ResponsePreparer::WaitIdle() {
    for (;;) {
        {
            MutexLock l(handoff_);
            if (!requestPending_ && !building_) return;
        }
        idle_.wait();
    }
}

bool ResponsePreparer::TakeReady(std::unique_ptr<ConvolutionResponse>& active) {
    if (!readyFlag_.load(std::memory_order_acquire) || !handoff_.tryLock()) return false;
    const bool swap = ready_ != nullptr && retired_ == nullptr;
    if (swap) {
        retired_ = std::move(active);
        active = std::move(ready_);
        readyFlag_ = false;
    }
    handoff_.unlock();
    if (swap) wake_.set();
    return swap;
}

void ResponsePreparer::Loop() {
    while (!stop_) {
        wake_.wait();
        for (;;) {
            std::unique_ptr<ConvolutionResponse> spent;  // destroyed with no lock held
            std::vector<std::unique_ptr<ConvolutionResponse>> discarded;
            ResponseKey key;
            bool workers = true, due = false;
            uint32_t generation = 0;
            {
                MutexLock l(handoff_);
                spent = std::move(retired_);
                discarded.swap(discarded_);
                if (requestPending_ && !stop_) {
                    key = buildingKey_ = requested_;
                    workers = requestWorkers_;
                    generation = buildingGeneration_ = generation_;
                    requestPending_ = false;
                    building_ = due = true;
                }
            }
            spent.reset();
            discarded.clear();
            if (!due) break;
            std::unique_ptr<ConvolutionResponse> built;
            try {
                MutexLock b(buildLock_);
                built = PrepareImpulse(key, workers);
            } catch (const std::bad_alloc&) {
                // Nothing to publish: the stream keeps the response it plays.
            }
            std::unique_ptr<ConvolutionResponse> replaced, retired;
            {
                MutexLock l(handoff_);
                building_ = false;
                // A newer request for another algorithm makes this response useless; one for other settings of
                // the same algorithm does not: it is still closer to them than the response being played.
                if (!built || generation != generation_ || (requestPending_ && requested_.mode != key.mode)) {
                    replaced = std::move(built);
                } else {
                    replaced = std::move(ready_);
                    ready_ = std::move(built);
                    readyFlag_ = true;
                }
                retired = std::move(retired_);
            }
            replaced.reset();
            retired.reset();
            idle_.set();
        }
    }
}

const float* ResponsePreparer::Converted(int mode, int32_t rate, int32_t& frames) {
    const StoredResponse stored = storedResponse(mode);
    if (rate == 44100) {
        frames = stored.count;
        return stored.frames;
    }
    if (mode != cachedMode_ || rate != cachedRate_) {
        cachedMode_ = -1;
        const int64_t capacity = static_cast<int64_t>(stored.count) * rate / 44100 + 2;
        cached_.assign(2 * static_cast<size_t>(capacity), 0.0f);
        IrResampler converter;
        converter.Setup(rate);
        cachedFrames_ = converter.RunStereo(cached_.data(), stored.frames, stored.count, static_cast<int>(capacity));
        cachedMode_ = mode;
        cachedRate_ = rate;
    }
    frames = cachedFrames_;
    return cached_.data();
}

std::unique_ptr<ConvolutionResponse> ResponsePreparer::PrepareImpulse(const ResponseKey& key, bool startWorkers) {
    std::unique_ptr<ConvolutionResponse> made(new ConvolutionResponse);
    ConvolutionResponse& r = *made;
    r.key = key;
    const int32_t rate = key.sampleRate;

    // 1. The stored response at the stream rate.
    int32_t frames = 0;
    const float* source = Converted(key.mode, rate, frames);

    // 2. Shortening by "Decay": 100 keeps all of it, 0 a fifth.
    const int32_t used = static_cast<int32_t>(std::round(frames * ((key.decay * 0.01 + 0.25) * 0.8)));

    // 3. The partition grid: a 64-sample head, then sizes 32, 32, 64, 64, 128, 128, ...
    int32_t count = 1, covered = kHeadTaps, step = 32;
    while (covered < used) {
        ++count;
        covered += step;
        if (count % 2 == 1) step *= 2;
    }
    r.irLength = std::max(covered, used);

    // 4. The response, split into channels, with a zero tail up to the grid boundary.
    r.irLeft.reset(new float[r.irLength]());
    r.irRight.reset(new float[r.irLength]());
    float* left = r.irLeft.get();
    float* right = r.irRight.get();
    for (int32_t i = 0; i < used; ++i) {
        left[i] = source[2 * static_cast<size_t>(i)];
        right[i] = source[2 * static_cast<size_t>(i) + 1];
    }

    // 5. Damping: a one-pole low-pass over everything after the first 100 ms. Its coefficient is limited
    //    to 1.0 (no filtering), beyond which the filter would diverge at low rates.
    if (key.damping != 0) {
        const float a = std::min(static_cast<float>(key.damping * 140.0 / (rate / 2)), 1.0f);
        const int64_t i0 = std::max<int64_t>(1, static_cast<int64_t>(rate) * 4410 / 44100);
        if (i0 < r.irLength) {
            float yl = left[i0 - 1], yr = right[i0 - 1];
            for (int64_t i = i0; i < r.irLength; ++i) {
                yl = yl + a * (left[i] - yl);
                left[i] = yl;
                yr = yr + a * (right[i] - yr);
                right[i] = yr;
            }
        }
    }

    // 6. Fade from the middle of the used length to nothing at its end.
    if (key.decay != 100) {
        const int32_t h = used / 2;
        for (int32_t i = h; i < used && h > 0; ++i) {
            const double g = 1.0 - static_cast<double>(i - h) / h;
            left[i] = static_cast<float>(left[i] * g);
            right[i] = static_cast<float>(right[i] * g);
        }
    }

    // 7. Room envelope: whole up to s0, down to 0.3 at s1, to nothing at the end.
    if (key.roomSize != 200) {
        const double room = key.roomSize * 0.005;
        const int32_t s0 = static_cast<int32_t>(std::round(0.25 * room * used));
        const int32_t s1 = static_cast<int32_t>(std::round(0.5 * room * used));
        for (int32_t i = s0; i < used; ++i) {
            const double g = i < s1 ? (1.0 - static_cast<double>(i - s0) / (s1 - s0)) * (1.0 - 0.3) + 0.3
                                    : (1.0 - static_cast<double>(i - s1) / (used - s1)) * 0.3;
            left[i] = static_cast<float>(left[i] * g);
            right[i] = static_cast<float>(right[i] * g);
        }
    }

    // 8. Partition records with the spectra of their segments (each in the second half of its block).
    r.partitions.reset(new ConvPartition[count]);
    r.partitionCount = count;
    int32_t s = 32, order = 6, position = kHeadTaps;
    for (int32_t i = 1; i < count; ++i) {
        ConvPartition& p = r.partitions[i];
        p.Allocate(s, order);
        p.offset = (i % 2 == 0) ? 2 * s : s;
        std::memcpy(p.spectrumLeft.get() + s, left + position, sizeof(float) * s);
        std::memcpy(p.spectrumRight.get() + s, right + position, sizeof(float) * s);
        nspsRealFftl(p.spectrumLeft.get(), order, FlagForward + FlagOutPerm);
        nspsRealFftl(p.spectrumRight.get(), order, FlagForward + FlagOutPerm);
        position += s;
        if (i % 2 == 0) {
            s *= 2;
            ++order;
        }
    }

    // 9. History rings and the workers of the large partitions.
    r.historyLeft.Create(r.irLength);
    r.historyRight.Create(r.irLength);
    if (startWorkers)
        for (int32_t i = 1; i < count; ++i)
            if (r.partitions[i].size >= kWorkerPartition) r.partitions[i].StartWorker(kWorkerStack);
    return made;
}

}  // namespace ulvetta
