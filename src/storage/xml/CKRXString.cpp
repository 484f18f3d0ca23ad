#include "CKRXString.h"

#include "core/KRUtf16.h"
#include "core/KRUtf8.h"

#include <xercesc/framework/MemoryManager.hpp>
#include <xercesc/util/PlatformUtils.hpp>
#include <xercesc/util/XMLString.hpp>

#include <cstring>
#include <string>

static_assert(sizeof(XMLCh) == sizeof(char16_t), "the XML library's characters are UTF-16 code units");

XERCES_CPP_NAMESPACE_USE

CKRXString::CKRXString(std::string_view utf8) {
  std::wstring wide;
  SKRUtf8::Decode(utf8, wide);
  std::u16string units;
  SKRUtf16::Encode(wide, units);
  Adopt(units);
}

CKRXString::CKRXString(std::wstring_view wide) {
  std::u16string units;
  SKRUtf16::Encode(wide, units);
  Adopt(units);
}

void CKRXString::Adopt(std::u16string_view text) {
  auto* copy = static_cast<XMLCh*>(XMLPlatformUtils::fgMemoryManager->allocate((text.size() + 1) * sizeof(XMLCh)));
  std::memcpy(copy, text.data(), text.size() * sizeof(XMLCh));
  copy[text.size()] = 0;
  m_pText = copy;
}

CKRXString::~CKRXString() {
  XMLString::release(&m_pText, XMLPlatformUtils::fgMemoryManager);
}

CKRString CKRXString::ToWide(const XMLCh* text) {
  std::wstring wide;
  if (text != nullptr)
    SKRUtf16::Decode(std::u16string_view(reinterpret_cast<const char16_t*>(text), XMLString::stringLen(text)), wide);
  return CKRString(std::move(wide));
}
