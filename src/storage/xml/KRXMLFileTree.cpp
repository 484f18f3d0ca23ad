#include "KRXMLFileTree.h"

#include <xercesc/util/XMLString.hpp>

XERCES_CPP_NAMESPACE_USE

namespace {

// Lengths of the two text forms: 16 bytes in base64 without padding are 22
// characters; the element form puts "_" before them.
constexpr XMLSize_t kXML64Length = 22;
constexpr XMLSize_t kElementFormLength = kXML64Length + 1;

bool IsXML64Character(XMLCh c) {
  return (c >= u'A' && c <= u'Z') || (c >= u'a' && c <= u'z') || (c >= u'0' && c <= u'9') || c == u'-' || c == u'_';
}

// The GUID of exactly 22 XML64 characters; null otherwise.
CKRGuid FromXML64Characters(const XMLCh* text) {
  wchar_t wide[kXML64Length];
  for (XMLSize_t i = 0; i < kXML64Length; ++i) {
    if (!IsXML64Character(text[i]))
      return CKRGuid();
    wide[i] = wchar_t(text[i]);
  }
  CKRGuid id;
  id.SetCStringXML64(CKRString(wide, kXML64Length));
  return id;
}

}  // namespace

CKRGuid SKRXMLFileNames::FromElementName(const XMLCh* name) {
  if (name == nullptr || name[0] != u'_' || XMLString::stringLen(name) != kElementFormLength)
    return CKRGuid();
  return FromXML64Characters(name + 1);
}

CKRGuid SKRXMLFileNames::FromXML64(const XMLCh* value) {
  if (value == nullptr || XMLString::stringLen(value) != kXML64Length)
    return CKRGuid();
  return FromXML64Characters(value);
}

DOMElement* KRAppendGuidElement(DOMDocument* document, DOMElement* parent, const CKRGuid& id) {
  if (document == nullptr || parent == nullptr)
    return nullptr;
  const CKRXString name(SKRXMLFileNames::ElementForm(id));
  DOMElement* element = document->createElement(name);
  if (element != nullptr)
    parent->appendChild(element);
  return element;
}
