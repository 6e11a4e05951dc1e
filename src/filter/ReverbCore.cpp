#include "filter/ReverbCore.h"

#include <algorithm>
#include <cmath>
#include <cstring>

#include "filter/CoreState.h"

namespace ulvetta {

namespace {

// Order in which an algorithm's memory row is loaded.
constexpr int32_t kRowLoadOrder[kSoundParamCount] = {10, 11, 14, 13, 12, 0, 1, 2, 3, 4, 6, 7, 8, 9, 5};
// Order in which a settings record is applied after its algorithm.
constexpr int32_t kStateLoadOrder[16] = {0, 1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 14, 13, 12, 16};

double levelGain(int32_t id, int32_t value) {
    return value == findParam(id)->minimum ? 0.0 : std::pow(10.0, value * 0.005);
}

}  // namespace

namespace {
// Its address marks the thread that holds a core's lock.
thread_local char threadMark;
}  // namespace

ReverbCore::Guard::Guard(ReverbCore& core) : core_(core) {
    const void* self = &threadMark;
    if (core_.owner_.load(std::memory_order_relaxed) == self) {
        core_.lock_.lock();  // nested in an operation of this thread
    } else {
        // One waiter at a time waits for the lock itself, holding the turnstile: a thread that has just
        // released the lock queues at the turnstile behind it instead of taking the lock again first.
        core_.turnstile_.lock();
        core_.lock_.lock();
        core_.turnstile_.unlock();
    }
    if (core_.lockDepth_++ == 0) {
        core_.owner_.store(self, std::memory_order_relaxed);
        core_.engine_.BeginChanges();
    }
}

ReverbCore::Guard::~Guard() {
    if (core_.lockDepth_ == 1) core_.engine_.EndChanges();  // prepares what the changes made stale
    if (--core_.lockDepth_ == 0) {
        core_.owner_.store(nullptr, std::memory_order_relaxed);
        if (!core_.pendingReports_.empty()) {
            core_.deliverCaptureReports();
            return;
        }
    }
    core_.lock_.unlock();
}

// Called by the outermost guard with the lock held once; releases it before calling out, so that a
// capture target may call back into the core from any thread.
void ReverbCore::deliverCaptureReports() {
    std::vector<CaptureReport> reports(std::move(pendingReports_));
    pendingReports_.clear();
    lock_.unlock();
    for (const CaptureReport& r : reports) r.target->captureParameter(r.id, r.position);
}

ReverbCore::ReverbCore() {
    for (int32_t id = 0; id < kParamCount; ++id) values_[id] = kParamTable[id].defaultValue;
    host_ = this;
    engine_.SetOwner(this);
}

ReverbCore::~ReverbCore() {
    Guard g(*this);
    listeners_.clear();
}

bool ReverbCore::applyParam(int32_t id) {
    engine_.SetSampleRate(static_cast<int>(std::round(sampleRate_)));
    const int32_t v = values_[id];
    switch (id) {
        case kDiffusion: engine_.SetDiffusion(v); break;
        case kPreDelay: engine_.SetPreDelay(v); break;
        case kDecay: engine_.SetDecay(v); break;
        case kDamping: engine_.SetDamping(v); break;
        case kRoomSize: engine_.SetRoomSize(v); break;
        case kEarlyReflections: engine_.SetEarlyLevel(levelGain(id, v)); break;
        case kOutputLevelWet: engine_.SetWetLevel(levelGain(id, v)); break;
        case kOutputLevelDry: engine_.SetDryLevel(levelGain(id, v)); break;
        case kColour: engine_.SetColour(v); break;
        case kInputGain: engine_.SetInputGain(v); break;
        case kLowPassFreq: engine_.SetLowPassFreq(v); break;
        case kHighPassFreq: engine_.SetHighPassFreq(v); break;
        case kNotchFreq: engine_.SetNotchFreq(v); break;
        case kNotchGain: engine_.SetNotchGain(v * 0.1); break;
        case kNotchQ: engine_.SetNotchQ(v * 0.1); break;
        case kAlgorithm: engine_.SetMode(v); break;
        case kMeterSource: engine_.SetMeterSource(v); break;
        default: return false;
    }
    applied_ = true;
    return true;
}

bool ReverbCore::setNormalized(int32_t id, float position) {
    Guard g(*this);
    const ParamDesc* d = findParam(id);
    if (d == nullptr) return false;
    values_[id] = valueAtPosition(*d, position);
    return applyParam(id);
}

float ReverbCore::getNormalized(int32_t id) {
    Guard g(*this);
    const ParamDesc* d = findParam(id);
    return d ? static_cast<float>(positionOf(*d, values_[id])) : 0.0f;
}

void ReverbCore::switchAlgorithm(int32_t newValue) {
    const int32_t leaving = values_[kAlgorithm];
    for (int pos = 0; pos < kSoundParamCount; ++pos) memory_.rows[leaving][pos] = values_[kParamAtPosition[pos]];
    values_[kAlgorithm] = clampValue(kParamTable[kAlgorithm], newValue);
    applyParam(kAlgorithm);
    if (busy_) busy_->begin();
    const int32_t row = values_[kAlgorithm];
    for (int32_t id : kRowLoadOrder) setValue(id, memory_.rows[row][kParamPosition[id]]);
    if (busy_) busy_->end();
}

bool ReverbCore::setValue(int32_t id, int32_t value) {
    Guard g(*this);
    const ParamDesc* d = findParam(id);
    if (d == nullptr) return false;
    if (id == kAlgorithm) {
        switchAlgorithm(value);
        return true;
    }
    values_[id] = clampValue(*d, value);
    return applyParam(id);
}

int32_t ReverbCore::getValue(int32_t id) {
    Guard g(*this);
    return findParam(id) ? values_[id] : 0;
}

void ReverbCore::notifyListeners(int32_t id) {
    Guard g(*this);
    for (CoreListener* l : listeners_) l->refresh(id + kRefreshParamBase);
}

char* ReverbCore::getValueText(int32_t id, char* buffer, bool full) {
    if (buffer == nullptr) return buffer;
    buffer[0] = '\0';
    Guard g(*this);
    const ParamDesc* d = findParam(id);
    if (d != nullptr) formatValue(*d, values_[id], full, buffer, kTextCapacity);
    return buffer;
}

bool ReverbCore::setValueText(int32_t id, const char* text) {
    Guard g(*this);
    const ParamDesc* d = findParam(id);
    if (d == nullptr) return false;
    return setValueAndNotify(id, parseValueText(*d, text));
}

void ReverbCore::notifyHost(int32_t id, float position) {
    Guard g(*this);
    if (host_ != nullptr) host_->parameterChanged(id, position);
}

void ReverbCore::parameterChanged(int32_t id, float position) {
    Guard g(*this);
    setNormalized(id, position);
    if (captureTarget_ != nullptr) pendingReports_.push_back({captureTarget_, id, position});
}

bool ReverbCore::preparedResponse(std::vector<float>& left, std::vector<float>& right) {
    Guard g(*this);
    return engine_.PreparedResponse(left, right);
}

float ReverbCore::getStatus(int32_t code) {
    Guard g(*this);
    if (code == kStatusLoad) {
        switch (values_[kAlgorithm]) {
            case 0:
            case 7: return 0.062f;
            case 1: return 0.123f;
            case 2:
            case 6: return 0.092f;
            case 3:
            case 4:
            case 5:
                switch (engine_.PartitionCount()) {
                    case 18: return 0.485f;
                    case 19: return 0.538f;
                    case 20: return 0.615f;
                    case 21: return 0.731f;
                    case 22: return 0.846f;
                    case 23: return 0.923f;
                    default: return 1.0f;
                }
            default: return 0.0f;
        }
    }
    if (code == kStatusStopped) return stopped_ ? 1.0f : 0.0f;
    const float v = level * 2.235730360023138f;
    return v >= 1.0f ? 1.0f : v;
}

void ReverbCore::setHost(CoreHost* h) { host_ = h; }
CoreHost* ReverbCore::getHost() { return host_; }

void ReverbCore::addListener(CoreListener* l) {
    Guard g(*this);
    listeners_.push_back(l);
}

void ReverbCore::removeListener(CoreListener* l) {
    Guard g(*this);
    listeners_.erase(std::remove(listeners_.begin(), listeners_.end(), l), listeners_.end());
}

bool ReverbCore::setValueAndNotify(int32_t id, int32_t value) {
    Guard g(*this);
    if (!setValue(id, value)) return false;
    notifyHost(id, getNormalized(id));
    return true;
}

void ReverbCore::setFormat(float sampleRate, int32_t, int32_t, int32_t) {
    Guard g(*this);
    const double rounded = std::round(static_cast<double>(sampleRate));  // NaN fails both tests
    if (rounded >= 1.0 && rounded <= ReverbEngine::kMaxSampleRate) sampleRate_ = sampleRate;
}

int32_t ReverbCore::processStereo(const float* inLeft, const float* inRight, float* outLeft, float* outRight,
                                  int32_t frames, int32_t stride, int32_t /*restart*/, int32_t flush,
                                  int32_t accumulate) {
    Guard g(*this);
    return engine_.ProcessBlock(outLeft, outRight, inLeft, inRight, frames, stride, accumulate == 1, flush);
}

int32_t ReverbCore::trackLevel(const float* samples, const void*, int32_t count, int32_t stride, int32_t,
                               int32_t) {
    Guard g(*this);
    static const float attack = static_cast<float>(1.0 - std::exp(-0.030642888258557023));
    static const float release = static_cast<float>(std::exp(-6.128577478167001e-05));
    for (int32_t i = 0; i < count; ++i) {
        const float x = std::fabs(samples[static_cast<int64_t>(i) * stride]);
        if (x > level)
            level = level + attack * (x - level);
        else
            level = level * release;
    }
    return count;
}

int32_t ReverbCore::copyMono(const float* source, float* destination, int32_t count, int32_t, int32_t,
                             int32_t add) {
    Guard g(*this);
    for (int32_t i = 0; i < count; ++i) destination[i] = add ? destination[i] + source[i] : source[i];
    return count;
}

int32_t ReverbCore::passSecond(int32_t, int32_t b, int32_t, int32_t) { return b; }

bool ReverbCore::applyAll() {
    Guard g(*this);
    for (int32_t id = 0; id < kParamCount; ++id) applyParam(id);
    return true;
}

void ReverbCore::resetLevel() {
    Guard g(*this);
    level = 0.0f;
}

bool ReverbCore::startStreaming() {
    Guard g(*this);
    if (!applied_) applyAll();
    stopped_ = false;
    engine_.ResetState();
    engine_.SetStreaming(true);
    return true;
}

void ReverbCore::resumeAfterFlush() {
    Guard g(*this);
    engine_.ClearEndOfStream();
}

void ReverbCore::stopStreaming() {
    Guard g(*this);
    stopped_ = true;
    engine_.SetStreaming(false);
}

int32_t ReverbCore::stateSize() { return kCoreStateSize; }

bool ReverbCore::saveState(uint8_t* buffer) {
    if (buffer == nullptr) return false;
    Guard g(*this);
    putLe32(buffer, kCoreStateSize);
    std::memcpy(buffer + kCoreStateGuidOffset, kCoreStateGuid, sizeof kCoreStateGuid);
    for (int pos = 0; pos < kParamCount; ++pos)
        putLe32(buffer + kCoreStateValuesOffset + 4 * pos, static_cast<uint32_t>(values_[kParamAtPosition[pos]]));
    return true;
}

bool ReverbCore::validateState(const uint8_t* buffer, int32_t size) {
    if (buffer == nullptr || size != kCoreStateSize) return false;
    return getLe32(buffer) == static_cast<uint32_t>(size) &&
           std::memcmp(buffer + kCoreStateGuidOffset, kCoreStateGuid, sizeof kCoreStateGuid) == 0;
}

bool ReverbCore::loadState(const uint8_t* buffer, int32_t size) {
    Guard g(*this);
    if (!validateState(buffer, size)) return false;
    auto valueOf = [&](int32_t id) {
        return static_cast<int32_t>(getLe32(buffer + kCoreStateValuesOffset + 4 * kParamPosition[id]));
    };
    setValue(kAlgorithm, valueOf(kAlgorithm));
    for (int32_t id : kStateLoadOrder) setValue(id, valueOf(id));
    for (CoreListener* l : listeners_) l->refresh(kRefreshAll);
    return true;
}

void ReverbCore::setCaptureTarget(CaptureTarget* t) {
    Guard g(*this);
    captureTarget_ = t;
}

void ReverbCore::setBusyIndicator(BusyIndicator* b) {
    Guard g(*this);
    busy_ = b;
}

int32_t ReverbCore::memoryValue(int32_t algorithm, int column) {
    Guard g(*this);
    if (algorithm < 0 || algorithm >= kAlgorithmCount || column < 0 || column >= kSoundParamCount) return 0;
    return memory_.rows[algorithm][column];
}

}  // namespace ulvetta
