// CKRSerialObject: the storable framework object, and the declare/implement
// macros of storable classes.
//
// A storable class derives from CKRSerialObject (or from another storable
// class), declares its type with KR_DECLARE_SERIAL_TYPE and defines it with
// KR_IMPLEMENT_SERIAL_TYPE plus its type's CreateFields:
//
//   class CKRShape : public CKRSerialObject {
//     KR_DECLARE_SERIAL_TYPE(CKRShape, CKRSerialObjectTypeImpl, "{...}")
//   public:
//     CKRString m_Label;
//   protected:
//     CKRShape() = default;
//   };
//
//   KR_IMPLEMENT_SERIAL_TYPE(CKRShape, CKRSerialObject)
//   void CKRShape::CKRShapeType::CreateFields(CKRSerialObjectTypeImpl* target, IKRObject* object) {
//     AppendParentFields(target, object);
//     BindField<CKRFieldT<CKRString>>(target, object, &CKRShape::m_Label, L"Label", L"The shape's label",
//                                     kLabelFieldID, KRDT_STRING, KRF_READ | KRF_WRITE | KRF_VISIBLE);
//   }
//
// The type base given to KR_DECLARE_SERIAL_TYPE is CKRSerialObjectTypeImpl
// or a class derived from it. The nested type's CreateFields has access to
// the class's private members.
#pragma once

#include <krCoreLib/objectmodel/CKRObjectImpl.h>
#include <krCoreLib/serialization/CKRSerialObjectTypeImpl.h>
#include <krCoreLib/serialization/IKRSerializableAdaptor.h>

#define KR_DECLARE_SERIAL_TYPE(Class, TypeBase, TypeIDText) \
  KR_DECLARE_OBJECT_TYPE_WITH_(Class, TypeBase, TypeIDText,  \
                               void CreateFields(CKRSerialObjectTypeImpl* target, IKRObject* object) override;)

#define KR_IMPLEMENT_SERIAL_TYPE(Class, ParentClass) KR_IMPLEMENT_OBJECT_TYPE(Class, ParentClass)
#define KR_IMPLEMENT_ABSTRACT_SERIAL_TYPE(Class, ParentClass) KR_IMPLEMENT_ABSTRACT_OBJECT_TYPE(Class, ParentClass)

class KRCORELIB_API CKRSerialObject : public CKRObjectImpl, public IKRSerializableAdaptor {
  KR_DECLARE_SERIAL_TYPE(CKRSerialObject, CKRSerialObjectTypeImpl, "{23F18565-85A5-4649-AEC0-DF55D8C3CDAB}")

public:
  // The object, then its storable view for IID_IKRSerializable.
  void* GetInterface(CKRGuid iid) override;
  IKRObject* GetThisObject() override;
  // Appends the field data and makes this object its origin.
  void AddFieldData(IKRFieldData* fieldData) override;
  // Binds the field data: the CreateFields of the object's type (the
  // concrete class's) with this object.
  void InitFieldData() override;

protected:
  CKRSerialObject() = default;
  ~CKRSerialObject() override = default;
};
