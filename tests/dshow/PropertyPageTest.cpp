// The editor as the filter's property page under the platform's property frame, on a real display: the page
// shows what `ulvetta snapshot` draws, pixel for pixel; mouse, keys, the preset menu and dialogs act as on
// Linux; and the frame opens and closes while audio streams, leaving no window, hook or GDI object behind.
#include <gtest/gtest.h>

#include <winternl.h>

#include <filesystem>
#include <fstream>

#include "GraphHost.h"
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
std::unique_ptr<HostThread> g_host;
}  // namespace

namespace ulvetta {
namespace test {
HostThread& Host() { return *g_host; }
}  // namespace test
}  // namespace ulvetta

namespace {

const std::string kCases = ULVETTA_PAGE_CASES;

// The editor lock, made as the module makes it when loaded, and the host's window thread.
class PageEnvironment : public ::testing::Environment {
 public:
  void SetUp() override {
    ASSERT_TRUE(createEditorLock());
    g_host = std::make_unique<HostThread>();
  }
  void TearDown() override {
    g_host.reset();
    deleteEditorLock();
  }
};
const auto* const g_environment = ::testing::AddGlobalTestEnvironment(new PageEnvironment);

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
// A page that differs is kept beside the reference as "failed-" + the reference's name + ".bmp".
int SettledDifferences(HWND page, const std::string& rgbFile, RECT exclude = {0, 0, 0, 0}) {
  int d = -1;
  Capture c;
  WaitFor([&] { return (d = Differences(c = CapturePage(page), rgbFile, exclude)) == 0; }, 2000);
  if (d != 0) SaveBmp(c, WinePath(kCases + "/failed-" + rgbFile + ".bmp"));
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
  // The frame as a user sees it, for the documentation.
  RECT outer;
  GetWindowRect(frame.frame(), &outer);
  EXPECT_TRUE(SaveBmp(CaptureClient(frame.frame(), outer.right - outer.left, outer.bottom - outer.top, true),
                      WinePath(kCases + "/property-frame.bmp")));
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

namespace {

// Opens the preset menu with a right press and returns its window, or null. The release is the caller's,
// once the menu has closed (a posted release would reach the menu at the cursor's real position).
HWND OpenMenu(const FrameSession& frame) {
  // Keys reach the menu only while its owner's frame is the foreground window.
  SetForegroundWindow(frame.frame());
  WaitFor([&] { return GetForegroundWindow() == frame.frame(); }, 2000);
  PostMessageW(frame.page(), WM_RBUTTONDOWN, MK_RBUTTON, MAKELPARAM(400, 100));
  return WaitForWindow(frame.thread(), L"", L"#32768");
}

void ReleaseRight(const FrameSession& frame) {
  PostMessageW(frame.page(), WM_RBUTTONUP, 0, MAKELPARAM(400, 100));
}

HMENU MenuOf(HWND menuWindow) { return reinterpret_cast<HMENU>(SendMessageW(menuWindow, MN_GETHMENU, 0, 0)); }

std::wstring ItemText(HMENU menu, int position) {
  wchar_t text[128] = {};
  GetMenuStringW(menu, position, text, 128, MF_BYPOSITION);
  return text;
}

// Runs a menu command by its accelerator key and returns the dialog it opens.
HWND OpenDialog(const FrameSession& frame, WORD key, const std::wstring& title) {
  HWND menu = OpenMenu(frame);
  if (!menu) return nullptr;
  PressKey(key);
  HWND dialog = WaitForWindow(frame.thread(), title);
  if (!IsWindow(menu)) ReleaseRight(frame);
  return dialog;
}

// Sets the combo's text as typing it would, and tells the dialog so; handled when the call returns.
void TypeName(HWND dialog, const std::wstring& name) {
  SetDlgItemTextW(dialog, 168, name.c_str());
  SendMessageW(dialog, WM_COMMAND, MAKEWPARAM(168, CBN_EDITCHANGE), reinterpret_cast<LPARAM>(GetDlgItem(dialog, 168)));
}

void Press(HWND dialog, int id) {
  PostMessageW(dialog, WM_COMMAND, MAKEWPARAM(id, BN_CLICKED), reinterpret_cast<LPARAM>(GetDlgItem(dialog, id)));
}

bool Closed(HWND dialog) { return WaitFor([&] { return !IsWindow(dialog); }); }

// Answers a message box showing text with the button id; an empty result when done, else what went wrong.
std::string Answer(const FrameSession& frame, const std::wstring& caption, const std::wstring& text, int id) {
  HWND box = WaitForWindow(frame.thread(), caption);
  if (!box) return "no message box; windows:\n" + DescribeWindows(frame.thread());
  if (!ShowsText(box, text)) return "the message box shows another text";
  PostMessageW(box, WM_COMMAND, id, 0);
  return Closed(box) ? "" : "the message box stays";
}


int ListCount(HWND dialog) { return static_cast<int>(SendDlgItemMessageW(dialog, 168, CB_GETCOUNT, 0, 0)); }

}  // namespace

TEST_F(PageTest, ThePresetMenuAndDialogsSaveLoadBrowseAndDelete) {
  FrameSession frame(filter.inner);
  ASSERT_NE(frame.page(), nullptr);
  SetForegroundWindow(frame.frame());
  const fs::path presets = ModuleFolder() / "Presets";

  // No preset yet: Quick Load is greyed.
  HWND menu = OpenMenu(frame);
  ASSERT_NE(menu, nullptr);
  HMENU items = MenuOf(menu);
  ASSERT_EQ(GetMenuItemCount(items), 9);
  EXPECT_EQ(ItemText(items, 0), L"&Load Preset");
  EXPECT_EQ(ItemText(items, 2), L"&Quick Load");
  EXPECT_TRUE(GetMenuState(items, 2, MF_BYPOSITION) & MF_GRAYED);
  EXPECT_TRUE(GetMenuState(items, 4, MF_BYPOSITION) & MF_CHECKED);  // "Left To Right Gradient"
  PressKey(VK_ESCAPE);
  ASSERT_TRUE(Closed(menu));
  ReleaseRight(frame);

  // Save As into the missing folder creates it and writes the current settings.
  filter.Core()->setValue(kDecay, 61);
  const std::vector<uint8_t> saved = StateOf(filter);
  HWND save = OpenDialog(frame, 'S', L"Save Preset As");
  ASSERT_NE(save, nullptr);
  TypeName(save, L"mine");
  Press(save, IDOK);
  ASSERT_TRUE(Closed(save)) << DescribeWindows(frame.thread());
  EXPECT_EQ(ReadFile((presets / "mine.stp").string()), saved);

  // Saving again under that name asks first; No keeps the file as it was.
  filter.Core()->setValue(kDecay, 12);
  save = OpenDialog(frame, 'S', L"Save Preset As");
  ASSERT_NE(save, nullptr);
  TypeName(save, L"mine");
  Press(save, IDOK);
  EXPECT_EQ(Answer(frame, L"Warning", L"Preset already exists\nDo you want to overwrite your settings?", IDNO), "");
  ASSERT_TRUE(Closed(save)) << DescribeWindows(frame.thread());
  EXPECT_EQ(ReadFile((presets / "mine.stp").string()), saved);

  // The preset now appears under Quick Load, and choosing it loads it.
  menu = OpenMenu(frame);
  ASSERT_NE(menu, nullptr);
  HMENU quick = GetSubMenu(MenuOf(menu), 2);
  EXPECT_FALSE(GetMenuState(MenuOf(menu), 2, MF_BYPOSITION) & MF_GRAYED);
  ASSERT_EQ(GetMenuItemCount(quick), 1);
  EXPECT_EQ(ItemText(quick, 0), L"mine");
  PressKey('Q');
  PressKey(VK_DOWN);  // the only item, whether or not opening the submenu selected it
  PressKey(VK_RETURN);
  EXPECT_TRUE(Closed(menu)) << DescribeWindows(frame.thread());
  ReleaseRight(frame);
  EXPECT_TRUE(WaitFor([&] { return StateOf(filter) == saved; }, 2000));

  // Load: browsing applies each preset (by typing, in any letter case, or by picking it from the list);
  // Cancel restores the settings from before the dialog bit for bit.
  for (const char* name : {"first", "second", "third"})
    fs::copy_file(kCases + "/" + name + ".stp", presets / (std::string(name) + ".stp"));
  filter.Core()->setValue(kDamping, 7);
  const std::vector<uint8_t> before = StateOf(filter);
  HWND load = OpenDialog(frame, 'L', L"Load Preset");
  ASSERT_NE(load, nullptr);
  EXPECT_EQ(ListCount(load), 4);
  TypeName(load, L"first");
  EXPECT_EQ(StateOf(filter), ReadFile(kCases + "/first.stp"));
  TypeName(load, L"SECOND");
  EXPECT_EQ(StateOf(filter), ReadFile(kCases + "/second.stp"));
  const LRESULT third = SendDlgItemMessageW(load, 168, CB_FINDSTRINGEXACT, static_cast<WPARAM>(-1),
                                            reinterpret_cast<LPARAM>(L"third"));
  SendDlgItemMessageW(load, 168, CB_SETCURSEL, static_cast<WPARAM>(third), 0);
  PostMessageW(load, WM_COMMAND, MAKEWPARAM(168, CBN_SELCHANGE), reinterpret_cast<LPARAM>(GetDlgItem(load, 168)));
  EXPECT_TRUE(WaitFor([&] { return StateOf(filter) == ReadFile(kCases + "/third.stp"); }, 2000));
  Press(load, IDCANCEL);
  ASSERT_TRUE(Closed(load)) << DescribeWindows(frame.thread());
  EXPECT_EQ(StateOf(filter), before);

  // A name that is not listed is refused and the dialog stays; Delete removes a preset from the list and the
  // folder at once.
  load = OpenDialog(frame, 'L', L"Load Preset");
  ASSERT_NE(load, nullptr);
  TypeName(load, L"fourth");
  Press(load, IDOK);
  EXPECT_EQ(Answer(frame, L"Error", L"Preset do not exist", IDOK), "");
  EXPECT_TRUE(IsWindow(load));
  TypeName(load, L"first");
  Press(load, 169);
  EXPECT_TRUE(WaitFor([&] { return ListCount(load) == 3; }, 2000));
  EXPECT_FALSE(fs::exists(presets / "first.stp"));
  Press(load, IDCANCEL);
  ASSERT_TRUE(Closed(load)) << DescribeWindows(frame.thread());

  save = OpenDialog(frame, 'S', L"Save Preset As");
  ASSERT_NE(save, nullptr);
  TypeName(save, L"second");
  Press(save, 169);
  EXPECT_TRUE(WaitFor([&] { return ListCount(save) == 2; }, 2000));
  EXPECT_FALSE(fs::exists(presets / "second.stp"));
  Press(save, IDCANCEL);
  ASSERT_TRUE(Closed(save)) << DescribeWindows(frame.thread());
}

namespace {

// A plain top-level window to hold pages without a frame.
HWND MakeHostWindow() {
  WNDCLASSW wc{};
  wc.lpfnWndProc = DefWindowProcW;
  wc.hInstance = GetModuleHandleW(nullptr);
  wc.lpszClassName = L"UlvettaPageHost";
  RegisterClassW(&wc);
  return CreateWindowW(L"UlvettaPageHost", L"Pages", WS_OVERLAPPEDWINDOW | WS_VISIBLE, 0, 0, 800, 500, nullptr,
                       nullptr, wc.hInstance, nullptr);
}

// A page activated in parent and painted once (which attaches it to the keyboard hook).
ComRef<IPropertyPage> ShowPage(IUnknown* filter, HWND parent, int top) {
  HRESULT hr = E_FAIL;
  ComRef<IPropertyPage> page(static_cast<IPropertyPage*>(EditorPropertyPage::CreateInstance(nullptr, &hr)));
  page->SetObjects(1, &filter);
  const RECT r{0, top, kEditorWidth, top + kEditorHeight};
  page->Activate(parent, &r, FALSE);
  page->Show(SW_SHOW);
  UpdateWindow(static_cast<EditorPropertyPage*>(page.get())->window());
  return page;
}

EditorWindow* EditorOf(const ComRef<IPropertyPage>& page) {
  return reinterpret_cast<EditorWindow*>(
      GetWindowLongPtrW(static_cast<EditorPropertyPage*>(page.get())->window(), GWLP_USERDATA));
}

// Live GDI objects of the process, counted in the handle table the system shares with it.
int GdiObjects() {
  using Query = NTSTATUS(WINAPI*)(HANDLE, PROCESSINFOCLASS, PVOID, ULONG, PULONG);
  const auto query = reinterpret_cast<Query>(
      reinterpret_cast<void*>(GetProcAddress(GetModuleHandleW(L"ntdll.dll"), "NtQueryInformationProcess")));
  PROCESS_BASIC_INFORMATION info{};
  if (!query || query(GetCurrentProcess(), ProcessBasicInformation, &info, sizeof info, nullptr) != 0) return -1;
  const auto* peb = reinterpret_cast<const uint8_t*>(info.PebBaseAddress);
  const auto* table = *reinterpret_cast<const uint8_t* const*>(peb + 0xF8);  // GdiSharedHandleTable
  if (!table) return -1;
  constexpr int kEntries = 0x10000, kEntrySize = 24, kTypeOffset = 14;
  int live = 0;
  for (int i = 0; i < kEntries; ++i) live += table[i * kEntrySize + kTypeOffset] != 0;
  return live;
}

// Windows of this process, top-level and children.
int ProcessWindows() {
  int count = 0;
  EnumWindows(
      [](HWND w, LPARAM p) -> BOOL {
        DWORD pid = 0;
        GetWindowThreadProcessId(w, &pid);
        if (pid != GetCurrentProcessId()) return TRUE;
        auto* n = reinterpret_cast<int*>(p);
        ++*n;
        EnumChildWindows(w, [](HWND, LPARAM q) -> BOOL { return ++*reinterpret_cast<int*>(q), TRUE; }, p);
        return TRUE;
      },
      reinterpret_cast<LPARAM>(&count));
  return count;
}

}  // namespace

TEST_F(PageTest, TwoEditorsShareOneHookThatTakesOnlyFreshKeyPresses) {
  const HWND host = MakeHostWindow();
  ASSERT_NE(host, nullptr);
  SetForegroundWindow(host);
  ASSERT_TRUE(WaitFor([&] { return GetForegroundWindow() == host; }, 2000));
  ComRef<IPropertyPage> first = ShowPage(filter.inner, host, 0), second = ShowPage(filter.inner, host, 200);
  EXPECT_TRUE(keyboardHookInstalled());
  EXPECT_EQ(attachedEditorWindows(), 2);

  // A repeated press and a release are passed on; a fresh press goes to the first editor that uses it.
  EXPECT_EQ(editorKeyboardHook(HC_ACTION, VK_TAB, 3), 0);
  EXPECT_EQ(editorKeyboardHook(HC_ACTION, VK_TAB, 1 | (LPARAM{1} << 30) | (LPARAM{1} << 31)), 0);
  EXPECT_EQ(EditorOf(first)->currentPage(), kReverbPage);
  EXPECT_EQ(editorKeyboardHook(HC_ACTION, VK_TAB, 1), 1);
  EXPECT_EQ(EditorOf(first)->currentPage(), kFilterPage);
  EXPECT_EQ(EditorOf(second)->currentPage(), kReverbPage);

  // A left press while the right button is held is ignored: no capture, no change.
  const int32_t preDelay = filter.Core()->getValue(kPreDelay);
  SendMessageW(static_cast<EditorPropertyPage*>(second.get())->window(), WM_LBUTTONDOWN, MK_LBUTTON | MK_RBUTTON,
               MAKELPARAM(284, 120));
  EXPECT_EQ(GetCapture(), nullptr);
  EXPECT_EQ(filter.Core()->getValue(kPreDelay), preDelay);

  // Closing one leaves the hook for the other; closing the last removes it.
  first->Deactivate();
  EXPECT_TRUE(keyboardHookInstalled());
  EXPECT_EQ(attachedEditorWindows(), 1);
  second->Deactivate();
  EXPECT_FALSE(keyboardHookInstalled());
  EXPECT_EQ(attachedEditorWindows(), 0);

  // Pages made, shown, painted, asked for their size and closed leave no GDI object behind (counted in the
  // handle table the system shares with the process; first checked to see what is made).
  const int gdiBefore = GdiObjects();
  HBRUSH brushes[5];
  for (HBRUSH& b : brushes) b = CreateSolidBrush(RGB(1, 2, 3));
  ASSERT_EQ(GdiObjects(), gdiBefore + 5);
  for (HBRUSH b : brushes) DeleteObject(b);
  for (int i = 0; i < 20; ++i) {
    ComRef<IPropertyPage> page = ShowPage(filter.inner, host, 0);
    PROPPAGEINFO info{};
    ASSERT_EQ(page->GetPageInfo(&info), S_OK);
    EXPECT_GE(info.size.cx, kEditorWidth);
    EXPECT_GE(info.size.cy, kEditorHeight);
    CoTaskMemFree(info.pszTitle);
    CoTaskMemFree(info.pszHelpFile);
    page->Deactivate();
  }
  EXPECT_EQ(GdiObjects(), gdiBefore);
  DestroyWindow(host);
}

TEST_F(PageTest, OpeningAndClosingFiftyTimesWhileStreamingLeavesNothingBehindAndChangesNoSample) {
  const std::wstring wav = WinePath(kCases + "/stream.wav");
  GraphOptions plain;
  GraphResult reference;
  {
    FilterHolder other;
    ComRef<IBaseFilter> f = other.As<IBaseFilter>();
    plain.filter = f.get();
    reference = RunGraph(wav, plain);
  }
  ASSERT_EQ(reference.hr, S_OK) << reference.step;

  int windows = -1, cycles = 0, moving = 0;
  DWORD cyclesEnd = 0;
  GraphOptions streamed;
  ComRef<IBaseFilter> f = filter.As<IBaseFilter>();
  streamed.filter = f.get();
  streamed.realTime = true;
  streamed.whileRunning = [&] {
    // One cycle first, so that what the system makes once for the host thread exists before counting.
    { FrameSession warm(filter.inner); }
    windows = ProcessWindows();
    for (; cycles < 50; ++cycles) {

      FrameSession frame(filter.inner);
      if (!frame.page()) break;
      // The needle follows the level while the page is open: the meter face changes within 150 ms.
      const Capture before = CaptureClient(frame.page(), 205, 140);
      Sleep(150);
      moving += CaptureClient(frame.page(), 205, 140).pixels != before.pixels;
    }
    cyclesEnd = GetTickCount();
  };
  const DWORD start = GetTickCount();
  const GraphResult r = RunGraph(wav, streamed);
  ASSERT_EQ(r.hr, S_OK) << r.step;
  EXPECT_TRUE(r.completed);
  EXPECT_EQ(cycles, 50);
  // Every frame opened and closed while audio was flowing (the file plays for 20 s).
  EXPECT_LT(cyclesEnd - start, 19000u);
  EXPECT_GE(moving, 40) << "the meter's needle did not move while streaming";
  EXPECT_EQ(ProcessWindows(), windows);
  EXPECT_FALSE(keyboardHookInstalled());
  EXPECT_EQ(attachedEditorWindows(), 0);
  EXPECT_EQ(r.samples, reference.samples);
}
