// CKRFieldT and CKRFieldDataT: fields whose value is a plain member of the
// object (a wide string, a CKRGuid, an int), stored as text.
//
//   wide string  the text itself; any text is taken as it is
//   CKRGuid      the braced form; a text that does not parse leaves the
//                value and is refused (0)
//   int          "%d"; read as wtoi reads (leading blanks, the longest
//                number prefix, saturated at the limits of int; a text
//                without a number gives 0 and is accepted)
//
// SKRFieldValueText says how a value type is written and read as text; a
// program may specialise it for further value types and instantiate the
// templates for them. The three types above are compiled into the library.
#pragma once

#include <krCoreLib/serialization/CKRFieldAdaptor.h>
#include <krCoreLib/serialization/CKRFieldDataAdaptor.h>

template <class TValue>
struct SKRFieldValueText;

template <>
struct KRCORELIB_API SKRFieldValueText<CKRString> {
  static CKRString ToString(const CKRString& value);
  static bool FromString(const CKRString& text, CKRString& value);
};

template <>
struct KRCORELIB_API SKRFieldValueText<CKRGuid> {
  static CKRString ToString(const CKRGuid& value);
  static bool FromString(const CKRString& text, CKRGuid& value);
};

template <>
struct KRCORELIB_API SKRFieldValueText<int> {
  static CKRString ToString(const int& value);
  static bool FromString(const CKRString& text, int& value);
};

template <class TValue>
class CKRFieldDataT;

// The descriptor of a value field: plain-text storage.
template <class TValue>
class CKRFieldT : public CKRFieldAdaptor {
public:
  using CKRFieldAdaptor::CKRFieldAdaptor;

  int SupportsStringStorage() override { return 1; }
  IKRFieldData* CreateFieldData(void* member) override {
    return member != nullptr ? new CKRFieldDataT<TValue>(static_cast<TValue*>(member), this) : nullptr;
  }
  void Release() override { delete this; }

protected:
  ~CKRFieldT() override = default;
};

// The data of a value field: the member's address and the field. The value
// belongs to the object, unless the field data was made owning a value
// allocated on its own (`ownsValue`), which a deep release then destroys.
template <class TValue>
class CKRFieldDataT : public CKRFieldDataAdaptor {
public:
  CKRFieldDataT(TValue* value, IKRField* field, bool ownsValue = false)
      : m_pValue(value), m_pField(field), m_OwnsValue(ownsValue) {}

  IKRField* GetField() override { return m_pField; }
  CKRString GetStringValue() override {
    return m_pValue != nullptr ? SKRFieldValueText<TValue>::ToString(*m_pValue) : CKRString();
  }
  int SetValueFromString(const CKRString& text) override {
    return m_pValue != nullptr && SKRFieldValueText<TValue>::FromString(text, *m_pValue) ? 1 : 0;
  }
  // 0 without a field on either side or for other data types; otherwise 1
  // when the values are equal (strings exactly). A field data of another
  // class with the same data type compares by text.
  int Equals(IKRFieldData* other) override {
    if (!SameDataType(other))
      return 0;
    if (auto* same = dynamic_cast<CKRFieldDataT*>(other); same != nullptr && same->m_pValue != nullptr)
      return m_pValue != nullptr && *m_pValue == *same->m_pValue ? 1 : 0;
    return GetStringValue() == other->GetStringValue() ? 1 : 0;
  }
  // Copies the other value under the condition of Equals: 1, otherwise 0.
  int SetTo(IKRFieldData* other) override {
    if (!SameDataType(other) || m_pValue == nullptr)
      return 0;
    if (auto* same = dynamic_cast<CKRFieldDataT*>(other); same != nullptr && same->m_pValue != nullptr) {
      *m_pValue = *same->m_pValue;
      return 1;
    }
    return SetValueFromString(other->GetStringValue());
  }
  int HasFieldDataImplTypeOf(CKRGuid implementationID) override {
    return implementationID == KRIMPL_FIELDDATA_VALUE ? 1 : 0;
  }
  void Release(bool deep) override {
    if (deep && m_OwnsValue)
      delete m_pValue;
    delete this;
  }

  // The member (or owned value); null only when made over null.
  TValue* GetValuePtr() const { return m_pValue; }

protected:
  ~CKRFieldDataT() override = default;

private:
  bool SameDataType(IKRFieldData* other) {
    return m_pField != nullptr && other != nullptr && other->GetField() != nullptr &&
           m_pField->GetDataTypeID() == other->GetField()->GetDataTypeID();
  }

  TValue* m_pValue;
  IKRField* m_pField;
  bool m_OwnsValue;
};

extern template class KRCORELIB_API CKRFieldT<CKRString>;
extern template class KRCORELIB_API CKRFieldT<CKRGuid>;
extern template class KRCORELIB_API CKRFieldT<int>;
extern template class KRCORELIB_API CKRFieldDataT<CKRString>;
extern template class KRCORELIB_API CKRFieldDataT<CKRGuid>;
extern template class KRCORELIB_API CKRFieldDataT<int>;
