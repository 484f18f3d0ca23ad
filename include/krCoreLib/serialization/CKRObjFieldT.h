// CKRObjFieldT and CKRObjFieldDataT: a field whose member is a pointer to
// another framework object of class T (a link).
//
// Saving writes the link (the stream stores the object's type and instance
// IDs) and then stores the linked object in the same document, so that a
// document holds everything its objects reach. Loading resolves the link
// through the document, which loads the linked object once. The field data
// does not own the linked object; Release(true) releases it and clears the
// member. Header-only: instantiated for any framework class.
#pragma once

#include <krCoreLib/objectmodel/IKRObject.h>
#include <krCoreLib/serialization/CKRFieldAdaptor.h>
#include <krCoreLib/serialization/CKRDocument.h>
#include <krCoreLib/serialization/CKRFieldDataAdaptor.h>
#include <krCoreLib/serialization/IKRFieldStream.h>
#include <krCoreLib/serialization/IKRSerializable.h>

#include <type_traits>

template <class T>
class CKRObjFieldDataT;

// The descriptor of a link to a T; no plain-text storage.
template <class T>
class CKRObjFieldT : public CKRFieldAdaptor {
public:
  using CKRFieldAdaptor::CKRFieldAdaptor;

  // `member` is the address of a T* member.
  IKRFieldData* CreateFieldData(void* member) override {
    return member != nullptr ? new CKRObjFieldDataT<T>(static_cast<T**>(member), this) : nullptr;
  }
  void Release() override { delete this; }

protected:
  ~CKRObjFieldT() override = default;
};

template <class T>
class CKRObjFieldDataT : public CKRFieldDataAdaptor {
public:
  CKRObjFieldDataT(T** member, CKRObjFieldT<T>* field) : m_ppObject(member), m_pField(field) {
    // Checked here, not at class scope: a class may link to itself.
    static_assert(std::is_base_of_v<IKRObject, T>, "links refer to framework objects");
  }

  IKRField* GetField() override { return m_pField; }

  // 1 when both fields have the same data type and both members hold the
  // same object.
  int Equals(IKRFieldData* other) override {
    auto* same = SameKind(other);
    return same != nullptr && *same->m_ppObject == *m_ppObject ? 1 : 0;
  }
  // Copies the other link under the condition of Equals.
  int SetTo(IKRFieldData* other) override {
    auto* same = SameKind(other);
    if (same == nullptr)
      return 0;
    *m_ppObject = *same->m_ppObject;
    return 1;
  }

  // Writes the link (0 when that fails), then stores a storable linked
  // object in the stream's document (0 when that fails); an empty link is
  // only written.
  int SerializeTo(IKRFieldStream* stream) override {
    if (stream == nullptr || stream->WriteLink(this, *m_ppObject) == 0)
      return 0;
    if (IKRSerializable* linked = GetSerializable()) {
      linked->SetParentField(this);
      if (linked->SerializeTo(stream->GetDocument()) == 0)
        return 0;
    }
    return 1;
  }
  // Takes the object the stream resolves: 1. No object, or one that is not
  // a T, leaves the member and gives 0. A T with a type ID has the document
  // require that class, so a link stored with another class creates no
  // object (which nothing would hold).
  int SerializeFrom(IKRFieldStream* stream) override {
    if (stream == nullptr)
      return 0;
    IKRObject* linked = nullptr;
    if constexpr (requires { T::TypeID; }) {
      CKRDocument* document = stream->GetDocument();
      const CKRGuid previous = document != nullptr ? document->RequireLinkType(T::TypeID) : CKRGuid();
      linked = stream->ReadLink(this);
      if (document != nullptr)
        document->RequireLinkType(previous);
    } else {
      linked = stream->ReadLink(this);
    }
    T* typed = nullptr;
    if constexpr (std::is_same_v<T, IKRObject>)
      typed = linked;
    else
      typed = dynamic_cast<T*>(linked);
    if (typed == nullptr)
      return 0;
    *m_ppObject = typed;
    return 1;
  }
  int HasFieldDataImplTypeOf(CKRGuid implementationID) override {
    return implementationID == KRIMPL_FIELDDATA_OBJECT ? 1 : 0;
  }
  void Release(bool deep) override {
    if (deep && *m_ppObject != nullptr) {
      T* linked = *m_ppObject;
      *m_ppObject = nullptr;
      linked->Release();
    }
    delete this;
  }

  // The address of the member.
  virtual T** GetMember() { return m_ppObject; }
  // The linked object's storable view; null without an object or when it
  // is not storable.
  virtual IKRSerializable* GetSerializable() {
    return *m_ppObject != nullptr ? static_cast<IKRSerializable*>((*m_ppObject)->GetInterface(IID_IKRSerializable))
                                  : nullptr;
  }
  // Replaces the linked object.
  virtual void SetObject(T* object) { *m_ppObject = object; }
  virtual CKRObjFieldT<T>* GetObjField() { return m_pField; }

protected:
  ~CKRObjFieldDataT() override = default;

private:
  CKRObjFieldDataT* SameKind(IKRFieldData* other) {
    if (m_pField == nullptr || other == nullptr || other->GetField() == nullptr ||
        other->GetField()->GetDataTypeID() != m_pField->GetDataTypeID())
      return nullptr;
    return dynamic_cast<CKRObjFieldDataT*>(other);
  }

  T** m_ppObject;
  CKRObjFieldT<T>* m_pField;
};
