#include "KRXMLFileTree.h"

#include "objectmodel/KRBase64.h"

#include <xercesc/dom/impl/DOMDocumentImpl.hpp>
#include <xercesc/dom/impl/DOMStringPool.hpp>
#include <xercesc/util/XMLString.hpp>

#include <cstring>

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

// The name table of a tree is a protected member of the library's document
// class, open to classes derived from it: this one only names the members,
// it is never made.
class CKRDocumentNameTable : public DOMDocumentImpl {
public:
  CKRDocumentNameTable() = delete;
  static DOMStringPoolEntry**& Table(DOMDocumentImpl* document) { return document->*(&CKRDocumentNameTable::fNameTable); }
  static XMLSize_t& Size(DOMDocumentImpl* document) { return document->*(&CKRDocumentNameTable::fNameTableSize); }
};

// Names per chain before the table grows, and the growth factor.
constexpr std::size_t kNamesPerChain = 4;
constexpr std::size_t kGrowth = 8;

}  // namespace

void KRNoteNewName(DOMDocument* document, std::size_t& names) {
  ++names;
  // Every document the library makes is its DOMDocumentImpl.
  auto* implementation = static_cast<DOMDocumentImpl*>(document);
  if (implementation == nullptr)
    return;
  DOMStringPoolEntry**& table = CKRDocumentNameTable::Table(implementation);
  XMLSize_t& size = CKRDocumentNameTable::Size(implementation);
  if (table == nullptr || names <= size * kNamesPerChain)
    return;
  // Odd sizes spread the library's hash better than powers of two.
  const XMLSize_t wider = size * kGrowth + 1;
  // Allocated in the document's own memory, released with the document
  // (the old table too, which simply stays unused).
  auto** chains = static_cast<DOMStringPoolEntry**>(implementation->allocate(wider * sizeof(DOMStringPoolEntry*)));
  std::memset(chains, 0, wider * sizeof(DOMStringPoolEntry*));
  for (XMLSize_t i = 0; i < size; ++i) {
    for (DOMStringPoolEntry* entry = table[i]; entry != nullptr;) {
      DOMStringPoolEntry* next = entry->fNext;
      const XMLSize_t chain = XMLString::hash(entry->fString, wider);
      entry->fNext = chains[chain];
      chains[chain] = entry;
      entry = next;
    }
  }
  table = chains;
  size = wider;
}

SKRXMLGuidText::SKRXMLGuidText(const CKRGuid& id) {
  // The memory image of the GUID (its fields little-endian), as CKRGuid
  // encodes it.
  const GUID& guid = id.GetGUID();
  unsigned char bytes[16];
  for (int i = 0; i < 4; ++i)
    bytes[i] = static_cast<unsigned char>(guid.Data1 >> (8 * i));
  for (int i = 0; i < 2; ++i) {
    bytes[4 + i] = static_cast<unsigned char>(guid.Data2 >> (8 * i));
    bytes[6 + i] = static_cast<unsigned char>(guid.Data3 >> (8 * i));
  }
  std::memcpy(bytes + 8, guid.Data4, 8);
  // 16 bytes are 22 characters and the padding "==", which is dropped.
  XMLSize_t at = 0;
  m_Text[at++] = u'_';
  SKRBase64::Encode(bytes, sizeof bytes, [&](char c) {
    if (at <= kXML64Length)
      m_Text[at++] = XMLCh(c);
  });
  m_Text[kElementFormLength] = 0;
}

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

DOMElement* KRAppendGuidElement(SKRXMLFileTree* tree, DOMElement* parent, const CKRGuid& id) {
  if (tree == nullptr || tree->m_pDocument == nullptr || parent == nullptr)
    return nullptr;
  const SKRXMLGuidText name(id);
  KRNoteNewName(tree->m_pDocument, tree->m_Names);
  DOMElement* element = tree->m_pDocument->createElement(name.ElementForm());
  if (element != nullptr)
    parent->appendChild(element);
  return element;
}
