// CKRXString: a scope owner of a string in the XML library's character type
// (XMLCh, UTF-16), allocated by the library's memory manager and released
// through it when the owner goes out of scope. Made from a UTF-8 text by
// transcoding or from a wide text by converting it to UTF-16. The XML
// library must be started while the owner lives. Private to the XML store.
#pragma once

#include <krCoreLib/core/CKRString.h>

#include <xercesc/util/XercesDefs.hpp>

#include <string_view>

class CKRXString {
public:
  explicit CKRXString(std::string_view utf8);
  explicit CKRXString(std::wstring_view wide);
  explicit CKRXString(const CKRString& wide) : CKRXString(std::wstring_view(wide)) {}
  ~CKRXString();
  CKRXString(const CKRXString&) = delete;
  CKRXString& operator=(const CKRXString&) = delete;

  const XMLCh* Get() const noexcept { return m_pText; }
  operator const XMLCh*() const noexcept { return m_pText; }

  // The wide form of a string of the library (null gives empty).
  static CKRString ToWide(const XMLCh* text);

private:
  void Adopt(std::u16string_view text);

  XMLCh* m_pText = nullptr;
};
