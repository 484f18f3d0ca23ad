#include <krCoreLib/framework/CKRPreferences.h>

#include <krCoreLib/serialization/CKRFieldT.h>
#include <krCoreLib/serialization/CKRObjCollectionFieldT.h>

KR_IMPLEMENT_SERIAL_TYPE(CKRPreferenceSection, CKRSerialObject)
KR_IMPLEMENT_SERIAL_TYPE(CKRPreferences, CKRSerialObject)

namespace {

constexpr CKRGuid kSectionMapFieldID = CKRGuid::Literal("{63E0D0E3-3024-4831-9C71-FDACA82F6FA4}");
constexpr CKRGuid kNameFieldID = CKRGuid::Literal("{FCB6CEF7-3A8C-4CD8-A1F8-77DDCFF0C92E}");
constexpr CKRGuid kDescriptionFieldID = CKRGuid::Literal("{4BE98F65-D593-4411-8A56-F0E62A554F5C}");

// The flags stored archives carry: read, written, visible, expanded; the
// map also shows its sections' fields under it.
constexpr int kTextFlags = KRF_READ | KRF_WRITE | KRF_VISIBLE | KRF_EXPANDED;
constexpr int kSectionMapFlags = KRF_READ | KRF_WRITE | KRF_VISIBLE | KRF_SHOW_LINKED_FIELDS | KRF_EXPANDED;

constexpr const wchar_t* kNewSectionText = L"A Preference Section";

}  // namespace

void CKRPreferenceSection::CKRPreferenceSectionType::CreateFields(CKRSerialObjectTypeImpl* target, IKRObject* object) {
  AppendParentFields(target, object);
  BindField<CKRFieldT<CKRString>>(target, object, &CKRPreferenceSection::m_Name, L"Name",
                                  L"The name of this Preference Section", kNameFieldID, KRDT_STRING, kTextFlags);
  BindField<CKRFieldT<CKRString>>(target, object, &CKRPreferenceSection::m_Description, L"Description",
                                  L"The description of this Preference Section", kDescriptionFieldID, KRDT_STRING,
                                  kTextFlags);
}

void CKRPreferenceSection::InitFieldData() {
  CKRSerialObject::InitFieldData();
  m_Name = kNewSectionText;
  m_Description = kNewSectionText;
}

void CKRPreferences::CKRPreferencesType::CreateFields(CKRSerialObjectTypeImpl* target, IKRObject* object) {
  AppendParentFields(target, object);
  BindField<CKRObjCollectionFieldT<SectionMap>>(target, object, &CKRPreferences::m_PreferenceSectionMap,
                                                L"m_PreferenceSectionMap", L"m_PreferenceSectionMap",
                                                kSectionMapFieldID, KRDT_OBJECT_COLLECTION, kSectionMapFlags);
}

void CKRPreferences::InitFieldData() {
  CKRSerialObject::InitFieldData();
  m_PreferenceSectionMap.RemoveAll(false);
}
