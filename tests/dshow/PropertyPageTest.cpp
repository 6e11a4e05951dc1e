// The editor as the filter's property page under the platform's property frame, on a real display: the page
// shows what `ulvetta snapshot` draws, pixel for pixel; mouse, keys, the preset menu and dialogs act as on
// Linux; and the frame opens and closes while audio streams, leaving no window, hook or GDI object behind.
#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>

#include "PageRig.h"
#include "editor/win32/EditorLock.h"
#include "editor/win32/KeyboardHook.h"
#include "filter/CoreState.h"
#include "filter/ReverbCore.h"
#include "platform/ModulePath.h"

using namespace ulvetta;
using namespace ulvetta::test;
namespace fs = std::filesystem;

namespace {

const std::string kCases = ULVETTA_PAGE_CASES;

class EditorLockEnvironment : public ::testing::Environment {
 public:
  void SetUp() override { ASSERT_TRUE(createEditorLock()); }
  void TearDown() override { deleteEditorLock(); }
};
const auto* const g_lock = ::testing::AddGlobalTestEnvironment(new EditorLockEnvironment);

std::vector<unsigned char> ReadFile(const std::string& path) {
  std::ifstream f(path, std::ios::binary);
  return std::vector<unsigned char>((std::istreambuf_iterator<char>(f)), std::istreambuf_iterator<char>());
}

// The module's folder as the page sees it (this executable's), with its presets and profile file.
fs::path ModuleFolder() { return fs::u8path(moduleDirectory()); }

// Pixels of the page that differ from a snapshot's raw RGB rows, outside an optional excluded rectangle.
int Differences(const Capture& c, const std::string& rgbFile, RECT exclude = {0, 0, 0, 0}) {
  const std::vector<unsigned char> rgb = ReadFile(kCases + "/" + rgbFile);
  if (rgb.size() != size_t{3} * kEditorWidth * kEditorHeight) return -1;
  int differing = 0;
  for (int y = 0; y < kEditorHeight; ++y)
    for (int x = 0; x < kEditorWidth; ++x) {
      if (x >= exclude.left && x < exclude.right && y >= exclude.top && y < exclude.bottom) continue;
      const unsigned char* p = &rgb[(static_cast<size_t>(y) * kEditorWidth + x) * 3];
      const uint32_t expected = (uint32_t{p[0]} << 16) | (uint32_t{p[1]} << 8) | p[2];
      differing += c.at(x, y) != expected;
    }
  return differing;
}

Capture CapturePage(HWND page) { return CaptureClient(page, kEditorWidth, kEditorHeight); }

// The differences once the page has settled: painted, and its 50 ms timer run at least once (the load bar
// is drawn by the first tick). Any difference left after two seconds is a real one.
int SettledDifferences(HWND page, const std::string& rgbFile, RECT exclude = {0, 0, 0, 0}) {
  int d = -1;
  WaitFor([&] { return (d = Differences(CapturePage(page), rgbFile, exclude)) == 0; }, 2000);
  return d;
}

std::vector<uint8_t> StateOf(FilterHolder& f) {
  std::vector<uint8_t> state(kCoreStateSize);
  f.Core()->saveState(state.data());
  return state;
}

// A fresh filter and an empty module folder: no presets, no profile file, so the default look shows.
class PageTest : public ::testing::Test {
 protected:
  void SetUp() override {
    std::error_code ec;
    fs::remove_all(ModuleFolder() / "Presets", ec);
    fs::remove(fs::path(modulePath()).replace_extension(".ini"), ec);
  }
  FilterHolder filter;
};

}  // namespace

TEST_F(PageTest, TheFrameShowsTheWholeEditorAsTheSnapshotDrawsIt) {
  FrameSession frame(filter.inner);
  ASSERT_NE(frame.page(), nullptr) << "no page window in the property frame";
  RECT client;
  GetClientRect(frame.page(), &client);
  EXPECT_GE(client.right, kEditorWidth);
  EXPECT_GE(client.bottom, kEditorHeight);
  // The whole editor lies inside the frame's client area.
  POINT corner{kEditorWidth, kEditorHeight};
  MapWindowPoints(frame.page(), frame.frame(), &corner, 1);
  RECT frameClient;
  GetClientRect(frame.frame(), &frameClient);
  EXPECT_LE(corner.x, frameClient.right);
  EXPECT_LE(corner.y, frameClient.bottom);

  HDC dc = GetDC(frame.page());
  ASSERT_GE(GetDeviceCaps(dc, BITSPIXEL), 24) << "exact pixels need a 24-bit display";
  ReleaseDC(frame.page(), dc);

  EXPECT_EQ(SettledDifferences(frame.page(), "reverb.rgb"), 0);
  Click(frame.page(), 527, 145);  // page button 2
  EXPECT_EQ(SettledDifferences(frame.page(), "filter.rgb"), 0);
  Click(frame.page(), 140, 18);  // the logo
  // The credit lines fade in and out on the timer; everything around their panel is still.
  EXPECT_EQ(SettledDifferences(frame.page(), "about.rgb", RECT{399, 17, 751, 120}), 0);
  frame.close();
  EXPECT_EQ(frame.result(), S_OK);
}

TEST_F(PageTest, MouseAndKeysChangeTheSettingsAsOnLinux) {
  FrameSession frame(filter.inner);
  ASSERT_NE(frame.page(), nullptr);
  const HWND page = frame.page();
  const std::vector<uint8_t> initial = StateOf(filter);

  // The Pre Delay fader: a click on its track, then a drag of its thumb, as drag.events plays them.
  Click(page, 284, 120);
  Mouse(page, WM_LBUTTONDOWN, 284, 120, MK_LBUTTON);
  Mouse(page, WM_MOUSEMOVE, 284, 60, MK_LBUTTON);
  Mouse(page, WM_MOUSEMOVE, 284, 70, MK_LBUTTON);
  Mouse(page, WM_LBUTTONUP, 284, 70, 0);
  const std::vector<uint8_t> dragged = ReadFile(kCases + "/drag.stp");
  EXPECT_NE(dragged, initial);
  EXPECT_EQ(StateOf(filter), dragged);
  EXPECT_EQ(GetCapture(), nullptr);

  // Keys come from the keyboard through the frame's dialog manager, which would take TAB for itself.
  SetForegroundWindow(frame.frame());
  ASSERT_TRUE(WaitFor([&] { return GetForegroundWindow() == frame.frame(); }, 2000));
  PressKey(VK_TAB);
  EXPECT_TRUE(WaitFor([&] { return frame.editor()->currentPage() == kFilterPage; }, 2000));
  PressKey(VK_TAB);
  EXPECT_TRUE(WaitFor([&] { return frame.editor()->currentPage() == kReverbPage; }, 2000));

  // The Decay value typed and stored with Enter, from the default settings, as typed.events does it.
  filter.Core()->loadState(initial.data(), kCoreStateSize);
  const std::vector<uint8_t> typed = ReadFile(kCases + "/typed.stp");
  ASSERT_NE(typed, initial);
  Click(page, 315, 23);
  Type("3.5");
  PressKey(VK_RETURN);
  EXPECT_TRUE(WaitFor([&] { return StateOf(filter) == typed; }, 2000));
  EXPECT_EQ(SettledDifferences(page, "typed.rgb"), 0);
}
