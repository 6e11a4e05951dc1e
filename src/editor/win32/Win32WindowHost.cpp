#include "editor/win32/Win32WindowHost.h"

#include <commdlg.h>
#include <shellapi.h>

#include <algorithm>
#include <vector>

#include "editor/EditorWindow.h"
#include "platform/ModulePath.h"
#include "presets/win32/PresetDialogs.h"
#include "presets/win32/WideText.h"

namespace ulvetta {

namespace {

constexpr int kMaxPaletteColours = 236;

// Fills menu with items; a submenu is made and attached as it is met.
void appendItems(HMENU menu, const std::vector<MenuItem>& items) {
  for (const MenuItem& item : items) {
    if (item.text.empty()) {
      AppendMenuW(menu, MF_SEPARATOR, 0, nullptr);
      continue;
    }
    UINT flags = MF_STRING | (item.checked ? MF_CHECKED : 0u) | (item.greyed ? MF_GRAYED : 0u);
    UINT_PTR id = static_cast<UINT_PTR>(item.id);
    if (!item.submenu.empty() || item.id == 0) {
      HMENU sub = CreatePopupMenu();
      appendItems(sub, item.submenu);
      flags |= MF_POPUP;
      id = reinterpret_cast<UINT_PTR>(sub);
    }
    AppendMenuW(menu, flags, id, widen(item.text).c_str());
  }
}

COLORREF colorRef(SkinColour c) { return RGB(c.r, c.g, c.b); }

}  // namespace

Win32WindowHost::Win32WindowHost() = default;

Win32WindowHost::~Win32WindowHost() {
  if (palette_) DeleteObject(palette_);
}

HPALETTE Win32WindowHost::paletteFor(HDC dc, int bits) {
  if (bits != 8 && bits != 15 && bits != 16) return nullptr;
  if (palette_ && paletteBits_ == bits) return palette_;
  if (palette_) DeleteObject(palette_);
  palette_ = nullptr;
  paletteBits_ = bits;
  if (bits != 8) {
    palette_ = CreateHalftonePalette(dc);
  } else if ((GetDeviceCaps(dc, RASTERCAPS) & RC_PALETTE) && editor_) {
    const HCURSOR previous = SetCursor(LoadCursorW(nullptr, reinterpret_cast<LPCWSTR>(IDC_WAIT)));
    const std::vector<SkinColour>& colours = editor_->surface()->displayPalette();
    const size_t n = std::min<size_t>(colours.size(), kMaxPaletteColours);
    std::vector<BYTE> storage(sizeof(LOGPALETTE) + n * sizeof(PALETTEENTRY));
    auto* log = reinterpret_cast<LOGPALETTE*>(storage.data());
    log->palVersion = 0x300;
    log->palNumEntries = static_cast<WORD>(n);
    for (size_t i = 0; i < n; ++i) log->palPalEntry[i] = {colours[i].r, colours[i].g, colours[i].b, 0};
    palette_ = CreatePalette(log);
    SetCursor(previous);
  }
  return palette_;
}

void Win32WindowHost::present(const DibSurface& surface, int x, int y, int w, int h) {
  if (!window_ || surface.empty()) return;
  // Only what lies inside the back buffer.
  const int left = std::max(x, 0), top = std::max(y, 0);
  const int right = std::min(x + w, surface.width()), bottom = std::min(y + h, surface.height());
  if (right <= left || bottom <= top) return;
  HDC dc = GetDC(window_);
  if (!dc) return;
  const int bits = GetDeviceCaps(dc, BITSPIXEL) * GetDeviceCaps(dc, PLANES);
  HPALETTE previous = nullptr;
  if (HPALETTE palette = paletteFor(dc, bits)) {
    previous = SelectPalette(dc, palette, FALSE);
    RealizePalette(dc);
  }
  // The rows top..bottom as a top-down bitmap of their own, so that no bottom-up origin rule applies.
  BITMAPINFO info{};
  const DibHeader& header = surface.header();
  info.bmiHeader.biSize = sizeof(BITMAPINFOHEADER);
  info.bmiHeader.biWidth = header.width;
  info.bmiHeader.biHeight = -(bottom - top);
  info.bmiHeader.biPlanes = 1;
  info.bmiHeader.biBitCount = 32;
  info.bmiHeader.biCompression = BI_RGB;
  SetDIBitsToDevice(dc, left, top, static_cast<DWORD>(right - left), static_cast<DWORD>(bottom - top), left, 0, 0,
                    static_cast<UINT>(bottom - top), surface.at(0, top), &info, DIB_RGB_COLORS);
  if (previous) SelectPalette(dc, previous, TRUE);
  ReleaseDC(window_, dc);
}

bool Win32WindowHost::realisePalette() {
  if (!window_) return false;
  HDC dc = GetDC(window_);
  if (!dc) return false;
  bool realised = false;
  if (HPALETTE palette = paletteFor(dc, GetDeviceCaps(dc, BITSPIXEL) * GetDeviceCaps(dc, PLANES))) {
    const HPALETTE previous = SelectPalette(dc, palette, FALSE);
    realised = RealizePalette(dc) > 0;
    SelectPalette(dc, previous, TRUE);
  }
  ReleaseDC(window_, dc);
  if (realised) RedrawWindow(window_, nullptr, nullptr, RDW_INVALIDATE | RDW_INTERNALPAINT | RDW_ERASE);
  return realised;
}

void Win32WindowHost::mouse(int event, WPARAM wParam, LPARAM lParam) {
  const int x = static_cast<short>(LOWORD(lParam)), y = static_cast<short>(HIWORD(lParam));
  const int modifiers = ((wParam & MK_CONTROL) ? kModifierCtrl : 0) | ((wParam & MK_SHIFT) ? kModifierShift : 0);
  editor_->mouse(x, y, event, modifiers);
}

LRESULT Win32WindowHost::handleMessage(UINT message, WPARAM wParam, LPARAM lParam) {
  if (!editor_ || !window_) return 0;
  switch (message) {
    case WM_CREATE:
      SetTimer(window_, kTimerId, kTickMilliseconds, nullptr);
      editor_->setActive(true);
      return 0;
    case WM_DESTROY:
      KillTimer(window_, kTimerId);
      editor_->setActive(false);
      return 0;
    case WM_SETFOCUS:
    case WM_KILLFOCUS:
      if (reinterpret_cast<HWND>(wParam) != window_) editor_->focusLost(message == WM_KILLFOCUS);
      return 0;
    case WM_PAINT: {
      RECT r;
      if (!GetUpdateRect(window_, &r, FALSE)) return 1;
      ValidateRect(window_, nullptr);
      editor_->paint(r.left, r.top, r.right - r.left, r.bottom - r.top);
      return 0;
    }
    case WM_KEYDOWN:
      editor_->keyDown(static_cast<int>(wParam));
      return 0;
    case WM_TIMER:
      editor_->tick();
      return 0;
    case WM_MOUSEMOVE:
      mouse((wParam & MK_LBUTTON) ? kLeftDrag : (wParam & MK_RBUTTON) ? kRightDrag : kMove, wParam, lParam);
      return 0;
    case WM_LBUTTONDOWN:
      if (!(wParam & MK_RBUTTON)) mouse(kLeftPress, wParam, lParam);
      return 0;
    case WM_LBUTTONUP:
      mouse(kLeftRelease, wParam, lParam);
      return 0;
    case WM_LBUTTONDBLCLK:
      mouse(kLeftDoubleClick, wParam, lParam);
      return 0;
    case WM_RBUTTONDOWN:
      if (!(wParam & MK_LBUTTON)) mouse(kRightPress, wParam, lParam);
      return 0;
    case WM_RBUTTONUP:
      mouse(kRightRelease, wParam, lParam);
      return 0;
    case WM_RBUTTONDBLCLK:
      mouse(kRightDoubleClick, wParam, lParam);
      return 0;
    case WM_QUERYNEWPALETTE:
      return realisePalette() ? 1 : 0;
    case WM_PALETTECHANGED:
      if (reinterpret_cast<HWND>(wParam) != window_) realisePalette();
      return 0;
    default:
      return 0;
  }
}

void Win32WindowHost::invalidate() {
  if (window_) RedrawWindow(window_, nullptr, nullptr, RDW_INVALIDATE);
}

void Win32WindowHost::setCapture() {
  if (window_) SetCapture(window_);
}

void Win32WindowHost::releaseCapture() { ReleaseCapture(); }

int Win32WindowHost::caretBlinkTime() {
  const UINT t = GetCaretBlinkTime();
  return t == 0 || t == INFINITE ? 500 : static_cast<int>(t);
}

void Win32WindowHost::messageBox(const std::string& text) {
  MessageBoxW(nullptr, widen(text).c_str(), L"", MB_OK);
}

void Win32WindowHost::openDocument(const std::string& target) {
  ShellExecuteW(window_, L"open", widen(target).c_str(), nullptr, nullptr, 0);
}

bool Win32WindowHost::chooseColour(SkinColour initial, SkinColour* chosen) {
  COLORREF custom[16];
  std::fill(std::begin(custom), std::end(custom), RGB(255, 255, 255));
  CHOOSECOLORW cc{};
  cc.lStructSize = sizeof cc;
  cc.hwndOwner = window_;
  cc.rgbResult = colorRef(initial);
  cc.lpCustColors = custom;
  cc.Flags = CC_RGBINIT | CC_FULLOPEN | CC_SOLIDCOLOR;
  if (!ChooseColorW(&cc)) return false;
  *chosen = {GetRValue(cc.rgbResult), GetGValue(cc.rgbResult), GetBValue(cc.rgbResult), 255};
  return true;
}

bool Win32WindowHost::chooseBitmapFile(const std::string& initial, std::string* chosen) {
  wchar_t file[MAX_PATH] = {};
  const std::wstring start = widen(initial);
  start.copy(file, MAX_PATH - 1);
  OPENFILENAMEW ofn{};
  ofn.lStructSize = sizeof ofn;
  ofn.hwndOwner = window_;
  ofn.lpstrFilter = L"Bitmaps\0*.bmp\0";
  ofn.nFilterIndex = 1;
  ofn.lpstrFile = file;
  ofn.nMaxFile = MAX_PATH;
  ofn.lpstrTitle = L"Select Bitmap";
  ofn.Flags = OFN_EXPLORER | OFN_NONETWORKBUTTON | OFN_FILEMUSTEXIST | OFN_HIDEREADONLY;
  if (!GetOpenFileNameW(&ofn)) return false;
  *chosen = narrow(file);
  return true;
}

int Win32WindowHost::trackMenu(const std::vector<MenuItem>& items, int x, int y) {
  if (!window_) return 0;
  HMENU menu = CreatePopupMenu();
  if (!menu) return 0;
  appendItems(menu, items);
  POINT at{x, y};
  ClientToScreen(window_, &at);
  const int id = static_cast<int>(
      TrackPopupMenu(menu, TPM_CENTERALIGN | TPM_RETURNCMD | TPM_RIGHTBUTTON, at.x, at.y, 0, window_, nullptr));
  DestroyMenu(menu);  // and its submenus
  return id;
}

void Win32WindowHost::runPresetDialog(bool save, ReverbCore& core, const std::string& folder) {
  std::string name;
  if (save)
    runSavePresetDialog(window_, folder, {}, core, &name);
  else
    runLoadPresetDialog(window_, folder, {}, core, &name);
}

std::string Win32WindowHost::profilePath() {
  const std::string path = modulePath();
  const size_t dot = path.find_last_of('.');
  const size_t slash = path.find_last_of("\\:/");
  if (path.empty()) return {};
  return (dot == std::string::npos || (slash != std::string::npos && dot < slash) ? path : path.substr(0, dot)) +
         ".ini";
}

std::string Win32WindowHost::moduleFolder() {
  const std::string path = modulePath();
  const size_t cut = path.find_last_of("\\:");
  return cut == std::string::npos ? std::string() : path.substr(0, cut + 1);
}

std::string Win32WindowHost::presetFolder() { return moduleFolder() + "Presets\\"; }

}  // namespace ulvetta
