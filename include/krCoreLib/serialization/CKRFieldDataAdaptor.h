// CKRFieldDataAdaptor: the default field data. The typed templates derive
// from it and add GetField, Release and their values.
//
// The questions of the property grid (ReadOnly, Visible, Expanded,
// HasCheckbox, Checked, HiliteReadable) follow the field's flags and, where
// a flag hands the decision to the object, ask the origin object; without a
// field they answer 0. Change notifications go to the origin object; without
// one a pending change is refused. Values: an empty text, no string input,
// no comparison or copy.
#pragma once

#include <cstddef>
#include <new>

#include <krCoreLib/serialization/IKRFieldData.h>

class KRCORELIB_API CKRFieldDataAdaptor : public IKRFieldData {
public:
  // Memory from the framework's pool of small blocks (every storable object
  // has one per field); derived classes inherit it.
  static void* operator new(std::size_t size);
  static void* operator new(std::size_t size, std::align_val_t alignment);
  static void operator delete(void* block, std::size_t size) noexcept;
  static void operator delete(void* block, std::size_t size, std::align_val_t alignment) noexcept;
  int NotifyOfPendingChange(CKRString& newValue) override;
  void NotifyOfChange(KRF_NOTIFICATION_TYPE kind, CKRGuid id) override;
  int Equals(IKRFieldData* other) override;
  int SetTo(IKRFieldData* other) override;
  CKRString GetStringValue() override;
  CKRSerialObject* GetOriginObject() override;
  void SetOriginObject(CKRSerialObject* object) override;
  int GroupDataVaries() override;
  int IsGroupData() override;
  // The field data itself.
  IKRFieldData* GetEffectiveData() override;
  IKRFieldData* GetParentField() override;
  void SetParentField(IKRFieldData* parent) override;
  int SetValueFromString(const CKRString& text) override;
  // The stream's Write (Read) with this field data: the stream chooses the
  // representation.
  int SerializeTo(IKRFieldStream* stream) override;
  int SerializeFrom(IKRFieldStream* stream) override;
  int HasFieldDataImplTypeOf(CKRGuid implementationID) override;
  // 1 when the field's data type ID is `dataTypeID`.
  int HasFieldTypeOf(CKRGuid dataTypeID) override;
  int ReadOnly() override;
  int HiliteReadable() override;
  int Visible() override;
  int Expanded() override;
  int HasCheckbox() override;
  int Checked() override;

protected:
  CKRFieldDataAdaptor() = default;
  CKRFieldDataAdaptor(const CKRFieldDataAdaptor&) = delete;
  CKRFieldDataAdaptor& operator=(const CKRFieldDataAdaptor&) = delete;
  virtual ~CKRFieldDataAdaptor() = default;

  // The field's flags, 0 without a field.
  int FlagsOfField();

private:
  IKRFieldData* m_pParentField = nullptr;
  CKRSerialObject* m_pOriginObject = nullptr;
};
