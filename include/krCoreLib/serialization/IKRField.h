// IKRField: the descriptor of one field of a storable type.
//
// A descriptor exists once per field of a type: its field ID, name,
// description, data type ID, flags (KRF_...) and version, and the type that
// introduced it (its origin type, which owns it). CreateFieldData makes the
// per-instance access object (IKRFieldData) bound to one object's member.
// Not synchronised.
#pragma once

#include <krCoreLib/core/CKRString.h>
#include <krCoreLib/serialization/KRFieldTypes.h>

class CKRSerialObjectTypeImpl;
class IKRFieldData;

class KRCORELIB_API IKRField {
public:
  // 1 when the value can be stored as plain text.
  virtual int SupportsStringStorage() = 0;
  virtual CKRString GetName() = 0;
  virtual void SetName(CKRString name) = 0;
  virtual void SetFieldID(CKRGuid id) = 0;
  virtual CKRGuid GetFieldID() = 0;
  virtual CKRString GetDescription() = 0;
  virtual void SetDescription(CKRString description) = 0;
  virtual double GetVersion() = 0;
  virtual void SetVersion(double version) = 0;
  virtual CKRGuid GetDataTypeID() = 0;
  virtual void SetDataTypeID(CKRGuid id) = 0;
  virtual int GetFlags() = 0;
  virtual void SetFlags(int flags) = 0;
  // A new field data bound to the member at `member` (of the value type the
  // field is made for) and to this field; the caller owns it. Null for a
  // null member.
  virtual IKRFieldData* CreateFieldData(void* member) = 0;
  // The type that created the field (its owner).
  virtual CKRSerialObjectTypeImpl* GetOriginType() = 0;
  virtual void SetOriginType(CKRSerialObjectTypeImpl* type) = 0;
  // Destroys the descriptor.
  virtual void Release() = 0;

protected:
  ~IKRField() = default;
};
