// The LV2 plugin's user interface: the editor in an X11 window. It talks to the plugin only through ports:
// a mirror core holds the values the ports show, so the editor reads and changes it as it would the filter's
// core; every 50 ms tick the values that the editor changed are written to the ports, and the host's port
// events (including the meter) update the mirror.
#include <lv2/core/lv2.h>
#include <lv2/ui/ui.h>

#include <array>
#include <chrono>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <limits>
#include <memory>
#include <new>
#include <string>

#include "Lv2Ports.h"
#include "X11Host.h"
#include "editor/PageSet.h"
#include "filter/ReverbCore.h"

namespace ulvetta::lv2 {
namespace {

// The editor's core: the port values, with the meter figures the plugin reports.
class MirrorCore : public ReverbCore {
 public:
  float getStatus(int32_t code) override {
    if (code == kStatusLevel) return level_;
    // The needle falls back to rest when the plugin has not reported a level for half a second.
    if (code == kStatusStopped) return Clock::now() - lastLevel_ > std::chrono::milliseconds(500) ? 1.0f : 0.0f;
    return ReverbCore::getStatus(code);
  }
  void setLevel(float level) {
    level_ = std::isfinite(level) ? level : 0.0f;
    lastLevel_ = Clock::now();
  }

 private:
  using Clock = std::chrono::steady_clock;
  float level_ = 0.0f;
  Clock::time_point lastLevel_{};
};

// $XDG_CONFIG_HOME/ulvetta/ (or ~/.config/ulvetta/): the appearance file and pictures of this user.
std::string configFolder() {
  const char* xdg = std::getenv("XDG_CONFIG_HOME");
  if (xdg && xdg[0] == '/') return std::string(xdg) + "/ulvetta/";
  const char* home = std::getenv("HOME");
  return home && home[0] == '/' ? std::string(home) + "/.config/ulvetta/" : std::string();
}

// The user presets the command-line tool keeps: $XDG_DATA_HOME/ulvetta/Presets (or ~/.local/share/...).
std::string presetFolder() {
  const char* xdg = std::getenv("XDG_DATA_HOME");
  if (xdg && xdg[0] == '/') return std::string(xdg) + "/ulvetta/Presets";
  const char* home = std::getenv("HOME");
  return home && home[0] == '/' ? std::string(home) + "/.local/share/ulvetta/Presets" : std::string();
}

class Ui {
 public:
  Ui(LV2UI_Write_Function write, LV2UI_Controller controller, unsigned long parent)
      : write_(write), controller_(controller), host_(parent, configFolder(), presetFolder()) {
    if (!host_.ok()) return;
    pages_ = std::make_unique<PageSet>(core_, &host_);
    if (pages_->failed()) return;
    host_.show(&pages_->window());
    // The ports start at their defaults, which the mirror holds.
    for (int32_t id = 0; id < kParamCount; ++id) sent_[id] = shown_[id] = core_.getValue(id);
    lastTick_ = Clock::now();
  }

  bool ok() const { return pages_ && !pages_->failed(); }
  unsigned long window() const { return host_.window(); }

  void portEvent(uint32_t port, uint32_t size, uint32_t format, const void* buffer) {
    if (format != 0 || size != sizeof(float) || !buffer) return;
    const float value = *static_cast<const float*>(buffer);
    if (port == kMeter) {
      core_.setLevel(value);
      return;
    }
    if (port < kFirstParam || port >= kFirstParam + kParamCount || !std::isfinite(value)) return;
    const int32_t id = static_cast<int32_t>(port - kFirstParam);
    const int32_t steps = stepsOfPortValue(id, value);
    shown_[id] = steps;
    sent_[id] = steps;
    if (core_.getValue(id) == steps) return;
    core_.setValue(id, steps);
    // The mirror's algorithm switch loads that algorithm's remembered values, but the plugin keeps what its
    // ports say when the host changes the algorithm: so does the mirror.
    if (id == kAlgorithm)
      for (int32_t other = 0; other < kParamCount; ++other)
        if (other != kAlgorithm) core_.setValue(other, shown_[other]);
    core_.notifyListeners(id);
  }

  // The host's idle call: events, the 50 ms ticks, and the editor's changes sent to the ports.
  int idle() {
    if (!host_.processEvents()) return 1;
    const auto now = Clock::now();
    while (now - lastTick_ >= std::chrono::milliseconds(kTickMilliseconds)) {
      lastTick_ += std::chrono::milliseconds(kTickMilliseconds);
      pages_->window().tick();
    }
    sendChanges();
    host_.processEvents();
    return 0;
  }

 private:
  using Clock = std::chrono::steady_clock;

  void sendChanges() {
    // The algorithm first: the plugin applies the other ports again after switching.
    send(kAlgorithm);
    for (int32_t id = 0; id < kParamCount; ++id)
      if (id != kAlgorithm) send(id);
  }
  void send(int32_t id) {
    const int32_t v = core_.getValue(id);
    if (v == sent_[id]) return;
    sent_[id] = v;
    shown_[id] = v;
    const float value = static_cast<float>(portValueOf(id, v));
    write_(controller_, paramPort(id), sizeof(float), 0, &value);
  }

  LV2UI_Write_Function write_;
  LV2UI_Controller controller_;
  MirrorCore core_;
  X11Host host_;
  std::unique_ptr<PageSet> pages_;
  std::array<int32_t, kParamCount> sent_{};   // the values last written to or received from each port
  std::array<int32_t, kParamCount> shown_{};  // what each port says the plugin uses
  Clock::time_point lastTick_{};
};

LV2UI_Handle instantiate(const LV2UI_Descriptor*, const char*, const char*, LV2UI_Write_Function write,
                         LV2UI_Controller controller, LV2UI_Widget* widget, const LV2_Feature* const* features) {
  unsigned long parent = 0;
  const LV2UI_Resize* resize = nullptr;
  for (int i = 0; features && features[i]; ++i) {
    if (std::strcmp(features[i]->URI, LV2_UI__parent) == 0)
      parent = reinterpret_cast<unsigned long>(features[i]->data);
    else if (std::strcmp(features[i]->URI, LV2_UI__resize) == 0)
      resize = static_cast<const LV2UI_Resize*>(features[i]->data);
  }
  auto* ui = new (std::nothrow) Ui(write, controller, parent);
  if (!ui || !ui->ok()) {
    delete ui;
    return nullptr;
  }
  *widget = reinterpret_cast<LV2UI_Widget>(ui->window());
  if (resize) resize->ui_resize(resize->handle, kEditorWidth, kEditorHeight);
  return ui;
}

void cleanup(LV2UI_Handle h) { delete static_cast<Ui*>(h); }

void portEvent(LV2UI_Handle h, uint32_t port, uint32_t size, uint32_t format, const void* buffer) {
  static_cast<Ui*>(h)->portEvent(port, size, format, buffer);
}

int idle(LV2UI_Handle h) { return static_cast<Ui*>(h)->idle(); }

const void* extensionData(const char* uri) {
  static const LV2UI_Idle_Interface idleInterface = {idle};
  if (std::strcmp(uri, LV2_UI__idleInterface) == 0) return &idleInterface;
  return nullptr;
}

const LV2UI_Descriptor kUiDescriptor = {kUiUri, instantiate, cleanup, portEvent, extensionData};

}  // namespace
}  // namespace ulvetta::lv2

extern "C" LV2_SYMBOL_EXPORT const LV2UI_Descriptor* lv2ui_descriptor(uint32_t index) {
  return index == 0 ? &ulvetta::lv2::kUiDescriptor : nullptr;
}
