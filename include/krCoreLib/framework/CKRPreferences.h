// CKRPreferences and CKRPreferenceSection: application settings as a
// storable object holding any number of sections.
//
// A section carries a name and a description; applications derive section
// classes that add fields of their own (in their type's CreateFields, after
// the base's). The preferences object keeps its sections in a map by
// instance ID, walked in ascending ID order; the map refuses a second
// section with an ID already present. Both classes are storable, so the
// whole set is stored and loaded by any store: storing the preferences
// stores every section in the same document.
//
// Ownership: the preferences object does not own its sections; releasing
// it leaves them alive, and releasing them is up to the owner (for
// instance GetPreferenceSectionMap().RemoveAll(true) before the release).
// Created and released through their types. Not synchronised.
#pragma once

#include <krCoreLib/objectmodel/CKRObjGuidPtrMap.h>
#include <krCoreLib/serialization/CKRSerialObject.h>

#include <utility>

class KRCORELIB_API CKRPreferenceSection : public CKRSerialObject {
  KR_DECLARE_SERIAL_TYPE(CKRPreferenceSection, CKRSerialObjectTypeImpl, "{7AB10E7B-907C-4EA3-88F8-8415EA83CBA4}")

public:
  // Binds the field data; a new section is named and described "A
  // Preference Section".
  void InitFieldData() override;

  const CKRString& GetName() const { return m_Name; }
  void SetName(CKRString name) { m_Name = std::move(name); }
  const CKRString& GetDescription() const { return m_Description; }
  void SetDescription(CKRString description) { m_Description = std::move(description); }

protected:
  CKRPreferenceSection() = default;
  ~CKRPreferenceSection() override = default;

private:
  CKRString m_Name;
  CKRString m_Description;
};

class KRCORELIB_API CKRPreferences : public CKRSerialObject {
  KR_DECLARE_SERIAL_TYPE(CKRPreferences, CKRSerialObjectTypeImpl, "{AC17C815-DA6A-4DFE-A383-99CFA70517B3}")

public:
  using SectionMap = CKRObjGuidPtrMap<CKRPreferenceSection>;

  // Binds the field data and empties the section map (releasing nothing).
  void InitFieldData() override;

  // The sections by instance ID: find, walk, add and remove them here.
  SectionMap& GetPreferenceSectionMap() { return m_PreferenceSectionMap; }

protected:
  CKRPreferences() = default;
  ~CKRPreferences() override = default;

private:
  SectionMap m_PreferenceSectionMap;
};
