// CKRObjCollectionFieldT and CKRObjCollectionFieldDataT: a field whose
// member is a collection of links (a CKRObjPtrList or CKRObjGuidPtrMap of
// some framework class).
//
// Saving writes the links in the collection's order and then stores every
// storable element in the same document; loading has the stream add the
// linked objects to the collection. The field data owns neither the
// collection nor its elements; Release(true) empties the collection without
// releasing the elements. Header-only: instantiated for any collection.
#pragma once

#include <krCoreLib/objectmodel/IKRCollection.h>
#include <krCoreLib/serialization/CKRDocument.h>
#include <krCoreLib/serialization/CKRFieldAdaptor.h>
#include <krCoreLib/serialization/CKRFieldDataAdaptor.h>
#include <krCoreLib/serialization/IKRFieldStream.h>
#include <krCoreLib/serialization/IKRSerializable.h>

template <class TCollection>
class CKRObjCollectionFieldDataT;

// The element class of a collection template (CKRObjPtrList<T>,
// CKRObjGuidPtrMap<T>): T; void for other collections.
template <class TCollection>
struct SKRCollectionElement {
  using Type = void;
};
template <template <class> class TTemplate, class T>
struct SKRCollectionElement<TTemplate<T>> {
  using Type = T;
};

// The descriptor of a collection of links; no plain-text storage.
template <class TCollection>
class CKRObjCollectionFieldT : public CKRFieldAdaptor {
public:
  using CKRFieldAdaptor::CKRFieldAdaptor;

  // `member` is the address of a TCollection member.
  IKRFieldData* CreateFieldData(void* member) override {
    return member != nullptr ? new CKRObjCollectionFieldDataT<TCollection>(static_cast<TCollection*>(member), this)
                             : nullptr;
  }
  void Release() override { delete this; }

protected:
  ~CKRObjCollectionFieldT() override = default;
};

template <class TCollection>
class CKRObjCollectionFieldDataT : public CKRFieldDataAdaptor {
public:
  CKRObjCollectionFieldDataT(TCollection* collection, CKRObjCollectionFieldT<TCollection>* field)
      : m_pCollection(collection), m_pField(field) {}

  IKRField* GetField() override { return m_pField; }

  // Writes the links (0 when that fails), then stores each storable element
  // in the stream's document; the elements' own results are not examined.
  int SerializeTo(IKRFieldStream* stream) override {
    if (stream == nullptr)
      return 0;
    auto links = m_pCollection->GetIterator();
    if (stream->WriteLinks(this, &links) == 0)
      return 0;
    auto elements = m_pCollection->GetIterator();
    for (IKRObject* element = elements.Next(1); element != nullptr; element = elements.Next(0))
      if (auto* linked = static_cast<IKRSerializable*>(element->GetInterface(IID_IKRSerializable))) {
        linked->SetParentField(this);
        linked->SerializeTo(stream->GetDocument());
      }
    return 1;
  }
  // The stream adds the linked objects to the collection. An element class
  // with a type ID has the document require that class, so a link stored
  // with another class creates no object (which the collection would
  // refuse and nothing would hold).
  int SerializeFrom(IKRFieldStream* stream) override {
    if (stream == nullptr)
      return 0;
    using TElement = typename SKRCollectionElement<TCollection>::Type;
    if constexpr (requires { TElement::TypeID; }) {
      CKRDocument* document = stream->GetDocument();
      const CKRGuid previous = document != nullptr ? document->RequireLinkType(TElement::TypeID) : CKRGuid();
      const int result = stream->ReadLinks(this, m_pCollection);
      if (document != nullptr)
        document->RequireLinkType(previous);
      return result;
    } else {
      return stream->ReadLinks(this, m_pCollection);
    }
  }
  int HasFieldDataImplTypeOf(CKRGuid implementationID) override {
    return implementationID == KRIMPL_FIELDDATA_COLLECTION ? 1 : 0;
  }
  void Release(bool deep) override {
    if (deep)
      m_pCollection->RemoveAll(false);
    delete this;
  }

  // Empties the collection (the elements stay alive).
  virtual void RemoveAll() { m_pCollection->RemoveAll(false); }
  virtual CKRObjCollectionFieldT<TCollection>* GetCollectionField() { return m_pField; }

  // The collection.
  TCollection* GetCollection() const { return m_pCollection; }

protected:
  ~CKRObjCollectionFieldDataT() override = default;

private:
  TCollection* m_pCollection;
  CKRObjCollectionFieldT<TCollection>* m_pField;
};
