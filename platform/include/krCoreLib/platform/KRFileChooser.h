// The file dialogs of the library's ...WithUI operations (an archive that
// has no file name asks the user for one). The library has no user
// interface of its own: it asks the installed chooser, and the default
// chooser answers "cancel", so that without a host's chooser those
// operations behave as a cancelled dialog. A host with a windowing toolkit
// installs a chooser that shows its file dialog; tests install one that
// answers as they need.
//
// Thread safety: install the chooser from the main thread before any
// archive asks it; asking is not synchronised with installing.
#pragma once

#include <krCoreLib/core/KRExport.h>

#include <string>

struct SKRFileChooserRequest {
  bool m_ForSaving = false;                 // the save dialog; otherwise the open dialog
  const wchar_t* m_Title = L"";             // for example "Open Archive"
  const wchar_t* m_Filter = L"";            // "All Files (*.*)|*.*||": description|pattern pairs
  const wchar_t* m_DefaultExtension = L"";  // empty: none
  unsigned m_Flags = 0;                     // dialog options; 0: none
};

class KRCORELIB_API SKRFileChooser {
public:
  // Answers the request: true with the chosen path ("/" separated) in
  // `path` for OK, false for cancel (`path` is then not used).
  using Chooser = bool (*)(const SKRFileChooserRequest& request, std::wstring& path, void* context);

  // Installs `chooser` (null restores the default) and returns the one it
  // replaces.
  static Chooser SetChooser(Chooser chooser, void* context = nullptr);
  // Asks the installed chooser. An empty path counts as cancel.
  static bool Choose(const SKRFileChooserRequest& request, std::wstring& path);
  // The default: cancel.
  static bool Cancel(const SKRFileChooserRequest& request, std::wstring& path, void* context);
};
