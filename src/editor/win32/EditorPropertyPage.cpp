#include "editor/win32/EditorPropertyPage.h"

#include <algorithm>

#include "editor/PageSet.h"
#include "editor/win32/EditorLock.h"
#include "editor/win32/KeyboardHook.h"
#include "editor/win32/Win32WindowHost.h"
#include "presets/win32/CodeModule.h"
#include "presets/win32/WideText.h"

namespace ulvetta {

namespace {

// A copy of text in task memory, as the frame frees it.
LPOLESTR taskString(const std::wstring& text) {
  auto* out = static_cast<LPOLESTR>(CoTaskMemAlloc((text.size() + 1) * sizeof(wchar_t)));
  if (out) std::copy(text.c_str(), text.c_str() + text.size() + 1, out);
  return out;
}

// The size of dialog template 1000 in the pixels of its own font, found by making it once, hidden.
SIZE templateSize() {
  SIZE size{0, 0};
  HWND probe = CreateDialogParamW(codeModule(), MAKEINTRESOURCEW(EditorPropertyPage::kDialogId), GetDesktopWindow(),
                                  [](HWND, UINT, WPARAM, LPARAM) -> INT_PTR { return FALSE; }, 0);
  if (probe) {
    RECT r;
    GetClientRect(probe, &r);
    size = {r.right - r.left, r.bottom - r.top};
    DestroyWindow(probe);
  }
  return size;
}

}  // namespace

IUnknown* EditorPropertyPage::CreateInstance(IUnknown* outer, HRESULT* hr) {
  if (outer) {
    *hr = CLASS_E_NOAGGREGATION;
    return nullptr;
  }
  auto* page = new (std::nothrow) EditorPropertyPage;
  *hr = page ? S_OK : E_OUTOFMEMORY;
  return page;
}

EditorPropertyPage::EditorPropertyPage() = default;

EditorPropertyPage::~EditorPropertyPage() {
  if (window_) DestroyWindow(window_);
  pages_.reset();
}

STDMETHODIMP EditorPropertyPage::SetPageSite(IPropertyPageSite* site) {
  if (site && site_) return E_UNEXPECTED;
  site_.reset(site);
  return S_OK;
}

HRESULT EditorPropertyPage::OnConnect(IUnknown* object) {
  if (!object) return E_POINTER;
  if (control_) OnDisconnect();
  dshow::ComRef<IReverbControl> control;
  if (FAILED(object->QueryInterface(__uuidof(IReverbControl), reinterpret_cast<void**>(control.put()))) || !control)
    return E_NOINTERFACE;
  if (!pages_) {
    ReverbCore* core = control->GetCore();
    if (!core) return E_UNEXPECTED;
    return dshow::ComBoundary([&] {
      auto host = std::make_unique<Win32WindowHost>();
      auto pages = std::make_unique<PageSet>(*core, host.get());
      if (pages->failed()) return E_UNEXPECTED;
      host->setEditor(&pages->window());
      host_ = std::move(host);
      pages_ = std::move(pages);
      coreOwner_.reset(object);
      control_ = control;
      if (window_) control_->RegisterWindow(window_, kChangeCommand);
      return S_OK;
    });
  }
  control_ = control;
  if (window_) control_->RegisterWindow(window_, kChangeCommand);
  return S_OK;
}

HRESULT EditorPropertyPage::OnDisconnect() {
  if (!control_) return E_UNEXPECTED;
  if (window_) control_->RegisterWindow(window_, 0);
  control_.reset();
  return S_OK;
}

STDMETHODIMP EditorPropertyPage::SetObjects(ULONG count, IUnknown** objects) {
  return dshow::ComBoundary([&]() -> HRESULT {
    if (count == 0) {
      OnDisconnect();
      return S_OK;
    }
    if (!objects) return E_POINTER;
    return OnConnect(objects[0]);
  });
}

STDMETHODIMP EditorPropertyPage::Activate(HWND parent, LPCRECT rect, BOOL) {
  if (!rect) return E_POINTER;
  if (window_) return E_UNEXPECTED;
  if (!pages_) return E_UNEXPECTED;
  HWND w = CreateDialogParamW(codeModule(), MAKEINTRESOURCEW(kDialogId), parent, &EditorPropertyPage::dialogProc,
                              reinterpret_cast<LPARAM>(this));
  if (!w) return E_OUTOFMEMORY;
  MoveWindow(w, rect->left, rect->top, rect->right - rect->left, rect->bottom - rect->top, TRUE);
  return S_OK;
}

STDMETHODIMP EditorPropertyPage::Deactivate() {
  if (!window_) return E_UNEXPECTED;
  DestroyWindow(window_);
  return S_OK;
}

STDMETHODIMP EditorPropertyPage::GetPageInfo(PROPPAGEINFO* info) {
  if (!info) return E_POINTER;
  return dshow::ComBoundary([&] {
    wchar_t title[64] = {};
    LoadStringW(codeModule(), kTitleId, title, 64);
    const SIZE dialog = templateSize();
    *info = PROPPAGEINFO{};
    info->cb = sizeof(PROPPAGEINFO);
    info->pszTitle = taskString(title);
    info->pszHelpFile = taskString(widen(helpFile()));
    info->dwHelpContext = kHelpContext;
    // The whole editor shows even where the frame's font makes the template come out smaller.
    info->size = {std::max<LONG>(dialog.cx, kEditorWidth), std::max<LONG>(dialog.cy, kEditorHeight)};
    if (!info->pszTitle || !info->pszHelpFile) {
      CoTaskMemFree(info->pszTitle);
      CoTaskMemFree(info->pszHelpFile);
      *info = PROPPAGEINFO{};
      return E_OUTOFMEMORY;
    }
    return S_OK;
  });
}

STDMETHODIMP EditorPropertyPage::Show(UINT command) {
  if (!window_) return E_UNEXPECTED;
  ShowWindow(window_, static_cast<int>(command));
  if (command == SW_SHOW || command == SW_SHOWNORMAL) {
    InvalidateRect(window_, nullptr, FALSE);
    repaintOnTick_ = true;
  }
  return S_OK;
}

STDMETHODIMP EditorPropertyPage::Move(LPCRECT rect) {
  if (!rect) return E_POINTER;
  if (!window_) return E_UNEXPECTED;
  MoveWindow(window_, rect->left, rect->top, rect->right - rect->left, rect->bottom - rect->top, TRUE);
  return S_OK;
}

std::string EditorPropertyPage::helpFile() const {
  return (host_ ? host_->moduleFolder() : Win32WindowHost().moduleFolder()) + "ql.HLP";
}

INT_PTR CALLBACK EditorPropertyPage::dialogProc(HWND window, UINT message, WPARAM wParam, LPARAM lParam) {
  if (message == WM_INITDIALOG) SetWindowLongPtrW(window, DWLP_USER, lParam);
  auto* page = reinterpret_cast<EditorPropertyPage*>(GetWindowLongPtrW(window, DWLP_USER));
  if (!page) return FALSE;
  try {
    return page->handle(window, message, wParam, lParam);
  } catch (...) {
    return FALSE;  // nothing escapes into the host's message loop
  }
}

INT_PTR EditorPropertyPage::handle(HWND window, UINT message, WPARAM wParam, LPARAM lParam) {
  switch (message) {
    case WM_INITDIALOG:
      window_ = window;
      host_->setWindow(window);
      if (control_) control_->RegisterWindow(window, kChangeCommand);
      SetWindowLongPtrW(window, GWLP_USERDATA, reinterpret_cast<LONG_PTR>(&pages_->window()));
      host_->handleMessage(WM_CREATE, 0, 0);
      return TRUE;
    case WM_DESTROY: {
      if (control_) control_->RegisterWindow(window, 0);
      const std::wstring help = widen(helpFile());
      WinHelpW(window, help.c_str(), HELP_QUIT, 0);
      if (hooked_) detachKeyboardHook(window);
      hooked_ = false;
      host_->handleMessage(WM_DESTROY, wParam, lParam);
      host_->setWindow(nullptr);
      SetWindowLongPtrW(window, GWLP_USERDATA, 0);
      SetWindowLongPtrW(window, DWLP_USER, 0);
      window_ = nullptr;
      return 0;
    }
    case WM_PAINT:
      if (!hooked_) {
        attachKeyboardHook(window);
        hooked_ = true;
      }
      host_->handleMessage(message, wParam, lParam);
      return TRUE;  // painted or nothing to paint: the dialog manager must not erase over it
    case WM_TIMER:
      // A frame whose own controls overlap the page without clipping may paint over it as it first shows;
      // the first tick after showing repaints the whole page once.
      if (repaintOnTick_) {
        repaintOnTick_ = false;
        RedrawWindow(window, nullptr, nullptr, RDW_INVALIDATE);
      }
      return host_->handleMessage(message, wParam, lParam);
    case WM_LBUTTONDOWN:
    case WM_RBUTTONDOWN:
    case WM_KILLFOCUS: {
      EditorLockHold hold;
      return host_->handleMessage(message, wParam, lParam);
    }
    default:
      return host_->handleMessage(message, wParam, lParam);
  }
}

}  // namespace ulvetta
