// CKRSerialObjectTypeImpl: the type of a storable class.
//
// The type owns the field descriptors of its class and shares those of its
// base classes (owned by the types that introduced them), creates instances
// with their field data bound, and destroys them with their field data.
// Storable instances are created and destroyed through their type but not
// tracked: GetInstance does not find them and the release diagnostic does
// not count them; they are reached through the containers, fields and
// documents that hold them.
//
// Each storable class's type implements CreateFields(target, object), called
// in two roles: with a null object it creates the descriptors (BindField with
// a null object adds them to `target`); with an object it binds that
// object's field data (BindField looks each descriptor up in `target` and
// binds it to the member). A class first brings in its base class's fields
// with AppendParentFields, then declares its own, one BindField each:
//
//   void CKRShape::CKRShapeType::CreateFields(CKRSerialObjectTypeImpl* target, IKRObject* object) {
//     AppendParentFields(target, object);
//     BindField<CKRFieldT<CKRString>>(target, object, &CKRShape::m_Label, L"Label", L"The shape's label",
//                                     kLabelFieldID, KRDT_STRING, KRF_READ | KRF_WRITE | KRF_VISIBLE);
//   }
//
// Fields are created when the type system claims the type (InitializeType);
// an instance created before that has no field data. Not synchronised.
#pragma once

#include <krCoreLib/objectmodel/CKRObjectTypeImpl.h>
#include <krCoreLib/serialization/IKRField.h>
#include <krCoreLib/serialization/IKRSerializable.h>

#include <map>

class KRCORELIB_API CKRSerialObjectTypeImpl : public CKRObjectTypeImpl {
public:
  // Creates the fields: CreateFields(this, null).
  void InitializeType() override;
  // Releases the child types still registered, then releases as any type.
  // The field descriptors stay until the type object is destroyed (module
  // unload): untracked storable instances may outlive the release, and
  // their field data refer to them.
  void Release() override;
  // A new instance with its field data bound; null for an abstract class,
  // a class that is not storable and a refused OnInitialize. Not tracked.
  IKRObject* CreateInstance(CKRGuid instanceID) override;
  // Asks OnBeforeRelease (0 refuses), releases the field data, destroys the
  // object: 1. 0 for null and for an object of another type.
  int ReleaseInstance(IKRObject* object) override;

  // Takes ownership of `field`: entered under its field ID, unless a field
  // with that ID is there already, in which case `field` is destroyed at
  // once (the first one stays). Null is ignored.
  virtual void AddField(IKRField* field);
  virtual void CreateFields(CKRSerialObjectTypeImpl* target, IKRObject* object) = 0;
  // Called on a base type: creates its own fields first if needed; then, with
  // a null object, shares with `target` every field `target` lacks; with an
  // object, binds the base class's field data for it.
  virtual void AppendBaseFields(CKRSerialObjectTypeImpl* target, IKRObject* object);
  virtual IKRField* GetField(CKRGuid fieldID);
  // "%s %d": the type's name and the instance counter (1 before the first
  // instance).
  virtual CKRString GetNextInstanceName();
  virtual void SetDescription(CKRString description);
  virtual CKRString GetDescription();
  virtual void SetHelp(bool help);
  virtual bool HasHelp();
  // The help topic key: the class name.
  virtual CKRString GetHelp();

  // The icon of an instance: with `a` nonzero the first index when `b` is 0,
  // otherwise the second unless it is -1 (then the first); with `a` zero the
  // same rule on the third and fourth. -1 means no icon.
  int GetIconIndex(int a, int b) const;
  void SetIconIndices(int first, int second, int third, int fourth);

  // The field descriptors by field ID (own and shared).
  const std::map<CKRGuid, IKRField*>& GetFieldMap() const { return m_FieldMap; }

protected:
  CKRSerialObjectTypeImpl();
  // Destroys the own fields.
  ~CKRSerialObjectTypeImpl() override;

  // The parent type's AppendBaseFields, when the parent is storable.
  void AppendParentFields(CKRSerialObjectTypeImpl* target, IKRObject* object);

  // One field of a TObject, bound to `member`: with a null object a new
  // TField descriptor (this type its origin) is added to `target`; with an
  // object, `target`'s descriptor with `fieldID` binds the object's member
  // and the field data is added to the object. A missing descriptor binds
  // nothing.
  template <class TField, class TObject, class TMember>
  void BindField(CKRSerialObjectTypeImpl* target, IKRObject* object, TMember TObject::*member, const wchar_t* name,
                 const wchar_t* description, CKRGuid fieldID, CKRGuid dataTypeID, int flags, double version = 0.0) {
    if (target == nullptr)
      return;
    if (object == nullptr) {
      target->AddField(new TField(name, description, fieldID, dataTypeID, this, flags, version));
      return;
    }
    IKRField* field = target->GetField(fieldID);
    auto* typed = dynamic_cast<TObject*>(object);
    if (field == nullptr || typed == nullptr)
      return;
    if (IKRFieldData* data = field->CreateFieldData(&(typed->*member)))
      typed->AddFieldData(data);
  }

private:
  void DestroyOwnFields();

  bool m_Help = false;
  CKRString m_Description;
  int m_InstanceCounter = 1;
  std::map<CKRGuid, IKRField*> m_FieldMap;
  bool m_FieldsCreated = false;
  int m_IconIndices[4] = {-1, -1, -1, -1};
};
