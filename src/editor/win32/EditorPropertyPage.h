#pragma once
// The filter's property page: a DirectShow page whose dialog window (template 1000, no controls) is used
// directly as the 750 x 167 editor. The pages are built once, on the first connection, and live as long as
// this object; the window may be created and destroyed as often as the host likes.
//
// Threads: the host calls it on the thread that runs the frame, which owns the window and runs the editor.
// No exception leaves a method.
#include <windows.h>
#include <ocidl.h>

#include <memory>
#include <string>

#include "filter/dshow/DShowUtil.h"
#include "filter/dshow/Interfaces.h"

namespace ulvetta {

class PageSet;
class Win32WindowHost;

class EditorPropertyPage : public dshow::SingleInterfaceObject<IPropertyPage> {
 public:
  static constexpr int kDialogId = 1000;
  static constexpr int kTitleId = 1000;
  static constexpr WORD kChangeCommand = 32700;  // the filter's WM_COMMAND to registered windows
  static constexpr DWORD kHelpContext = 100;

  // The class factory's creation function; the page cannot be aggregated.
  static IUnknown* CreateInstance(IUnknown* outer, HRESULT* hr);

  EditorPropertyPage();
  ~EditorPropertyPage() override;

  STDMETHODIMP SetPageSite(IPropertyPageSite* site) override;
  STDMETHODIMP Activate(HWND parent, LPCRECT rect, BOOL modal) override;
  STDMETHODIMP Deactivate() override;
  STDMETHODIMP GetPageInfo(PROPPAGEINFO* info) override;
  STDMETHODIMP SetObjects(ULONG count, IUnknown** objects) override;
  STDMETHODIMP Show(UINT command) override;
  STDMETHODIMP Move(LPCRECT rect) override;
  STDMETHODIMP IsPageDirty() override { return S_FALSE; }  // every change applies at once
  STDMETHODIMP Apply() override { return S_OK; }
  STDMETHODIMP Help(LPCOLESTR) override { return E_NOTIMPL; }  // the frame opens the file GetPageInfo names
  STDMETHODIMP TranslateAccelerator(MSG*) override { return S_FALSE; }

  HRESULT OnConnect(IUnknown* object);
  HRESULT OnDisconnect();

  // The page window; null while none exists.
  HWND window() const { return window_; }

 private:
  static INT_PTR CALLBACK dialogProc(HWND window, UINT message, WPARAM wParam, LPARAM lParam);
  INT_PTR handle(HWND window, UINT message, WPARAM wParam, LPARAM lParam);
  std::string helpFile() const;

  dshow::ComRef<IPropertyPageSite> site_;
  dshow::ComRef<IReverbControl> control_;
  // Keeps the filter, and so the core the pages listen to, alive for as long as the pages exist.
  dshow::ComRef<IUnknown> coreOwner_;
  std::unique_ptr<Win32WindowHost> host_;
  std::unique_ptr<PageSet> pages_;
  HWND window_ = nullptr;
  bool hooked_ = false;
  bool repaintOnTick_ = false;
};

}  // namespace ulvetta
