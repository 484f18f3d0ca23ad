// The XML store's private side: the tree an open archive holds and the
// conversions between the opaque element handles of the public headers
// and the XML library's elements.
#pragma once

#include <krCoreLib/objectmodel/CKRGuid.h>

#include "CKRXString.h"

#include <xercesc/dom/DOMDocument.hpp>
#include <xercesc/dom/DOMElement.hpp>

#include <memory>

struct SKRXMLFileElement;  // never defined: a DOMElement seen from outside

struct SKRXMLFileTree {
  SKRXMLFileTree() = default;
  ~SKRXMLFileTree();
  SKRXMLFileTree(const SKRXMLFileTree&) = delete;
  SKRXMLFileTree& operator=(const SKRXMLFileTree&) = delete;

  // Owned; when read, adopted from the parser, which is released as soon
  // as the file is parsed.
  xercesc::DOMDocument* m_pDocument = nullptr;
  std::size_t m_Names = 0;  // element names made in m_pDocument, for KRNoteNewName
};

// The XML library keeps every element name of a tree in one hash table of
// a fixed 257 chains; the store names every object by its own GUID, so a
// file of 100,000 objects made saving and loading quadratic (seconds per
// thousand objects, spent walking those chains). Counting the names of a
// tree and widening its table as it grows (four names per chain at most)
// keeps each name's lookup short. `names` counts the names made so far.
void KRNoteNewName(xercesc::DOMDocument* document, std::size_t& names);

inline xercesc::DOMElement* KRToDOM(SKRXMLFileElement* element) {
  return reinterpret_cast<xercesc::DOMElement*>(element);
}
inline SKRXMLFileElement* KRFromDOM(xercesc::DOMElement* element) {
  return reinterpret_cast<SKRXMLFileElement*>(element);
}

// The two text forms of a GUID in the library's characters, made without
// allocating (the store writes a few for every object): `m_Text` holds the
// element form ("_" and 22 characters of XML64), `XML64()` its last 22
// characters. The same texts as CKRGuid's GetCStringXMLElement and
// GetCStringXML64.
struct SKRXMLGuidText {
  explicit SKRXMLGuidText(const CKRGuid& id);
  const XMLCh* ElementForm() const { return m_Text; }
  const XMLCh* XML64() const { return m_Text + 1; }

private:
  XMLCh m_Text[24];
};

// Element names and attribute values of the file format.
struct SKRXMLFileNames {
  // The GUID an element's name is the element form of; null when it is none
  // (wrong length, characters outside the alphabet, the null GUID).
  static CKRGuid FromElementName(const XMLCh* name);
  // The GUID of an XML64 attribute value; null when it is none.
  static CKRGuid FromXML64(const XMLCh* value);
};

// A new element named by `id`'s element form, appended to `parent`; null
// when either is missing or the element cannot be made.
xercesc::DOMElement* KRAppendGuidElement(SKRXMLFileTree* tree, xercesc::DOMElement* parent, const CKRGuid& id);

// Calls `visit` for every element child of `parent` that is named by a
// valid GUID, in document order.
template <typename Visit>
void KRForEachGuidChild(xercesc::DOMElement* parent, Visit visit) {
  if (parent == nullptr)
    return;
  for (xercesc::DOMElement* child = parent->getFirstElementChild(); child != nullptr;
       child = child->getNextElementSibling()) {
    const CKRGuid id = SKRXMLFileNames::FromElementName(child->getTagName());
    if (id.IsValid())
      visit(id, child);
  }
}
