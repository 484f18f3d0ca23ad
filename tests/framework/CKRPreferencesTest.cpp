// Preferences and sections: round trips
// through the memory store with zero, one and many sections of the base
// and of a derived class; a stored map naming one section twice.
#include <krCoreLib/framework/CKRPreferences.h>
#include <krCoreLib/serialization/CKRFieldT.h>

#include "KRFrameworkStore.h"
#include "KRFrameworkTestObjects.h"
#include "KRTestSeed.h"

#include <gtest/gtest.h>

#include <random>

namespace {

constexpr CKRGuid kSectionMapField = CKRGuid::Literal("{63E0D0E3-3024-4831-9C71-FDACA82F6FA4}");

std::vector<CKRGuid> SectionIDs(CKRPreferences* preferences) {
  std::vector<CKRGuid> ids;
  for (auto [id, section] : preferences->GetPreferenceSectionMap())
    ids.push_back(id);
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
                            CKRGuid::Literal("{6E000000-0000-4000-8000-000000000001}"), KRDT_INTEGER,
                            KRF_READ | KRF_WRITE | KRF_VISIBLE);
}

namespace {
CKRPreferences* NewPreferences() {
  return NewObject<CKRPreferences>(CKRPreferences::GetCKRPreferencesType());
}
CKRPreferenceSection* NewSection(bool units) {
  return units ? NewObject<CKRPreferenceSection>(CKRTestUnitsSection::GetCKRTestUnitsSectionType())
               : NewObject<CKRPreferenceSection>(CKRPreferenceSection::GetCKRPreferenceSectionType());
}
}  // namespace

// Zero, one, two and many sections (base and derived, random IDs) are
// stored as one link collection and come back with the same IDs in
// ascending order, each with its class, name, description and own fields.
TEST(CKRPreferences, RoundTripsWithAnyNumberOfSections) {
  std::mt19937 random(KRTestSeed());
  for (const int count : {0, 1, 2, 60}) {
    SCOPED_TRACE(testing::Message() << count << " sections");
    CKRFrameworkStore store;
    CKRPreferences* preferences = NewPreferences();
    for (int i = 0; i < count; ++i) {
      CKRPreferenceSection* section = NewSection(i % 2 != 0);
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

// A stored map that names a section twice loads it once. The sections are
// not the preferences' own: they outlive its release.
TEST(CKRPreferences, SectionStoredTwiceInTheMapLoadsOnce) {
  CKRFrameworkStore store;
  CKRPreferences* preferences = NewPreferences();
  CKRPreferenceSection* section = NewSection(false);
  preferences->GetPreferenceSectionMap().Add(section);
  ASSERT_EQ(store.Save({preferences}), 1);
  auto& links = store.Stored().m_Objects.at(preferences->GetInstanceID()).m_Links.at(kSectionMapField);
  links.push_back(links.front());
  auto* loaded = store.Load<CKRPreferences>(preferences->GetInstanceID(), CKRPreferences::TypeID);
  ASSERT_NE(loaded, nullptr);
  EXPECT_EQ(SectionIDs(loaded), std::vector<CKRGuid>{section->GetInstanceID()});
  ReleaseWithSections(loaded);
  preferences->Release();
  EXPECT_EQ(section->GetName(), L"A Preference Section");
  section->Release();
}
