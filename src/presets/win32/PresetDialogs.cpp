#include "presets/win32/PresetDialogs.h"

#include <vector>

#include "filter/ReverbCore.h"
#include "presets/PresetFile.h"
#include "presets/win32/CodeModule.h"
#include "presets/win32/WideText.h"

namespace ulvetta {

namespace {

std::string g_lastName;

// The system's question before a preset file is replaced.
class AskToOverwrite : public OverwriteQuestion {
 public:
  bool confirmOverwrite(const std::string&, const std::string&) override {
    return MessageBoxW(nullptr, L"Preset already exists\nDo you want to overwrite your settings?", L"Warning",
                       MB_YESNO | MB_TASKMODAL | MB_SETFOREGROUND) == IDYES;
  }
};

struct DialogState {
  bool save;
  PresetFolder folder;
  std::string note;  // kept for the caller, unused by the dialogs
  ReverbCore* core;
  std::string name;
  StateBytes snapshot{};  // the Load dialog's settings from before it opened
};

std::string comboText(HWND dialog) {
  wchar_t text[kMaxPresetNameLength + 1] = {};
  GetDlgItemTextW(dialog, kPresetCombo, text, kMaxPresetNameLength + 1);
  return narrow(text);
}

std::vector<std::string> comboEntries(HWND dialog) {
  const HWND combo = GetDlgItem(dialog, kPresetCombo);
  std::vector<std::string> entries;
  const LRESULT count = SendMessageW(combo, CB_GETCOUNT, 0, 0);
  for (LRESULT i = 0; i < count; ++i) {
    const LRESULT length = SendMessageW(combo, CB_GETLBTEXTLEN, i, 0);
    if (length < 0) continue;
    std::wstring text(static_cast<size_t>(length) + 1, L'\0');
    SendMessageW(combo, CB_GETLBTEXT, i, reinterpret_cast<LPARAM>(&text[0]));
    entries.push_back(narrow(text.c_str()));
  }
  return entries;
}

void fillList(HWND dialog, const PresetFolder& folder) {
  const HWND combo = GetDlgItem(dialog, kPresetCombo);
  SendMessageW(combo, CB_RESETCONTENT, 0, 0);
  for (const std::string& name : folder.list())
    SendMessageW(combo, CB_ADDSTRING, 0, reinterpret_cast<LPARAM>(widen(name).c_str()));
}

// The list entry equal to text without regard to letter case; empty when there is none.
std::string matchingEntry(HWND dialog, const std::string& text) {
  for (const std::string& entry : comboEntries(dialog))
    if (CompareStringW(LOCALE_INVARIANT, NORM_IGNORECASE, widen(entry).c_str(), -1, widen(text).c_str(), -1) ==
        CSTR_EQUAL)
      return entry;
  return {};
}

void end(HWND dialog, DialogState& s, INT_PTR result) {
  g_lastName = s.name;
  EndDialog(dialog, result);
}

void confirm(HWND dialog, DialogState& s) {
  const std::string text = comboText(dialog);
  if (s.save) {
    s.name = text;
    AskToOverwrite ask;
    s.folder.save(s.name, *s.core, ask);
    end(dialog, s, IDOK);
    return;
  }
  const std::string entry = matchingEntry(dialog, text);
  if (entry.empty()) {
    MessageBoxW(nullptr, L"Preset do not exist", nullptr, MB_OK | MB_TASKMODAL | MB_SETFOREGROUND);
    return;
  }
  s.name = entry;
  s.folder.load(entry, *s.core);
  end(dialog, s, IDOK);
}

void cancel(HWND dialog, DialogState& s) {
  if (!s.save) s.core->loadState(s.snapshot.data(), kCoreStateSize);
  end(dialog, s, IDCANCEL);
}

void editChange(HWND dialog, DialogState& s) {
  const std::string text = comboText(dialog);
  if (s.save) {
    s.name = text;
    return;
  }
  const std::string entry = matchingEntry(dialog, text);
  if (!entry.empty()) s.folder.load(entry, *s.core);
}

INT_PTR CALLBACK presetDialogProc(HWND dialog, UINT message, WPARAM wParam, LPARAM lParam) {
  if (message == WM_INITDIALOG) {
    auto* s = reinterpret_cast<DialogState*>(lParam);
    SetWindowLongPtrW(dialog, DWLP_USER, lParam);
    SendDlgItemMessageW(dialog, kPresetCombo, CB_LIMITTEXT, kMaxPresetNameLength, 0);
    fillList(dialog, s->folder);
    if (!s->save) s->core->saveState(s->snapshot.data());
    return TRUE;
  }
  auto* s = reinterpret_cast<DialogState*>(GetWindowLongPtrW(dialog, DWLP_USER));
  if (!s || message != WM_COMMAND) return FALSE;
  const int id = LOWORD(wParam), code = HIWORD(wParam);
  if (id == IDOK) {
    confirm(dialog, *s);
  } else if (id == IDCANCEL) {
    cancel(dialog, *s);
  } else if (id == kPresetDelete) {
    s->folder.remove(comboText(dialog));
    fillList(dialog, s->folder);
  } else if (id == kPresetCombo && code == CBN_DBLCLK) {
    confirm(dialog, *s);
  } else if (id == kPresetCombo && code == CBN_EDITCHANGE) {
    editChange(dialog, *s);
  } else if (id == kPresetCombo && code == CBN_SELCHANGE) {
    // The edit field shows the picked entry only after this notification: handle it as typed text then.
    PostMessageW(dialog, WM_COMMAND, MAKEWPARAM(kPresetCombo, CBN_EDITCHANGE), lParam);
  } else {
    return FALSE;
  }
  return TRUE;
}

int runDialog(bool save, HWND owner, const std::string& folder, const std::string& note, ReverbCore& core,
              std::string* name) {
  DialogState state{save, PresetFolder(folder), note, &core, {}};
  const INT_PTR result = DialogBoxParamW(codeModule(), MAKEINTRESOURCEW(save ? kSavePresetDialog : kLoadPresetDialog),
                                         owner, presetDialogProc, reinterpret_cast<LPARAM>(&state));
  if (result != IDOK && result != IDCANCEL) {
    MessageBoxW(nullptr, L"Error creating dialogue box", nullptr, MB_OK | MB_TASKMODAL | MB_SETFOREGROUND);
    return 0;
  }
  if (name) *name = g_lastName;
  return static_cast<int>(result);
}

}  // namespace

int runSavePresetDialog(HWND owner, const std::string& folder, const std::string& note, ReverbCore& core,
                        std::string* name) {
  return runDialog(true, owner, folder, note, core, name);
}

int runLoadPresetDialog(HWND owner, const std::string& folder, const std::string& note, ReverbCore& core,
                        std::string* name) {
  return runDialog(false, owner, folder, note, core, name);
}

std::string lastPresetName() { return g_lastName; }

}  // namespace ulvetta
