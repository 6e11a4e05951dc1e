// The LV2 plugin: a thin host over ReverbCore. Control ports reach the core between blocks as the renderer's
// --set does (the text of the value, in the units it shows); the settings record is the plugin's state.
#include <lv2/atom/atom.h>
#include <lv2/core/lv2.h>
#include <lv2/state/state.h>
#include <lv2/urid/urid.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdio>
#include <cstring>
#include <limits>
#include <memory>
#include <new>

#include "Lv2Ports.h"
#include "filter/ReverbCore.h"

namespace ulvetta::lv2 {
namespace {

// Marks a parameter whose port value must be applied at the next block.
constexpr int32_t kUnapplied = INT32_MIN;

class Plugin {
 public:
  explicit Plugin(double rate, LV2_URID_Map* map) : rate_(rate), core_(freshCore(rate)) {
    if (map) {
      settingsKey_ = map->map(map->handle, kSettingsKey);
      chunkType_ = map->map(map->handle, LV2_ATOM__Chunk);
    }
    applied_.fill(kUnapplied);
    seen_.fill(std::numeric_limits<float>::quiet_NaN());
  }

  void connect(uint32_t port, void* data) {
    if (port < kPortCount) ports_[port] = static_cast<float*>(data);
  }

  // A host that deactivates and activates again gets a clean start: after a run, the core is replaced by a new
  // one holding the same settings, so nothing of the old stream (delay lines, filter states) survives.
  void activate() {
    if (ran_) {
      std::array<uint8_t, 88> record{};
      auto fresh = freshCore(rate_);
      if (fresh && core_->saveState(record.data()) && fresh->loadState(record.data(), 88)) core_ = std::move(fresh);
      ran_ = false;
    }
    // Ports the host has already connected are applied before the stream starts, so their response is
    // prepared here rather than on the preparation thread while the first blocks play without it.
    applyPorts();
    core_->startStreaming();
    active_ = true;
  }

  void deactivate() {
    if (active_) core_->stopStreaming();
    active_ = false;
  }

  void run(uint32_t frames) {
    ran_ = true;
    applyPorts();
    const float* inL = ports_[kInLeft];
    const float* inR = ports_[kInRight];
    float* outL = ports_[kOutLeft];
    float* outR = ports_[kOutRight];
    if (inL && inR && outL && outR && frames > 0) {
      // The core takes interleaved-by-stride buffers; separate channel buffers are stride 1.
      const int32_t n = static_cast<int32_t>(frames);
      const int32_t produced = core_->processStereo(inL, inR, outL, outR, n, 1, 0, 0, 0);
      for (int32_t i = std::max(produced, 0); i < n; ++i) outL[i] = outR[i] = 0.0f;
    }
    write(kMeter, core_->getStatus(kStatusLevel));
    write(kLoad, core_->getStatus(kStatusLoad));
    write(kLatency, 0.0f);
  }

  LV2_State_Status save(LV2_State_Store_Function store, LV2_State_Handle handle) {
    if (!settingsKey_) return LV2_STATE_ERR_NO_FEATURE;
    std::array<uint8_t, 88> record{};
    if (static_cast<size_t>(core_->stateSize()) != record.size() || !core_->saveState(record.data()))
      return LV2_STATE_ERR_UNKNOWN;
    return store(handle, settingsKey_, record.data(), record.size(), chunkType_,
                 LV2_STATE_IS_POD | LV2_STATE_IS_PORTABLE);
  }

  LV2_State_Status restore(LV2_State_Retrieve_Function retrieve, LV2_State_Handle handle) {
    if (!settingsKey_) return LV2_STATE_ERR_NO_FEATURE;
    size_t size = 0;
    uint32_t type = 0, flags = 0;
    const void* data = retrieve(handle, settingsKey_, &size, &type, &flags);
    if (!data) return LV2_STATE_ERR_NO_PROPERTY;
    const auto* bytes = static_cast<const uint8_t*>(data);
    if (type != chunkType_ || size != 88 || !core_->validateState(bytes, 88)) return LV2_STATE_ERR_BAD_TYPE;
    if (!core_->loadState(bytes, 88)) return LV2_STATE_ERR_UNKNOWN;
    // The record is now the truth; ports that still show other values are applied again at the next block.
    for (int32_t id = 0; id < kParamCount; ++id) applied_[id] = core_->getValue(id);
    restored_ = true;
    return LV2_STATE_SUCCESS;
  }

 private:
  void write(uint32_t port, float value) {
    if (ports_[port]) *ports_[port] = value;
  }

  // Applies the control ports that changed since they were last applied: the algorithm first (its switch
  // loads the algorithm's remembered values, so every other port is applied again after it), then the rest
  // in id order.
  void applyPorts() {
    // Nothing to do in the common case: no port moved since the last block (readings compared bit for bit).
    bool moved = false;
    for (int32_t id = 0; id < kParamCount; ++id) {
      const float* p = ports_[paramPort(id)];
      if (p && std::memcmp(p, &seen_[id], sizeof(float)) != 0) {
        seen_[id] = *p;
        moved = true;
      }
    }
    if (!moved && !restored_) return;
    restored_ = false;
    if (const float* p = ports_[paramPort(kAlgorithm)]) {
      const int32_t steps = stepsOfPortValue(kAlgorithm, *p);
      if (steps != applied_[kAlgorithm]) {
        core_->setValue(kAlgorithm, steps);
        applied_.fill(kUnapplied);
        applied_[kAlgorithm] = steps;
      }
    }
    for (int32_t id = 0; id < kParamCount; ++id) {
      const float* p = ports_[paramPort(id)];
      if (id == kAlgorithm || !p) continue;
      const int32_t steps = stepsOfPortValue(id, *p);
      if (steps == applied_[id]) continue;
      // A value the core already holds is not set again: setting it would rebuild a network for nothing.
      if (steps != core_->getValue(id)) core_->setValueAndNotify(id, steps);
      applied_[id] = steps;
    }
  }

  static std::unique_ptr<ReverbCore> freshCore(double rate) {
    auto core = std::make_unique<ReverbCore>();
    core->setFormat(static_cast<float>(rate), 0, 2, 2);
    core->applyAll();
    return core;
  }

  double rate_;
  std::unique_ptr<ReverbCore> core_;
  bool ran_ = false;
  std::array<float*, kPortCount> ports_{};
  std::array<int32_t, kParamCount> applied_{};
  std::array<float, kParamCount> seen_{};  // the port readings of the last block
  bool restored_ = false;                  // a state was loaded: compare every port with it
  LV2_URID settingsKey_ = 0;
  LV2_URID chunkType_ = 0;
  bool active_ = false;
};

Plugin* self(LV2_Handle h) { return static_cast<Plugin*>(h); }

LV2_Handle instantiate(const LV2_Descriptor*, double rate, const char*, const LV2_Feature* const* features) {
  // Only the rates a host may give; the core is never asked to run at any other.
  if (!(rate >= 1.0 && rate <= 768000.0)) return nullptr;
  LV2_URID_Map* map = nullptr;
  for (int i = 0; features && features[i]; ++i)
    if (std::strcmp(features[i]->URI, LV2_URID__map) == 0) map = static_cast<LV2_URID_Map*>(features[i]->data);
  return new (std::nothrow) Plugin(rate, map);
}

void connectPort(LV2_Handle h, uint32_t port, void* data) { self(h)->connect(port, data); }
void activate(LV2_Handle h) { self(h)->activate(); }
void run(LV2_Handle h, uint32_t frames) { self(h)->run(frames); }
void deactivate(LV2_Handle h) { self(h)->deactivate(); }
void cleanup(LV2_Handle h) { delete self(h); }

LV2_State_Status save(LV2_Handle h, LV2_State_Store_Function store, LV2_State_Handle handle, uint32_t,
                      const LV2_Feature* const*) {
  return self(h)->save(store, handle);
}

LV2_State_Status restore(LV2_Handle h, LV2_State_Retrieve_Function retrieve, LV2_State_Handle handle, uint32_t,
                         const LV2_Feature* const*) {
  return self(h)->restore(retrieve, handle);
}

const void* extensionData(const char* uri) {
  static const LV2_State_Interface state = {save, restore};
  if (std::strcmp(uri, LV2_STATE__interface) == 0) return &state;
  return nullptr;
}

const LV2_Descriptor kDescriptor = {kPluginUri, instantiate, connectPort, activate, run,
                                    deactivate,  cleanup,     extensionData};

}  // namespace
}  // namespace ulvetta::lv2

extern "C" LV2_SYMBOL_EXPORT const LV2_Descriptor* lv2_descriptor(uint32_t index) {
  return index == 0 ? &ulvetta::lv2::kDescriptor : nullptr;
}
