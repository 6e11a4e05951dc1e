// The plugin's X11 user interface loaded as a host loads it (the UI descriptor from the bundle's module), on
// the X server the test runs under: the user's drags reach the host as port writes, and the host's port
// events reach the editor.
// GoogleTest before Xlib, whose macros (None) would break it.
#include <gtest/gtest.h>
// clang-format off
#include <X11/Xlib.h>
// clang-format on
#include <dlfcn.h>
#include <lv2/ui/ui.h>

#include <string>
#include <utility>
#include <vector>

#include "Lv2Ports.h"

namespace {

using namespace ulvetta;

struct Written {
  std::vector<std::pair<uint32_t, float>> writes;
  float last(uint32_t port) const {
    for (auto it = writes.rbegin(); it != writes.rend(); ++it)
      if (it->first == port) return it->second;
    return -12345.0f;
  }
  bool wrote(uint32_t port) const { return last(port) != -12345.0f; }
};

void write(LV2UI_Controller controller, uint32_t port, uint32_t size, uint32_t protocol, const void* buffer) {
  if (size == sizeof(float) && protocol == 0)
    static_cast<Written*>(controller)->writes.emplace_back(port, *static_cast<const float*>(buffer));
}

class Lv2UiTest : public ::testing::Test {
 protected:
  void SetUp() override {
    display_ = XOpenDisplay(nullptr);
    ASSERT_NE(display_, nullptr) << "no X server (run under with-xvfb.sh)";
    module_ = dlopen(ULVETTA_LV2_BUNDLE "/ulvetta_ui.so", RTLD_NOW | RTLD_LOCAL);
    ASSERT_NE(module_, nullptr) << dlerror();
    auto entry = reinterpret_cast<const LV2UI_Descriptor* (*)(uint32_t)>(dlsym(module_, "lv2ui_descriptor"));
    ASSERT_NE(entry, nullptr);
    descriptor_ = entry(0);
    ASSERT_NE(descriptor_, nullptr);
    EXPECT_EQ(std::string(descriptor_->URI), lv2::kUiUri);
    idle_ = static_cast<const LV2UI_Idle_Interface*>(descriptor_->extension_data(LV2_UI__idleInterface));
    ASSERT_NE(idle_, nullptr);
    LV2UI_Widget widget = nullptr;
    const LV2_Feature* features[] = {nullptr};
    ui_ = descriptor_->instantiate(descriptor_, lv2::kPluginUri, ULVETTA_LV2_BUNDLE, write, &written_, &widget,
                                   features);
    ASSERT_NE(ui_, nullptr);
    window_ = reinterpret_cast<Window>(widget);
    settle();
  }
  void TearDown() override {
    if (ui_) descriptor_->cleanup(ui_);
    if (module_) dlclose(module_);
    if (display_) XCloseDisplay(display_);
  }

  // Lets the UI handle what reached its connection.
  void settle() {
    XSync(display_, False);
    for (int i = 0; i < 3; ++i) ASSERT_EQ(idle_->idle(ui_), 0);
  }
  void send(int type, int x, int y, unsigned int button, unsigned int state) {
    XEvent e{};
    e.type = type;
    if (type == MotionNotify) {
      e.xmotion = {MotionNotify, 0, True, display_, window_, DefaultRootWindow(display_), 0, ++time_, x, y, x, y,
                   state, NotifyNormal, True};
      XSendEvent(display_, window_, False, PointerMotionMask, &e);
    } else {
      e.xbutton = {type, 0, True, display_, window_, DefaultRootWindow(display_), 0, ++time_, x, y, x, y,
                   state, button, True};
      XSendEvent(display_, window_, False, type == ButtonPress ? ButtonPressMask : ButtonReleaseMask, &e);
    }
    settle();
  }
  void drag(int x, int fromY, int toY) {
    time_ += 1000;  // far from any earlier press: not a double click
    send(ButtonPress, x, fromY, Button1, 0);
    send(MotionNotify, x, toY, 0, Button1Mask);
    send(ButtonRelease, x, toY, Button1, Button1Mask);
  }
  void portEvent(int32_t id, float value) { descriptor_->port_event(ui_, lv2::paramPort(id), sizeof value, 0, &value); }

  Display* display_ = nullptr;
  void* module_ = nullptr;
  const LV2UI_Descriptor* descriptor_ = nullptr;
  const LV2UI_Idle_Interface* idle_ = nullptr;
  LV2UI_Handle ui_ = nullptr;
  Window window_ = 0;
  Written written_;
  Time time_ = 1;
};

// The Decay fader's track on the reverb page: x 314..335, y 39..148; its thumb is 15 pixels high.
constexpr int kDecayX = 325;

TEST_F(Lv2UiTest, DraggingAFaderWritesItsPortInShownUnits) {
  drag(kDecayX, 140, 20);  // far above the track: the top, Decay 100
  EXPECT_EQ(written_.last(lv2::paramPort(kDecay)), 100.0f);
  drag(kDecayX, 45, 250);  // from the thumb at the top to far below the track: Decay 0
  EXPECT_EQ(written_.last(lv2::paramPort(kDecay)), 0.0f);
  // Nothing else moved.
  for (const auto& [port, value] : written_.writes) EXPECT_EQ(port, lv2::paramPort(kDecay)) << value;
}

TEST_F(Lv2UiTest, HostPortEventsReachTheEditorWithoutEchoing) {
  portEvent(kAlgorithm, 3.0f);  // a convolution room: no Pre Delay column
  portEvent(kDecay, 80.0f);
  settle();
  EXPECT_TRUE(written_.writes.empty());  // what the host said is not sent back
  drag(277 + 11, 140, 20);               // where the Pre Delay fader would be
  EXPECT_FALSE(written_.wrote(lv2::paramPort(kPreDelay)));
  // The Decay fader stands where the host put it: a press on its thumb's centre does not move it.
  // Vertical thumb top for position 0.8: 39 + trunc((110 - 15) x 0.2 + 0.5) = 58; centre 65.
  time_ += 1000;
  send(ButtonPress, kDecayX, 65, Button1, 0);
  send(ButtonRelease, kDecayX, 65, Button1, Button1Mask);
  EXPECT_FALSE(written_.wrote(lv2::paramPort(kDecay)));
  drag(kDecayX, 65, 200);
  EXPECT_EQ(written_.last(lv2::paramPort(kDecay)), 0.0f);
}

}  // namespace
