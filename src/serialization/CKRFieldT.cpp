#include <krCoreLib/serialization/CKRFieldT.h>

CKRString SKRFieldValueText<CKRString>::ToString(const CKRString& value) {
  return value;
}

bool SKRFieldValueText<CKRString>::FromString(const CKRString& text, CKRString& value) {
  value = text;
  return true;
}

CKRString SKRFieldValueText<CKRGuid>::ToString(const CKRGuid& value) {
  return value.GetCString();
}

bool SKRFieldValueText<CKRGuid>::FromString(const CKRString& text, CKRGuid& value) {
  return value.ReadCString(text);
}

CKRString SKRFieldValueText<int>::ToString(const int& value) {
  return CKRString::Formatted(L"%d", value);
}

bool SKRFieldValueText<int>::FromString(const CKRString& text, int& value) {
  value = CKRString::ToInt(text.GetString());
  return true;
}

template class CKRFieldT<CKRString>;
template class CKRFieldT<CKRGuid>;
template class CKRFieldT<int>;
template class CKRFieldDataT<CKRString>;
template class CKRFieldDataT<CKRGuid>;
template class CKRFieldDataT<int>;
