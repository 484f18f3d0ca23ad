// Stand-ins for the windowing toolkit's types that the framework's
// signatures need: a point and a size in window pixels, a device context
// handle, and a window. They carry identity and values only; the user
// interface layer grows them.
#pragma once

#include <krCoreLib/core/CKRString.h>

// A point in window pixels.
struct CKRScreenPoint {
  int x = 0;
  int y = 0;
  bool operator==(const CKRScreenPoint&) const = default;
};

// A size in window pixels.
struct CKRScreenSize {
  int cx = 0;
  int cy = 0;
  bool operator==(const CKRScreenSize&) const = default;
};

// A device context: the handle a window paints through.
struct CKRDeviceContext {
  int m_Handle = 0;
  bool operator==(const CKRDeviceContext&) const = default;
};

// A window: identity and a title. Windows are not copied.
class KRCORELIB_API CKRWnd {
public:
  explicit CKRWnd(CKRString title = CKRString()) : m_Title(std::move(title)) {}
  CKRWnd(const CKRWnd&) = delete;
  CKRWnd& operator=(const CKRWnd&) = delete;
  // Out of line: the class's tables live in the library only.
  virtual ~CKRWnd();

  const CKRString& GetTitle() const { return m_Title; }
  void SetTitle(CKRString title) { m_Title = std::move(title); }

private:
  CKRString m_Title;
};
