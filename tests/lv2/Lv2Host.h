// A small offline LV2 host on lilv: loads a plugin (from a bundle folder or the installed ones), connects
// every port (controls to values, audio to block buffers, atom ports to empty sequences) and runs blocks.
// Shared by the plugin's tests and the benchmark that compares it with other reverbs.
#pragma once

#include <lilv/lilv.h>
#include <lv2/atom/atom.h>
#include <lv2/buf-size/buf-size.h>
#include <lv2/options/options.h>
#include <lv2/parameters/parameters.h>
#include <lv2/state/state.h>
#include <lv2/urid/urid.h>
#include <lv2/worker/worker.h>

#include <cmath>
#include <cstring>
#include <map>
#include <memory>
#include <string>
#include <vector>

namespace ulvetta::testing {

// The URID map the host hands to plugins: URIs numbered from 1 in order of first use.
class UridMap {
 public:
  UridMap() {
    map_.handle = this;
    map_.map = [](LV2_URID_Map_Handle h, const char* uri) { return static_cast<UridMap*>(h)->id(uri); };
    unmap_.handle = this;
    unmap_.unmap = [](LV2_URID_Unmap_Handle h, LV2_URID id) { return static_cast<UridMap*>(h)->uri(id); };
  }
  LV2_URID id(const char* uri) {
    auto it = ids_.find(uri);
    if (it != ids_.end()) return it->second;
    uris_.push_back(std::make_unique<std::string>(uri));
    return ids_[uri] = static_cast<LV2_URID>(uris_.size());
  }
  const char* uri(LV2_URID id) const { return id >= 1 && id <= uris_.size() ? uris_[id - 1]->c_str() : nullptr; }
  LV2_URID_Map* map() { return &map_; }
  LV2_URID_Unmap* unmap() { return &unmap_; }

 private:
  LV2_URID_Map map_{};
  LV2_URID_Unmap unmap_{};
  std::map<std::string, LV2_URID> ids_;
  std::vector<std::unique_ptr<std::string>> uris_;
};

class Lv2Host {
 public:
  static constexpr int32_t kMaxBlock = 8192;

  // bundles: folders holding manifest.ttl (with a trailing slash or not); none for the installed plugins.
  Lv2Host(const std::vector<std::string>& bundles, const std::string& uri, double rate) : world_(lilv_world_new()) {
    if (bundles.empty()) {
      lilv_world_load_all(world_);
    } else {
      lilv_world_load_specifications(world_);
      lilv_world_load_plugin_classes(world_);
      for (const std::string& bundle : bundles) {
        const std::string folder = bundle.back() == '/' ? bundle : bundle + "/";
        LilvNode* node = lilv_new_file_uri(world_, nullptr, folder.c_str());
        lilv_world_load_bundle(world_, node);
        lilv_node_free(node);
      }
    }
    LilvNode* u = lilv_new_uri(world_, uri.c_str());
    plugin_ = lilv_plugins_get_by_uri(lilv_world_get_all_plugins(world_), u);
    lilv_node_free(u);
    if (!plugin_) return;
    // The block-length options and the rate that plugins built with common frameworks insist on.
    rate_ = static_cast<float>(rate);
    const LV2_URID intType = urids_.id(LV2_ATOM__Int), floatType = urids_.id(LV2_ATOM__Float);
    options_[0] = {LV2_OPTIONS_INSTANCE, 0, urids_.id(LV2_BUF_SIZE__minBlockLength), sizeof(int32_t), intType, &minBlock_};
    options_[1] = {LV2_OPTIONS_INSTANCE, 0, urids_.id(LV2_BUF_SIZE__maxBlockLength), sizeof(int32_t), intType, &maxBlock_};
    options_[2] = {LV2_OPTIONS_INSTANCE, 0, urids_.id(LV2_BUF_SIZE__nominalBlockLength), sizeof(int32_t), intType,
                   &maxBlock_};
    options_[3] = {LV2_OPTIONS_INSTANCE, 0, urids_.id(LV2_PARAMETERS__sampleRate), sizeof(float), floatType, &rate_};
    options_[4] = {LV2_OPTIONS_INSTANCE, 0, 0, 0, 0, nullptr};
    features_[0] = {LV2_URID__map, urids_.map()};
    features_[1] = {LV2_URID__unmap, urids_.unmap()};
    features_[2] = {LV2_OPTIONS__options, options_};
    features_[3] = {LV2_BUF_SIZE__boundedBlockLength, nullptr};
    schedule_ = {this, &Lv2Host::scheduleWork};
    features_[4] = {LV2_WORKER__schedule, &schedule_};
    for (int i = 0; i < 5; ++i) featureList_[i] = &features_[i];
    instance_ = lilv_plugin_instantiate(plugin_, rate, featureList_);
    if (!instance_) return;
    connectPorts();
  }
  ~Lv2Host() {
    if (instance_) {
      if (active_) lilv_instance_deactivate(instance_);
      lilv_instance_free(instance_);
    }
    lilv_world_free(world_);
  }
  Lv2Host(const Lv2Host&) = delete;
  Lv2Host& operator=(const Lv2Host&) = delete;

  bool ok() const { return instance_ != nullptr; }
  const LilvPlugin* plugin() const { return plugin_; }
  LilvWorld* world() const { return world_; }
  UridMap& urids() { return urids_; }

  // The value of a control port by symbol; false for an unknown symbol.
  bool setControl(const std::string& symbol, float value) {
    auto it = controlBySymbol_.find(symbol);
    if (it == controlBySymbol_.end()) return false;
    controls_[it->second] = value;
    return true;
  }
  float control(const std::string& symbol) const {
    auto it = controlBySymbol_.find(symbol);
    return it == controlBySymbol_.end() ? 0.0f : controls_[it->second];
  }

  void activate() {
    if (!active_) lilv_instance_activate(instance_);
    active_ = true;
  }
  void deactivate() {
    if (active_) lilv_instance_deactivate(instance_);
    active_ = false;
  }

  // Runs one block of frames (at most kMaxBlock) of planar stereo through the plugin.
  void run(const float* inL, const float* inR, float* outL, float* outR, uint32_t frames) {
    std::memcpy(audioIn_[0].data(), inL, frames * sizeof(float));
    std::memcpy(audioIn_[audioIn_.size() > 1 ? 1 : 0].data(), inR, frames * sizeof(float));
    resetAtoms();
    lilv_instance_run(instance_, frames);
    deliverResponses();
    std::memcpy(outL, audioOut_[0].data(), frames * sizeof(float));
    std::memcpy(outR, audioOut_[audioOut_.size() > 1 ? 1 : 0].data(), frames * sizeof(float));
  }

  // The plugin's state and the control values, as a session saves them; null on failure.
  LilvState* saveState() {
    return lilv_state_new_from_instance(plugin_, instance_, urids_.map(), nullptr, nullptr, nullptr, nullptr,
                                        &Lv2Host::portValue, this, LV2_STATE_IS_POD | LV2_STATE_IS_PORTABLE,
                                        nullptr);
  }
  void restoreState(const LilvState* state) {
    lilv_state_restore(state, instance_, &Lv2Host::setPortValue, this, 0, nullptr);
  }
  // Applies a preset of the loaded bundles by its URI; false when there is no such preset.
  bool applyPreset(const std::string& uri) {
    LilvNode* node = lilv_new_uri(world_, uri.c_str());
    lilv_world_load_resource(world_, node);
    LilvState* state = lilv_state_new_from_world(world_, urids_.map(), node);
    lilv_node_free(node);
    if (!state) return false;
    restoreState(state);
    lilv_state_free(state);
    return true;
  }

 private:
  // The worker runs at once on the calling thread; its responses reach the plugin after the block.
  const LV2_Worker_Interface* worker() const {
    return static_cast<const LV2_Worker_Interface*>(lilv_instance_get_extension_data(instance_, LV2_WORKER__interface));
  }
  static LV2_Worker_Status scheduleWork(LV2_Worker_Schedule_Handle self, uint32_t size, const void* data) {
    auto* host = static_cast<Lv2Host*>(self);
    const LV2_Worker_Interface* w = host->instance_ ? host->worker() : nullptr;
    if (!w || !w->work) return LV2_WORKER_ERR_UNKNOWN;
    return w->work(lilv_instance_get_handle(host->instance_), &Lv2Host::respond, host, size, data);
  }
  static LV2_Worker_Status respond(LV2_Worker_Respond_Handle self, uint32_t size, const void* data) {
    const auto* bytes = static_cast<const uint8_t*>(data);
    static_cast<Lv2Host*>(self)->responses_.emplace_back(bytes, bytes + size);
    return LV2_WORKER_SUCCESS;
  }
  void deliverResponses() {
    const LV2_Worker_Interface* w = worker();
    if (!w) return;
    for (const auto& r : responses_)
      if (w->work_response)
        w->work_response(lilv_instance_get_handle(instance_), static_cast<uint32_t>(r.size()), r.data());
    responses_.clear();
    if (w->end_run) w->end_run(lilv_instance_get_handle(instance_));
  }

  static const void* portValue(const char* symbol, void* self, uint32_t* size, uint32_t* type) {
    auto* host = static_cast<Lv2Host*>(self);
    auto it = host->controlBySymbol_.find(symbol);
    if (it == host->controlBySymbol_.end()) return nullptr;
    *size = sizeof(float);
    *type = host->urids_.id(LV2_ATOM__Float);
    return &host->controls_[it->second];
  }
  static void setPortValue(const char* symbol, void* self, const void* value, uint32_t size, uint32_t type) {
    auto* host = static_cast<Lv2Host*>(self);
    if (size == sizeof(float) && type == host->urids_.id(LV2_ATOM__Float))
      host->setControl(symbol, *static_cast<const float*>(value));
  }

  void connectPorts() {
    const uint32_t count = lilv_plugin_get_num_ports(plugin_);
    controls_.assign(count, 0.0f);
    std::vector<float> mins(count), maxs(count), defaults(count);
    lilv_plugin_get_port_ranges_float(plugin_, mins.data(), maxs.data(), defaults.data());
    LilvNode* input = lilv_new_uri(world_, LV2_CORE__InputPort);
    LilvNode* audio = lilv_new_uri(world_, LV2_CORE__AudioPort);
    LilvNode* control = lilv_new_uri(world_, LV2_CORE__ControlPort);
    LilvNode* atom = lilv_new_uri(world_, LV2_ATOM__AtomPort);
    audioIn_.reserve(count);
    audioOut_.reserve(count);
    atoms_.reserve(count);
    for (uint32_t i = 0; i < count; ++i) {
      const LilvPort* port = lilv_plugin_get_port_by_index(plugin_, i);
      const bool in = lilv_port_is_a(plugin_, port, input);
      if (lilv_port_is_a(plugin_, port, audio)) {
        auto& list = in ? audioIn_ : audioOut_;
        list.emplace_back(kMaxBlock, 0.0f);
        lilv_instance_connect_port(instance_, i, list.back().data());
      } else if (lilv_port_is_a(plugin_, port, control)) {
        controls_[i] = std::isnan(defaults[i]) ? 0.0f : defaults[i];
        controlBySymbol_[lilv_node_as_string(lilv_port_get_symbol(plugin_, port))] = i;
        lilv_instance_connect_port(instance_, i, &controls_[i]);
      } else if (lilv_port_is_a(plugin_, port, atom)) {
        atoms_.push_back({in, std::vector<uint8_t>(8192, 0)});
        lilv_instance_connect_port(instance_, i, atoms_.back().buffer.data());
      } else {
        lilv_instance_connect_port(instance_, i, nullptr);
      }
    }
    for (LilvNode* n : {input, audio, control, atom}) lilv_node_free(n);
    resetAtoms();
  }

  // Inputs hold an empty event sequence; outputs offer their whole buffer.
  void resetAtoms() {
    for (AtomBuffer& a : atoms_) {
      auto* seq = reinterpret_cast<LV2_Atom_Sequence*>(a.buffer.data());
      seq->atom.type = a.input ? urids_.id(LV2_ATOM__Sequence) : urids_.id(LV2_ATOM__Chunk);
      seq->atom.size = a.input ? sizeof(LV2_Atom_Sequence_Body)
                               : static_cast<uint32_t>(a.buffer.size() - sizeof(LV2_Atom));
      seq->body.unit = 0;
      seq->body.pad = 0;
    }
  }

  struct AtomBuffer {
    bool input;
    std::vector<uint8_t> buffer;
  };

  LilvWorld* world_;
  UridMap urids_;
  int32_t minBlock_ = 1, maxBlock_ = kMaxBlock;
  float rate_ = 0.0f;
  LV2_Options_Option options_[5] = {};
  LV2_Feature features_[5] = {};
  const LV2_Feature* featureList_[6] = {};
  LV2_Worker_Schedule schedule_{};
  std::vector<std::vector<uint8_t>> responses_;
  const LilvPlugin* plugin_ = nullptr;
  LilvInstance* instance_ = nullptr;
  bool active_ = false;
  std::vector<float> controls_;
  std::map<std::string, uint32_t> controlBySymbol_;
  std::vector<std::vector<float>> audioIn_, audioOut_;
  std::vector<AtomBuffer> atoms_;
};

}  // namespace ulvetta::testing
