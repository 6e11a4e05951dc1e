// Drives the property page the way a user meets it: the filter's property frame opened on a thread of its own
// (as a host's window thread), its page window found, captured and sent mouse and key input, and the frame's
// dialogs and message boxes answered. The page and the filter are served in process by registered class
// objects, so that the test sees the editor's hook and the filter's core.
#pragma once

#include <windows.h>
#include <dshow.h>
#include <olectl.h>

#include <atomic>
#include <cstdint>
#include <functional>
#include <string>
#include <thread>
#include <vector>

#include "FilterRig.h"
#include "editor/EditorWindow.h"
#include "editor/win32/EditorPropertyPage.h"
#include "filter/dshow/Registration.h"

namespace ulvetta {
namespace test {

// Polls until found() is true or timeoutMs pass; true when found.
inline bool WaitFor(const std::function<bool()>& found, DWORD timeoutMs = 10000) {
  const DWORD deadline = GetTickCount() + timeoutMs;
  while (!found()) {
    if (GetTickCount() > deadline) return false;
    Sleep(10);
  }
  return true;
}

// A class factory over the module's own class table entry, for CoRegisterClassObject.
class LocalFactory : public IClassFactory {
 public:
  explicit LocalFactory(REFCLSID clsid) : entry_(dshow::FindClass(clsid)) {}
  STDMETHODIMP QueryInterface(REFIID riid, void** ppv) override {
    *ppv = riid == IID_IUnknown || riid == IID_IClassFactory ? this : nullptr;
    return *ppv ? S_OK : E_NOINTERFACE;
  }
  STDMETHODIMP_(ULONG) AddRef() override { return 2; }
  STDMETHODIMP_(ULONG) Release() override { return 1; }
  STDMETHODIMP CreateInstance(IUnknown* outer, REFIID riid, void** ppv) override {
    HRESULT hr = S_OK;
    IUnknown* object = entry_->create(outer, &hr);
    if (!object) return hr;
    object->AddRef();
    hr = object->QueryInterface(riid, ppv);
    object->Release();
    return hr;
  }
  STDMETHODIMP LockServer(BOOL) override { return S_OK; }

 private:
  const dshow::ClassEntry* entry_;
};

// The page window's pixels: 32-bit B, G, R, X rows, top to bottom.
struct Capture {
  int width = 0, height = 0;
  std::vector<uint32_t> pixels;
  uint32_t at(int x, int y) const { return pixels[static_cast<size_t>(y) * width + x] & 0xFFFFFF; }
};

// (0, 0, w, h) of window's client area, or of the whole window with its frame, after the window has painted
// everything pending.
inline Capture CaptureClient(HWND window, int w, int h, bool whole = false) {
  RedrawWindow(window, nullptr, nullptr, RDW_UPDATENOW | (whole ? RDW_FRAME | RDW_ALLCHILDREN : 0));
  Capture c;
  c.width = w;
  c.height = h;
  c.pixels.resize(static_cast<size_t>(w) * h);
  BITMAPINFO info{};
  info.bmiHeader = {sizeof(BITMAPINFOHEADER), w, -h, 1, 32, BI_RGB, 0, 0, 0, 0, 0};
  void* bits = nullptr;
  HDC screen = whole ? GetWindowDC(window) : GetDC(window);
  HDC memory = CreateCompatibleDC(screen);
  HBITMAP dib = CreateDIBSection(memory, &info, DIB_RGB_COLORS, &bits, nullptr, 0);
  HGDIOBJ old = SelectObject(memory, dib);
  BitBlt(memory, 0, 0, w, h, screen, 0, 0, SRCCOPY);
  GdiFlush();
  std::memcpy(c.pixels.data(), bits, c.pixels.size() * 4);
  SelectObject(memory, old);
  DeleteObject(dib);
  DeleteDC(memory);
  ReleaseDC(window, screen);
  return c;
}

// Writes a capture as a 32-bit BMP file.
inline bool SaveBmp(const Capture& c, const std::wstring& path) {
  BITMAPFILEHEADER file{};
  BITMAPINFOHEADER info{sizeof(BITMAPINFOHEADER), c.width, -c.height, 1, 32, BI_RGB, 0, 0, 0, 0, 0};
  const DWORD bytes = static_cast<DWORD>(c.pixels.size() * 4);
  file.bfType = 0x4D42;
  file.bfOffBits = sizeof file + sizeof info;
  file.bfSize = file.bfOffBits + bytes;
  HANDLE h = CreateFileW(path.c_str(), GENERIC_WRITE, 0, nullptr, CREATE_ALWAYS, 0, nullptr);
  if (h == INVALID_HANDLE_VALUE) return false;
  DWORD written = 0, total = 0;
  WriteFile(h, &file, sizeof file, &written, nullptr);
  total += written;
  WriteFile(h, &info, sizeof info, &written, nullptr);
  total += written;
  WriteFile(h, c.pixels.data(), bytes, &written, nullptr);
  total += written;
  CloseHandle(h);
  return total == file.bfSize;
}

// The child dialog of frame without controls that is large enough to hold the editor: the page window.
inline HWND FindPageWindow(HWND frame) {
  struct Search {
    HWND found = nullptr;
  } search;
  EnumChildWindows(
      frame,
      [](HWND w, LPARAM p) -> BOOL {
        wchar_t cls[16] = {};
        GetClassNameW(w, cls, 16);
        RECT r;
        GetClientRect(w, &r);
        if (std::wstring(cls) == L"#32770" && r.right >= kEditorWidth && r.bottom >= kEditorHeight &&
            IsWindowVisible(w) && !GetWindow(w, GW_CHILD)) {
          reinterpret_cast<Search*>(p)->found = w;
          return FALSE;
        }
        return TRUE;
      },
      reinterpret_cast<LPARAM>(&search));
  return search.found;
}

// A visible top-level window of a thread with the given title (any title when empty).
inline HWND FindThreadWindow(DWORD thread, const std::wstring& title, const wchar_t* cls = L"#32770") {
  struct Search {
    const std::wstring* title;
    const wchar_t* cls;
    HWND found;
  } search{&title, cls, nullptr};
  EnumThreadWindows(
      thread,
      [](HWND w, LPARAM p) -> BOOL {
        auto* s = reinterpret_cast<Search*>(p);
        wchar_t text[128] = {}, cls[64] = {};
        GetWindowTextW(w, text, 128);
        GetClassNameW(w, cls, 64);
        if (IsWindowVisible(w) && std::wstring(cls) == s->cls && (s->title->empty() || *s->title == text)) {
          s->found = w;
          return FALSE;
        }
        return TRUE;
      },
      reinterpret_cast<LPARAM>(&search));
  return search.found;
}

// The thread's visible top-level windows as "class 'title'" lines, for failure messages.
inline std::string DescribeWindows(DWORD thread) {
  std::string out;
  EnumThreadWindows(
      thread,
      [](HWND w, LPARAM p) -> BOOL {
        char text[128] = {}, cls[64] = {};
        GetWindowTextA(w, text, 128);
        GetClassNameA(w, cls, 64);
        if (IsWindowVisible(w))
          *reinterpret_cast<std::string*>(p) += std::string(cls) + " '" + text + "'" + (IsWindowEnabled(w) ? "" : " disabled") + "\n";
        return TRUE;
      },
      reinterpret_cast<LPARAM>(&out));
  return out;
}

// Waits for a window of the thread and returns it (null after the timeout).
inline HWND WaitForWindow(DWORD thread, const std::wstring& title, const wchar_t* cls = L"#32770") {
  HWND w = nullptr;
  WaitFor([&] { return (w = FindThreadWindow(thread, title, cls)) != nullptr; });
  return w;
}

// Real key presses and releases, through the system's input queue to the foreground window.
inline void PressKey(WORD vk) {
  INPUT in[2] = {};
  in[0].type = in[1].type = INPUT_KEYBOARD;
  in[0].ki.wVk = in[1].ki.wVk = vk;
  in[1].ki.dwFlags = KEYEVENTF_KEYUP;
  SendInput(2, in, sizeof(INPUT));
}

// Real typing of digits, "." and "-".
inline void Type(const std::string& text) {
  for (char c : text) PressKey(c == '.' ? VK_OEM_PERIOD : c == '-' ? VK_OEM_MINUS : static_cast<WORD>(c));
}

// True when window or one of its children shows text.
inline bool ShowsText(HWND window, const std::wstring& text) {
  wchar_t own[256] = {};
  GetWindowTextW(window, own, 256);
  if (text == own) return true;
  struct Search {
    const std::wstring* text;
    bool found;
  } search{&text, false};
  EnumChildWindows(
      window,
      [](HWND w, LPARAM p) -> BOOL {
        auto* s = reinterpret_cast<Search*>(p);
        wchar_t t[256] = {};
        GetWindowTextW(w, t, 256);
        s->found = s->found || *s->text == t;
        return !s->found;
      },
      reinterpret_cast<LPARAM>(&search));
  return search.found;
}

// Mouse messages straight to the page window, in its client coordinates; each is handled when the call returns.
inline void Mouse(HWND page, UINT message, int x, int y, WPARAM buttons) {
  SendMessageW(page, message, buttons, MAKELPARAM(x, y));
}
inline void Click(HWND page, int x, int y) {
  Mouse(page, WM_LBUTTONDOWN, x, y, MK_LBUTTON);
  Mouse(page, WM_LBUTTONUP, x, y, 0);
}

// The host's window thread: opens the filter's property frame when asked, one at a time, as a host application's
// user-interface thread does. The page and filter classes are served in process while it runs.
class HostThread {
 public:
  HostThread()
      : request_(CreateEventW(nullptr, FALSE, FALSE, nullptr)), done_(CreateEventW(nullptr, FALSE, FALSE, nullptr)) {
    thread_ = std::thread([this] { run(); });
  }
  ~HostThread() {
    filter_ = nullptr;
    SetEvent(request_);
    thread_.join();
    CloseHandle(request_);
    CloseHandle(done_);
  }
  HostThread(const HostThread&) = delete;

  DWORD id() const { return id_; }
  void open(IUnknown* filter) {
    filter_ = filter;
    SetEvent(request_);
  }
  // Waits until the frame's call returned: its result, or E_PENDING after the timeout.
  HRESULT waitClosed(DWORD timeoutMs = 10000) {
    return WaitForSingleObject(done_, timeoutMs) == WAIT_OBJECT_0 ? result_ : E_PENDING;
  }

 private:
  void run() {
    id_ = GetCurrentThreadId();
    OleInitialize(nullptr);
    LocalFactory filterFactory(CLSID_UlvettaFilter), pageFactory(CLSID_UlvettaPropertyPage);
    DWORD cookies[2] = {};
    CoRegisterClassObject(CLSID_UlvettaFilter, &filterFactory, CLSCTX_INPROC_SERVER, REGCLS_MULTIPLEUSE, &cookies[0]);
    CoRegisterClassObject(CLSID_UlvettaPropertyPage, &pageFactory, CLSCTX_INPROC_SERVER, REGCLS_MULTIPLEUSE,
                          &cookies[1]);
    while (WaitForSingleObject(request_, INFINITE) == WAIT_OBJECT_0 && filter_) {
      CAUUID pages{};
      Query<ISpecifyPropertyPages>(filter_)->GetPages(&pages);
      IUnknown* objects[] = {filter_};
      result_ = OleCreatePropertyFrame(nullptr, 20, 20, L"Ulvetta", 1, objects, pages.cElems, pages.pElems, 0, 0,
                                       nullptr);
      CoTaskMemFree(pages.pElems);
      SetEvent(done_);
    }
    CoRevokeClassObject(cookies[0]);
    CoRevokeClassObject(cookies[1]);
    OleUninitialize();
  }

  HANDLE request_, done_;
  std::thread thread_;
  std::atomic<DWORD> id_{0};
  std::atomic<IUnknown*> filter_{nullptr};
  HRESULT result_ = E_PENDING;
};

// The process's host thread (made by the test environment).
HostThread& Host();

// The filter's property frame, open on the host thread until this object is destroyed.
class FrameSession {
 public:
  explicit FrameSession(IUnknown* filter) : host_(Host()) {
    host_.open(filter);
    WaitFor([this] { return (frame_ = FindThreadWindow(host_.id(), L"")) != nullptr; });
    if (frame_) WaitFor([this] { return (page_ = FindPageWindow(frame_)) != nullptr; });
  }
  ~FrameSession() { close(); }
  FrameSession(const FrameSession&) = delete;

  // Closes the frame as its Cancel button does and waits until the call that opened it returned.
  void close() {
    if (closed_) return;
    closed_ = true;
    if (frame_ && IsWindow(frame_)) PostMessageW(frame_, WM_COMMAND, IDCANCEL, 0);
    result_ = host_.waitClosed();
  }

  HWND frame() const { return frame_; }
  HWND page() const { return page_; }
  DWORD thread() const { return host_.id(); }
  HRESULT result() const { return result_; }
  EditorWindow* editor() const { return reinterpret_cast<EditorWindow*>(GetWindowLongPtrW(page_, GWLP_USERDATA)); }

 private:
  HostThread& host_;
  HWND frame_ = nullptr;
  HWND page_ = nullptr;
  bool closed_ = false;
  HRESULT result_ = E_PENDING;
};

}  // namespace test
}  // namespace ulvetta
