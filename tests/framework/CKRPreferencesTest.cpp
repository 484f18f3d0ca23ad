// Preferences and sections: the stored fields and the defaults of new
// objects; round trips through the memory store with zero, one and many
// sections of the base and of a derived class; a stored map naming one
// section twice.
#include <krCoreLib/framework/CKRPreferences.h>
#include <krCoreLib/serialization/CKRFieldT.h>
#include <krCoreLib/serialization/IKRField.h>

#include "KRFrameworkStore.h"
#include "KRTestSeed.h"

#include <gtest/gtest.h>

#include <random>

namespace {

constexpr CKRGuid kPrecisionField = CKRGuid::Literal("{6E000000-0000-4000-8000-000000000001}");
constexpr CKRGuid kSectionMapField = CKRGuid::Literal("{63E0D0E3-3024-4831-9C71-FDACA82F6FA4}");

template <class T>
T* New(IKRObjectType* type, CKRGuid id = CKRGuid()) {
  return dynamic_cast<T*>(type->CreateInstance(id));
}

std::vector<CKRGuid> SectionIDs(CKRPreferences* preferences) {
  std::vector<CKRGuid> ids;
  auto it = preferences->GetPreferenceSectionMap().GetIterator();
  for (CKRPreferenceSection* section = it.Next(1); section != nullptr; section = it.Next(0))
    ids.push_back(section->GetInstanceID());
  return ids;
}

void ReleaseWithSections(CKRPreferences* preferences) {
  preferences->GetPreferenceSectionMap().RemoveAll(true);
  preferences->Release();
}

}  // namespace

// An application's section with a field of its own.
class CKRTestUnitsSection : public CKRPreferenceSection {
  KR_DECLARE_SERIAL_TYPE(CKRTestUnitsSection, CKRSerialObjectTypeImpl, "{6E000000-0000-4000-8000-0000000000A1}")
public:
  int m_Precision = 3;
};

KR_IMPLEMENT_SERIAL_TYPE(CKRTestUnitsSection, CKRPreferenceSection)

void CKRTestUnitsSection::CKRTestUnitsSectionType::CreateFields(CKRSerialObjectTypeImpl* target, IKRObject* object) {
  AppendParentFields(target, object);
  BindField<CKRFieldT<int>>(target, object, &CKRTestUnitsSection::m_Precision, L"Precision", L"Digits shown",
                            kPrecisionField, KRDT_INTEGER, KRF_READ | KRF_WRITE | KRF_VISIBLE);
}

TEST(CKRPreferences, FieldsAndNewObjects) {
  CKRFrameworkStore types;
  struct SKRExpected {
    CKRSerialObjectTypeImpl* m_pType;
    CKRGuid m_FieldID;
    const wchar_t* m_Name;
    const wchar_t* m_Description;
    CKRGuid m_DataType;
    int m_Flags;
  };
  const SKRExpected expected[] = {
      {CKRPreferences::GetCKRPreferencesType(), kSectionMapField, L"m_PreferenceSectionMap", L"m_PreferenceSectionMap",
       KRDT_OBJECT_COLLECTION, 0x447},
      {CKRPreferenceSection::GetCKRPreferenceSectionType(), CKRGuid::Literal("{FCB6CEF7-3A8C-4CD8-A1F8-77DDCFF0C92E}"),
       L"Name", L"The name of this Preference Section", KRDT_STRING, 0x407},
      {CKRPreferenceSection::GetCKRPreferenceSectionType(), CKRGuid::Literal("{4BE98F65-D593-4411-8A56-F0E62A554F5C}"),
       L"Description", L"The description of this Preference Section", KRDT_STRING, 0x407},
  };
  for (const SKRExpected& field : expected) {
    SCOPED_TRACE(field.m_Name);
    IKRField* descriptor = field.m_pType->GetField(field.m_FieldID);
    ASSERT_NE(descriptor, nullptr);
    EXPECT_EQ(descriptor->GetName(), field.m_Name);
    EXPECT_EQ(descriptor->GetDescription(), field.m_Description);
    EXPECT_EQ(descriptor->GetDataTypeID(), field.m_DataType);
    EXPECT_EQ(descriptor->GetFlags(), field.m_Flags);
    EXPECT_EQ(descriptor->GetOriginType(), field.m_pType);
  }
  // A derived section shares the base's fields, after them its own.
  EXPECT_EQ(CKRTestUnitsSection::GetCKRTestUnitsSectionType()->GetField(expected[1].m_FieldID),
            CKRPreferenceSection::GetCKRPreferenceSectionType()->GetField(expected[1].m_FieldID));

  auto* section = New<CKRTestUnitsSection>(CKRTestUnitsSection::GetCKRTestUnitsSectionType());
  ASSERT_NE(section, nullptr);
  EXPECT_EQ(section->GetName(), L"A Preference Section");
  EXPECT_EQ(section->GetDescription(), L"A Preference Section");
  ASSERT_EQ(section->GetFieldDataList().size(), 3u);
  EXPECT_EQ(section->GetFieldDataList()[2]->GetField()->GetFieldID(), kPrecisionField);
  auto* preferences = New<CKRPreferences>(CKRPreferences::GetCKRPreferencesType());
  ASSERT_NE(preferences, nullptr);
  EXPECT_EQ(preferences->GetPreferenceSectionMap().GetCount(), 0);
  EXPECT_EQ(preferences->GetPreferenceSectionMap().Add(section), 1);
  EXPECT_EQ(preferences->GetPreferenceSectionMap().Add(section), 0);
  // The preferences do not own their sections.
  preferences->Release();
  EXPECT_EQ(section->GetName(), L"A Preference Section");
  section->Release();
}

// Zero, one, two and many sections (base and derived, random IDs) are
// stored as one link collection and come back with the same IDs in
// ascending order, each with its class, name, description and own fields.
TEST(CKRPreferences, RoundTripsWithAnyNumberOfSections) {
  std::mt19937 random(KRTestSeed());
  for (const int count : {0, 1, 2, 60}) {
    SCOPED_TRACE(testing::Message() << count << " sections");
    CKRFrameworkStore store;
    auto* preferences = New<CKRPreferences>(CKRPreferences::GetCKRPreferencesType());
    for (int i = 0; i < count; ++i) {
      CKRPreferenceSection* section =
          i % 2 == 0 ? New<CKRPreferenceSection>(CKRPreferenceSection::GetCKRPreferenceSectionType())
                     : New<CKRTestUnitsSection>(CKRTestUnitsSection::GetCKRTestUnitsSectionType());
      section->SetName(L"Section " + CKRString(std::to_wstring(i).c_str()));
      if (i % 3 != 0)
        section->SetDescription(L"");
      if (auto* units = dynamic_cast<CKRTestUnitsSection*>(section))
        units->m_Precision = int(random() % 1000) - 500;
      ASSERT_EQ(preferences->GetPreferenceSectionMap().Add(section), 1);
    }
    ASSERT_EQ(store.Save({preferences}), 1);
    EXPECT_EQ(store.Stored().m_Objects.at(preferences->GetInstanceID()).m_Links.at(kSectionMapField).size(),
              std::size_t(count));

    auto* loaded = store.Load<CKRPreferences>(preferences->GetInstanceID(), CKRPreferences::TypeID);
    ASSERT_NE(loaded, nullptr);
    const std::vector<CKRGuid> ids = SectionIDs(preferences);
    ASSERT_EQ(SectionIDs(loaded), ids);
    EXPECT_TRUE(std::is_sorted(ids.begin(), ids.end()));
    for (const CKRGuid& id : ids) {
      CKRPreferenceSection* before = preferences->GetPreferenceSectionMap().Find(id);
      CKRPreferenceSection* after = loaded->GetPreferenceSectionMap().Find(id);
      ASSERT_NE(after, before);
      EXPECT_EQ(after->GetType(), before->GetType());
      EXPECT_EQ(after->GetName(), before->GetName());
      EXPECT_EQ(after->GetDescription(), before->GetDescription());
      if (auto* units = dynamic_cast<CKRTestUnitsSection*>(before)) {
        EXPECT_EQ(dynamic_cast<CKRTestUnitsSection*>(after)->m_Precision, units->m_Precision);
      }
    }
    ReleaseWithSections(loaded);
    ReleaseWithSections(preferences);
  }
}

// A stored map that names a section twice loads it once.
TEST(CKRPreferences, SectionStoredTwiceInTheMapLoadsOnce) {
  CKRFrameworkStore store;
  auto* preferences = New<CKRPreferences>(CKRPreferences::GetCKRPreferencesType());
  auto* section = New<CKRPreferenceSection>(CKRPreferenceSection::GetCKRPreferenceSectionType());
  section->SetName(L"only");
  preferences->GetPreferenceSectionMap().Add(section);
  ASSERT_EQ(store.Save({preferences}), 1);
  auto& links = store.Stored().m_Objects.at(preferences->GetInstanceID()).m_Links.at(kSectionMapField);
  links.push_back(links.front());

  auto* loaded = store.Load<CKRPreferences>(preferences->GetInstanceID(), CKRPreferences::TypeID);
  ASSERT_NE(loaded, nullptr);
  EXPECT_EQ(SectionIDs(loaded), std::vector<CKRGuid>{section->GetInstanceID()});
  EXPECT_EQ(loaded->GetPreferenceSectionMap().Find(section->GetInstanceID())->GetName(), L"only");
  ReleaseWithSections(loaded);
  ReleaseWithSections(preferences);
}
