// IKRFieldData: the access to one field of one object.
//
// A field data object exists once per field of each storable instance and
// holds a pointer to the value, which stays a plain member of the object (its
// origin object). Stores write and read values through it, the property grid
// shows and edits them as text, and a group field data stands for the same
// field of several objects. The object owns its field data; field data never
// own the values behind them (Release(true) says what a deep release
// destroys). Not synchronised.
#pragma once

#include <krCoreLib/core/CKRString.h>
#include <krCoreLib/serialization/KRFieldTypes.h>

class CKRSerialObject;
class IKRField;
class IKRFieldStream;

class KRCORELIB_API IKRFieldData {
public:
  // Asks the origin object whether `newValue` may replace the value (it may
  // rewrite the text): nonzero allows the change.
  virtual int NotifyOfPendingChange(CKRString& newValue) = 0;
  // Tells the origin object that the value changed.
  virtual void NotifyOfChange(KRF_NOTIFICATION_TYPE kind, CKRGuid id) = 0;
  virtual int Equals(IKRFieldData* other) = 0;
  virtual int SetTo(IKRFieldData* other) = 0;
  virtual IKRField* GetField() = 0;
  virtual CKRString GetStringValue() = 0;
  virtual CKRSerialObject* GetOriginObject() = 0;
  virtual void SetOriginObject(CKRSerialObject* object) = 0;
  virtual int GroupDataVaries() = 0;
  virtual int IsGroupData() = 0;
  virtual IKRFieldData* GetEffectiveData() = 0;
  // Destroys the field data; with `deep`, also what the value owns (each
  // class says what that is).
  virtual void Release(bool deep) = 0;
  // The field data whose value this object is, when it is itself the value
  // of another object's field; null otherwise.
  virtual IKRFieldData* GetParentField() = 0;
  virtual void SetParentField(IKRFieldData* parent) = 0;
  virtual int SetValueFromString(const CKRString& text) = 0;
  virtual int SerializeTo(IKRFieldStream* stream) = 0;
  virtual int SerializeFrom(IKRFieldStream* stream) = 0;
  virtual int HasFieldDataImplTypeOf(CKRGuid implementationID) = 0;
  virtual int HasFieldTypeOf(CKRGuid dataTypeID) = 0;
  virtual int ReadOnly() = 0;
  virtual int HiliteReadable() = 0;
  virtual int Visible() = 0;
  virtual int Expanded() = 0;
  virtual int HasCheckbox() = 0;
  virtual int Checked() = 0;

protected:
  ~IKRFieldData() = default;
};
