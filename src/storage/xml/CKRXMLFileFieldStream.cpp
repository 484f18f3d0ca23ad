#include <krCoreLib/storage/xml/CKRXMLFileFieldStream.h>

#include <krCoreLib/objectmodel/IKRCollection.h>
#include <krCoreLib/serialization/CKRDocument.h>
#include <krCoreLib/serialization/IKRField.h>
#include <krCoreLib/serialization/IKRFieldData.h>
#include <krCoreLib/storage/xml/CKRXMLFileArchive.h>
#include <krCoreLib/storage/xml/CKRXMLFileTypeManifest.h>

#include "KRXMLFileTree.h"

#include <xercesc/util/XMLString.hpp>

XERCES_CPP_NAMESPACE_USE

KR_IMPLEMENT_OBJECT_TYPE(CKRXMLFileFieldStream, CKRFieldStream)

namespace {

const XMLCh kValue[] = {u'V', 0};
const XMLCh kTypeID[] = {u'T', 0};
const XMLCh kInstanceID[] = {u'I', 0};
const XMLCh kLink[] = {u'L', 0};

IKRField* FieldOf(IKRFieldData* fieldData) {
  return fieldData != nullptr ? fieldData->GetField() : nullptr;
}

// Calls `visit` for the descendants of `parent` in document order while it
// returns true. The walk keeps no stack of its own beyond the tree's links,
// so any depth of nesting is walked.
template <typename Visit>
void WalkDescendants(DOMElement* parent, Visit visit) {
  DOMElement* at = parent != nullptr ? parent->getFirstElementChild() : nullptr;
  while (at != nullptr) {
    if (!visit(at))
      return;
    // Pre-order: down, else across, else up until there is a way across.
    if (DOMElement* child = at->getFirstElementChild()) {
      at = child;
      continue;
    }
    while (at != nullptr && at != parent && at->getNextElementSibling() == nullptr) {
      DOMNode* up = at->getParentNode();
      at = up != nullptr && up->getNodeType() == DOMNode::ELEMENT_NODE ? static_cast<DOMElement*>(up) : nullptr;
    }
    at = at != nullptr && at != parent ? at->getNextElementSibling() : nullptr;
  }
}

// The one element named `name` among the descendants of `parent`, or null
// when there is none or more than one.
DOMElement* FindOnlyDescendant(DOMElement* parent, const XMLCh* name) {
  DOMElement* found = nullptr;
  bool several = false;
  WalkDescendants(parent, [&](DOMElement* element) {
    if (!XMLString::equals(element->getTagName(), name))
      return true;
    several = found != nullptr;
    found = element;
    return !several;
  });
  return several ? nullptr : found;
}

// Sets "T" and "I" to the linked object's type and instance IDs.
void SetLinkAttributes(DOMElement* element, IKRObject* object) {
  element->setAttribute(kTypeID, SKRXMLGuidText(object->GetType()->GetID()).XML64());
  element->setAttribute(kInstanceID, SKRXMLGuidText(object->GetInstanceID()).XML64());
}

// The object a link element names, through the document: null for an
// empty link, an unknown type or a missing object.
IKRObject* ResolveLink(CKRDocument* document, DOMElement* element) {
  if (document == nullptr)
    return nullptr;
  const CKRGuid typeID = SKRXMLFileNames::FromXML64(element->getAttribute(kTypeID));
  const CKRGuid instanceID = SKRXMLFileNames::FromXML64(element->getAttribute(kInstanceID));
  if (typeID.IsNull() || instanceID.IsNull())
    return nullptr;
  return document->GetObject(instanceID, typeID);
}

}  // namespace

int CKRXMLFileFieldStream::OnInitialize() {
  if (CKRFieldStream::OnInitialize() == 0)
    return 0;
  m_pElement = nullptr;
  return 1;
}

void CKRXMLFileFieldStream::SetManifest(CKRXMLFileTypeManifest* manifest) {
  m_pManifest = manifest;
  m_pArchive = manifest != nullptr ? manifest->GetArchive() : nullptr;
}

int CKRXMLFileFieldStream::WriteObjectHeader(IKRObject* object) {
  if (m_pElement != nullptr || object == nullptr || m_pManifest == nullptr || m_pArchive == nullptr ||
      m_pArchive->m_pTree == nullptr)
    return 0;
  DOMElement* element = KRAppendGuidElement(m_pArchive->m_pTree, KRToDOM(m_pManifest->GetElement()),
                                            object->GetInstanceID());
  if (element == nullptr)
    return 0;
  m_pElement = KRFromDOM(element);
  return 1;
}

int CKRXMLFileFieldStream::ReadObjectHeader(IKRObject* object) {
  if (m_pElement == nullptr || object == nullptr)
    return 0;
  const CKRGuid id = SKRXMLFileNames::FromElementName(KRToDOM(m_pElement)->getTagName());
  if (id.IsNull())
    return 0;
  SKRObjectIdentity::SetInstanceID(object, id);
  return 1;
}

// The field's element, new and appended to the object's: null when the
// stream has no object element or the field no ID.
static DOMElement* AppendFieldElement(SKRXMLFileTree* tree, SKRXMLFileElement* objectElement, IKRField* field) {
  if (field == nullptr)
    return nullptr;
  return KRAppendGuidElement(tree, KRToDOM(objectElement), field->GetFieldID());
}

int CKRXMLFileFieldStream::Write(IKRFieldData* fieldData) {
  IKRField* field = FieldOf(fieldData);
  DOMElement* element = AppendFieldElement(m_pArchive != nullptr ? m_pArchive->m_pTree : nullptr, m_pElement, field);
  if (element == nullptr)
    return 0;
  if (field->SupportsStringStorage() != 0) {
    const CKRXString value(fieldData->GetStringValue());
    element->setAttribute(kValue, value);
  }
  return 1;
}

int CKRXMLFileFieldStream::WriteLink(IKRFieldData* fieldData, IKRObject* object) {
  DOMElement* element = AppendFieldElement(m_pArchive != nullptr ? m_pArchive->m_pTree : nullptr, m_pElement, FieldOf(fieldData));
  if (element == nullptr)
    return 0;
  if (object != nullptr)
    SetLinkAttributes(element, object);
  return 1;
}

int CKRXMLFileFieldStream::WriteLinks(IKRFieldData* fieldData, IKRIterator* iterator) {
  DOMElement* element = AppendFieldElement(m_pArchive != nullptr ? m_pArchive->m_pTree : nullptr, m_pElement, FieldOf(fieldData));
  if (element == nullptr)
    return 0;
  if (iterator == nullptr)
    return 1;
  DOMDocument* tree = element->getOwnerDocument();
  for (IKRObject* object = iterator->Next(1); object != nullptr; object = iterator->Next(0)) {
    DOMElement* link = tree->createElement(kLink);
    if (link == nullptr)
      return 0;
    SetLinkAttributes(link, object);
    element->appendChild(link);
  }
  return 1;
}

int CKRXMLFileFieldStream::Read(IKRFieldData* fieldData) {
  IKRField* field = FieldOf(fieldData);
  if (field == nullptr)
    return 0;
  if (field->SupportsStringStorage() == 0)
    return 1;
  const SKRXMLGuidText name(field->GetFieldID());
  DOMElement* element = FindOnlyDescendant(KRToDOM(m_pElement), name.ElementForm());
  if (element == nullptr)
    return 0;
  // A missing attribute reads as empty text.
  fieldData->SetValueFromString(CKRXString::ToWide(element->getAttribute(kValue)));
  fieldData->NotifyOfChange(KRF_VALUE_CHANGED, CKRGuid());
  return 1;
}

IKRObject* CKRXMLFileFieldStream::ReadLink(IKRFieldData* fieldData) {
  IKRField* field = FieldOf(fieldData);
  if (field == nullptr)
    return nullptr;
  const SKRXMLGuidText name(field->GetFieldID());
  DOMElement* element = FindOnlyDescendant(KRToDOM(m_pElement), name.ElementForm());
  return element != nullptr ? ResolveLink(GetDocument(), element) : nullptr;
}

int CKRXMLFileFieldStream::ReadLinks(IKRFieldData* fieldData, IKRCollection* collection) {
  IKRField* field = FieldOf(fieldData);
  if (field == nullptr || collection == nullptr)
    return 0;
  const SKRXMLGuidText name(field->GetFieldID());
  DOMElement* element = FindOnlyDescendant(KRToDOM(m_pElement), name.ElementForm());
  if (element == nullptr)
    return 0;
  // The "L" descendants in document order.
  WalkDescendants(element, [&](DOMElement* link) {
    if (XMLString::equals(link->getTagName(), kLink))
      if (IKRObject* object = ResolveLink(GetDocument(), link))
        collection->Add(object);
    return true;
  });
  return 1;
}
