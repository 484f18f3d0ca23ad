// The nested-type pattern: every framework class nests its own type class
// (CKRDocument::CKRDocumentType), keeps one static instance of it reachable
// through GetCKRDocumentType(), and routes Release() to that type.
//
// In the class (first thing in its body; it leaves the access at private):
//
//   class CKRShape : public CKRObjectImpl {
//     KR_DECLARE_OBJECT_TYPE(CKRShape, CKRObjectTypeImpl,
//                            "{0B5B4F0E-3D4B-4E37-9F5E-2F2A3C1D7E11}")
//   public:
//     ...
//   };
//
// declares the nested CKRShape::CKRShapeType (derived from the given type
// base class), the constant CKRShape::TypeID, the accessor GetCKRShapeType()
// and the overrides GetType() and Release(). In one source file:
//
//   KR_IMPLEMENT_OBJECT_TYPE(CKRShape, CKRObjectImpl)           // concrete
//   KR_IMPLEMENT_ABSTRACT_OBJECT_TYPE(CKRShape, CKRObjectImpl)  // abstract
//
// defines them with the parent class given second. The type's name and class
// name are the class name. The static type object is created on first use of
// its accessor and, at the latest, while the module is loaded, so it is
// registered with the type system before the host's first Initialize
// whatever the order in which the module's files are initialised. A class
// whose type must do more (field descriptors, for example) derives its type
// base class accordingly. A concrete class needs a default constructor
// accessible to its nested type.
#pragma once

#include <krCoreLib/objectmodel/CKRObjectTypeImpl.h>

// TypeID is a constant that every module keeps to itself (hidden): an
// exported inline constant would become a process-wide unique symbol, and the
// dynamic loader never unmaps a module that defines one, so a plug-in could
// not be unloaded.
#define KR_DECLARE_OBJECT_TYPE(Class, TypeBase, TypeIDText) KR_DECLARE_OBJECT_TYPE_WITH_(Class, TypeBase, TypeIDText, )

// The declaration with further members of the nested type (`TypeMembers`,
// public), for type families such as storable classes.
#define KR_DECLARE_OBJECT_TYPE_WITH_(Class, TypeBase, TypeIDText, TypeMembers)  \
public:                                                                         \
  KRCORELIB_LOCAL static constexpr CKRGuid TypeID = CKRGuid::Literal(TypeIDText); \
  class Class##Type : public TypeBase {                                         \
  public:                                                                       \
    Class##Type();                                                              \
    TypeMembers                                                                 \
                                                                                \
  protected:                                                                    \
    IKRObject* CTOR() override;                                                 \
    void DTOR(IKRObject* object) override;                                      \
  };                                                                            \
  static Class##Type* Get##Class##Type();                                       \
  IKRObjectType* GetType() override;                                            \
  int Release() override;                                                       \
                                                                                \
private:

// Shared part of the two implementation macros.
#define KR_IMPLEMENT_OBJECT_TYPE_COMMON_(Class, ParentClass, Abstract)      \
  Class::Class##Type::Class##Type() {                                       \
    SetID(Class::TypeID);                                                   \
    SetParentTypeID(ParentClass::TypeID);                                   \
    SetName(L"" #Class);                                                    \
    SetClassName(L"" #Class);                                               \
    if (Abstract)                                                           \
      m_IsAbstract = 1;                                                     \
  }                                                                         \
  Class::Class##Type* Class::Get##Class##Type() {                           \
    static Class##Type s_Type;                                              \
    return &s_Type;                                                         \
  }                                                                         \
  IKRObjectType* Class::GetType() { return Get##Class##Type(); }            \
  int Class::Release() { return Get##Class##Type()->ReleaseInstance(this); } \
  /* Registers the type while the module loads. */                          \
  [[maybe_unused]] static const bool kr_TypeRegistered_##Class =            \
      (Class::Get##Class##Type() != nullptr);

#define KR_IMPLEMENT_OBJECT_TYPE(Class, ParentClass)                        \
  KR_IMPLEMENT_OBJECT_TYPE_COMMON_(Class, ParentClass, false)               \
  IKRObject* Class::Class##Type::CTOR() { return new Class(); }             \
  void Class::Class##Type::DTOR(IKRObject* object) {                        \
    delete static_cast<Class*>(object);                                     \
  }

#define KR_IMPLEMENT_ABSTRACT_OBJECT_TYPE(Class, ParentClass)               \
  KR_IMPLEMENT_OBJECT_TYPE_COMMON_(Class, ParentClass, true)                \
  IKRObject* Class::Class##Type::CTOR() { return nullptr; }                 \
  void Class::Class##Type::DTOR(IKRObject*) {}
