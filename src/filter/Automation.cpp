#include "filter/Automation.h"

#include <algorithm>
#include <new>

#include "filter/ReverbCore.h"

namespace ulvetta {

namespace {

// A segment intersects [s0, s1] when either end of the range lies in it or it lies inside the range.
bool Intersects(const EnvelopeSegment& s, int64_t s0, int64_t s1) {
    const bool s0In = s0 >= s.startSample && s0 <= s.endSample;
    const bool s1In = s1 >= s.startSample && s1 <= s.endSample;
    const bool inside = s0 < s.startSample && s1 > s.endSample;
    return s0In || s1In || inside;
}

bool ByValue(int32_t id) {
    const ParamDesc* d = findParam(id);
    return d != nullptr && automatedByValue(*d);
}

}  // namespace

CoreAutomationSink::CoreAutomationSink(ReverbCore& core) : core_(core) {}

void CoreAutomationSink::apply(int32_t id, float value) {
    if (id < 0 || id >= kSoundParamCount) return;
    if (ByValue(id))
        core_.setValue(id, static_cast<int32_t>(value));
    else
        core_.setNormalized(id, value);
}

void CoreAutomationSink::refresh(int32_t id) { core_.notifyListeners(id); }

float CoreAutomationSink::read(int32_t id) const {
    if (id < 0 || id >= kSoundParamCount) return 0.0f;
    return ByValue(id) ? static_cast<float>(core_.getValue(id)) : core_.getNormalized(id);
}

void Automation::setSampleRate(uint32_t rate) { step_ = std::max<int32_t>(1, static_cast<int32_t>(rate / 200)); }

void Automation::add(int32_t first, int32_t last, const EnvelopeSegment* segments, size_t count) {
    if (first > last || count == 0) return;
    const size_t targets = static_cast<size_t>(last - first) + 1;
    if (count > (segments_.max_size() - segments_.size()) / targets) throw std::bad_alloc();
    // Removing never needs room, so this is all the list can grow by.
    segments_.reserve(segments_.size() + targets * count);
    for (int32_t id = first; id <= last; ++id) {
        for (size_t i = 0; i < count; ++i) {
            EnvelopeSegment e = segments[i];
            e.paramId = id;
            remove(id, id, e.startSample, e.endSample);
            segments_.push_back(e);
        }
    }
}

void Automation::remove(int32_t first, int32_t last, int64_t s0, int64_t s1) {
    segments_.erase(std::remove_if(segments_.begin(), segments_.end(),
                                   [&](const EnvelopeSegment& s) {
                                       return s.paramId >= first && s.paramId <= last && Intersects(s, s0, s1);
                                   }),
                    segments_.end());
}

bool Automation::beginBlock(int64_t position, int32_t frames) {
    segments_.erase(std::remove_if(segments_.begin(), segments_.end(),
                                   [&](const EnvelopeSegment& s) { return s.endSample < position; }),
                    segments_.end());
    if (frames <= 0) return false;
    const int64_t last = position + frames - 1;
    for (const EnvelopeSegment& s : segments_) {
        const bool startInside = s.startSample >= position && s.startSample <= last;
        const bool endInside = s.endSample >= position && s.endSample <= last;
        const bool covers = s.startSample <= position && s.endSample >= last;
        if (startInside || endInside || covers) return true;
    }
    return false;
}

int32_t Automation::applyChunk(int64_t t, int32_t remaining, int32_t room, AutomationSink& sink) {
    const int32_t length = std::min({step_, remaining, room});
    const int64_t next = std::min(remaining - length, step_);
    for (const EnvelopeSegment& s : segments_) {
        if (t < s.startSample || t > s.endSample) continue;
        if (t + next > s.endSample) {
            sink.apply(s.paramId, s.endValue);
            sink.refresh(s.paramId);
        } else if (t == s.startSample) {
            sink.apply(s.paramId, s.startValue);
            sink.refresh(s.paramId);
        } else {
            const double span = static_cast<double>(s.endSample - s.startSample);
            const double along = 1.0 - static_cast<double>(s.endSample - t) / span;
            sink.apply(s.paramId, static_cast<float>(s.startValue + along * (s.endValue - s.startValue)));
            if (++refreshCount_ >= kRefreshEveryChunks) {
                refreshCount_ = 0;
                sink.refresh(s.paramId);
            }
        }
    }
    return length;
}

}  // namespace ulvetta
