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

double levelGain(const ParamDesc& p) { return p.value == p.minimum ? 0.0 : std::pow(10.0, p.value * 0.005); }

}  // namespace

ReverbCore::ReverbCore() {
    // The records are registered at positions 0..14, then Meter Source, then Algorithm.
    for (int i = 0; i < kSoundParamCount; ++i) params_.push_back(&table_.records[i]);
    params_.push_back(&table_.records[16]);
    params_.push_back(&table_.records[15]);
    for (int i = 0; i < kSoundParamCount; ++i) mediaParamIds_[i] = i;
    host_ = this;
    engine_.SetOwner(this);
}

ReverbCore::~ReverbCore() {
    MutexLock g(lock_);
    listeners_.clear();
    params_.clear();
}

bool ReverbCore::applyParam(ParamDesc& p) {
    engine_.SetSampleRate(static_cast<int>(std::round(sampleRate_)));
    switch (p.id) {
        case kDiffusion: engine_.SetDiffusion(p.value); break;
        case kPreDelay: engine_.SetPreDelay(p.value); break;
        case kDecay: engine_.SetDecay(p.value); break;
        case kDamping: engine_.SetDamping(p.value); break;
        case kRoomSize: engine_.SetRoomSize(p.value); break;
        case kEarlyReflections: engine_.SetEarlyLevel(levelGain(p)); break;
        case kOutputLevelWet: engine_.SetWetLevel(levelGain(p)); break;
        case kOutputLevelDry: engine_.SetDryLevel(levelGain(p)); break;
        case kColour: engine_.SetColour(p.value); break;
        case kInputGain: engine_.SetInputGain(p.value); break;
        case kLowPassFreq: engine_.SetLowPassFreq(p.value); break;
        case kHighPassFreq: engine_.SetHighPassFreq(p.value); break;
        case kNotchFreq: engine_.SetNotchFreq(p.value); break;
        case kNotchGain: engine_.SetNotchGain(p.value * 0.1); break;
        case kNotchQ: engine_.SetNotchQ(p.value * 0.1); break;
        case kAlgorithm: engine_.SetMode(p.value); break;
        case kMeterSource: engine_.SetMeterSource(p.value); break;
        default: return false;
    }
    applied_ = true;
    return true;
}

bool ReverbCore::setNormalized(int32_t id, float position) {
    MutexLock g(lock_);
    ParamDesc* p = table_.find(id);
    if (p == nullptr) return false;
    p->setNormalized(position);
    return applyParam(*p);
}

float ReverbCore::getNormalized(int32_t id) {
    MutexLock g(lock_);
    const ParamDesc* p = table_.find(id);
    return p ? static_cast<float>(p->getNormalized()) : 0.0f;
}

void ReverbCore::switchAlgorithm(int32_t newValue) {
    ParamDesc* algorithm = table_.find(kAlgorithm);
    const int32_t leaving = algorithm->value;
    for (int pos = 0; pos < kSoundParamCount; ++pos) memory_.rows[leaving][pos] = table_.records[pos].value;
    algorithm->value = algorithm->clamp(newValue);
    applyParam(*algorithm);
    if (busy_) busy_->begin();
    const int32_t row = algorithm->value;
    for (int32_t id : kRowLoadOrder) setValue(id, memory_.rows[row][table_.position(id)]);
    if (busy_) busy_->end();
}

bool ReverbCore::setValue(int32_t id, int32_t value) {
    MutexLock g(lock_);
    ParamDesc* p = table_.find(id);
    if (p == nullptr) return false;
    if (id == kAlgorithm) {
        switchAlgorithm(value);
        return true;
    }
    p->value = p->clamp(value);
    return applyParam(*p);
}

int32_t ReverbCore::getValue(int32_t id) {
    MutexLock g(lock_);
    const ParamDesc* p = table_.find(id);
    return p ? p->value : 0;
}

void ReverbCore::notifyListeners(int32_t id) {
    MutexLock g(lock_);
    for (CoreListener* l : listeners_) l->refresh(id + kRefreshParamBase);
}

char* ReverbCore::getValueText(int32_t id, char* buffer, bool full) {
    if (buffer == nullptr) return buffer;
    buffer[0] = '\0';
    ParamDesc copy;
    if (!getParamDesc(id, copy)) return buffer;
    const SkinString text = copy.formatValue(full);
    const size_t n = std::min(text.size(), static_cast<size_t>(kTextCapacity - 1));
    std::memcpy(buffer, text.data(), n);
    buffer[n] = '\0';
    return buffer;
}

bool ReverbCore::setValueText(int32_t id, SkinString text) {
    MutexLock g(lock_);
    const ParamDesc* p = table_.find(id);
    if (p == nullptr) return false;
    return setValueAndNotify(id, p->parseText(text.c_str()));
}

void ReverbCore::notifyHost(int32_t id, float position) {
    MutexLock g(lock_);
    if (host_ != nullptr) host_->parameterChanged(id, position);
}

void ReverbCore::parameterChanged(int32_t id, float position) {
    setNormalized(id, position);
    if (captureTarget_ != nullptr) captureTarget_->captureParameter(id, position);
}

bool ReverbCore::preparedResponse(std::vector<float>& left, std::vector<float>& right) {
    MutexLock g(lock_);
    return engine_.PreparedResponse(left, right);
}

float ReverbCore::getStatus(int32_t code) {
    MutexLock g(lock_);
    if (code == kStatusLoad) {
        switch (table_.find(kAlgorithm)->value) {
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
    MutexLock g(lock_);
    listeners_.push_back(l);
}

void ReverbCore::removeListener(CoreListener* l) {
    MutexLock g(lock_);
    listeners_.erase(std::remove(listeners_.begin(), listeners_.end(), l), listeners_.end());
}

bool ReverbCore::setValueAndNotify(int32_t id, int32_t value) {
    MutexLock g(lock_);
    if (!setValue(id, value)) return false;
    notifyHost(id, getNormalized(id));
    return true;
}

void ReverbCore::setFormat(float sampleRate, int32_t reserved, int32_t inChannels, int32_t outChannels) {
    MutexLock g(lock_);
    sampleRate_ = sampleRate;
    reservedFormat_ = reserved;
    inChannels_ = inChannels;
    outChannels_ = outChannels;
}

int32_t ReverbCore::processStereo(const float* inLeft, const float* inRight, float* outLeft, float* outRight,
                                  int32_t frames, int32_t stride, int32_t /*restart*/, int32_t flush,
                                  int32_t accumulate) {
    MutexLock g(lock_);
    return engine_.ProcessBlock(outLeft, outRight, inLeft, inRight, frames, stride, accumulate == 1, flush);
}

int32_t ReverbCore::trackLevel(const float* samples, const void*, int32_t count, int32_t stride, int32_t,
                               int32_t) {
    MutexLock g(lock_);
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
    MutexLock g(lock_);
    for (int32_t i = 0; i < count; ++i) destination[i] = add ? destination[i] + source[i] : source[i];
    return count;
}

int32_t ReverbCore::reservedProcess(int32_t, int32_t b, int32_t, int32_t) {
    MutexLock g(lock_);
    return b;
}

bool ReverbCore::applyAll() {
    MutexLock g(lock_);
    for (int32_t id = 0; id < kParamCount; ++id) applyParam(*table_.find(id));
    return true;
}

void ReverbCore::resetLevel() {
    MutexLock g(lock_);
    level = 0.0f;
}

bool ReverbCore::startStreaming() {
    MutexLock g(lock_);
    if (!applied_) applyAll();
    std::memset(meterBlock_, 0, sizeof meterBlock_);
    stopped_ = false;
    engine_.ResetState();
    return true;
}

void ReverbCore::resumeAfterFlush() {
    MutexLock g(lock_);
    engine_.ClearEndOfStream();
}

void ReverbCore::stopStreaming() {
    MutexLock g(lock_);
    stopped_ = true;
}

int32_t ReverbCore::stateSize() { return kCoreStateSize; }

bool ReverbCore::saveState(uint8_t* buffer) {
    if (buffer == nullptr) return false;
    MutexLock g(lock_);
    putLe32(buffer, kCoreStateSize);
    std::memcpy(buffer + kCoreStateGuidOffset, kCoreStateGuid, sizeof kCoreStateGuid);
    for (int pos = 0; pos < kParamCount; ++pos)
        putLe32(buffer + kCoreStateValuesOffset + 4 * pos, static_cast<uint32_t>(table_.records[pos].value));
    return true;
}

bool ReverbCore::validateState(const uint8_t* buffer, int32_t size) {
    if (buffer == nullptr || size != kCoreStateSize) return false;
    return getLe32(buffer) == static_cast<uint32_t>(size) &&
           std::memcmp(buffer + kCoreStateGuidOffset, kCoreStateGuid, sizeof kCoreStateGuid) == 0;
}

bool ReverbCore::loadState(const uint8_t* buffer, int32_t size) {
    MutexLock g(lock_);
    if (!validateState(buffer, size)) return false;
    auto valueOf = [&](int32_t id) {
        return static_cast<int32_t>(getLe32(buffer + kCoreStateValuesOffset + 4 * table_.position(id)));
    };
    setValue(kAlgorithm, valueOf(kAlgorithm));
    for (int32_t id : kStateLoadOrder) setValue(id, valueOf(id));
    for (CoreListener* l : listeners_) l->refresh(kRefreshAll);
    return true;
}

void ReverbCore::setCaptureTarget(CaptureTarget* t) {
    MutexLock g(lock_);
    captureTarget_ = t;
}

void ReverbCore::setBusyIndicator(BusyIndicator* b) {
    MutexLock g(lock_);
    busy_ = b;
}

bool ReverbCore::getParamDesc(int32_t id, ParamDesc& out) {
    MutexLock g(lock_);
    const ParamDesc* p = table_.find(id);
    if (p == nullptr) return false;
    out = *p;
    return true;
}

int32_t ReverbCore::memoryValue(int32_t algorithm, int column) {
    MutexLock g(lock_);
    if (algorithm < 0 || algorithm >= kAlgorithmCount || column < 0 || column >= kSoundParamCount) return 0;
    return memory_.rows[algorithm][column];
}

}  // namespace ulvetta
