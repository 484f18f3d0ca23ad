// Storable classes for the serialization tests.
#pragma once

#include <krCoreLib/objectmodel/CKRObjGuidPtrMap.h>
#include <krCoreLib/objectmodel/CKRObjPtrList.h>
#include <krCoreLib/serialization/CKRSerialObject.h>

#include <vector>

namespace KRTestFields {
inline constexpr CKRGuid kName = CKRGuid::Literal("{5A000000-0000-4000-8000-000000000001}");
inline constexpr CKRGuid kCount = CKRGuid::Literal("{5A000000-0000-4000-8000-000000000002}");
inline constexpr CKRGuid kRef = CKRGuid::Literal("{5A000000-0000-4000-8000-000000000003}");
inline constexpr CKRGuid kNext = CKRGuid::Literal("{5A000000-0000-4000-8000-000000000004}");
inline constexpr CKRGuid kChildren = CKRGuid::Literal("{5A000000-0000-4000-8000-000000000005}");
inline constexpr CKRGuid kReadOnly = CKRGuid::Literal("{5A000000-0000-4000-8000-000000000006}");
inline constexpr CKRGuid kWriteOnly = CKRGuid::Literal("{5A000000-0000-4000-8000-000000000007}");
inline constexpr CKRGuid kMembers = CKRGuid::Literal("{5A000000-0000-4000-8000-000000000008}");
inline constexpr CKRGuid kBase = CKRGuid::Literal("{5A000000-0000-4000-8000-0000000000B1}");
inline constexpr CKRGuid kMiddle = CKRGuid::Literal("{5A000000-0000-4000-8000-0000000000B2}");
inline constexpr CKRGuid kLeaf = CKRGuid::Literal("{5A000000-0000-4000-8000-0000000000B3}");
}  // namespace KRTestFields

// A record with a value field of every kind, a link, a collection of links,
// a field read but never written and one written but never read, and hooks
// that count.
class CKRTestRecord : public CKRSerialObject {
  KR_DECLARE_SERIAL_TYPE(CKRTestRecord, CKRSerialObjectTypeImpl, "{5B000000-0000-4000-8000-000000000001}")

public:
  CKRString m_Name;
  int m_Count = 0;
  CKRGuid m_Ref;
  CKRTestRecord* m_pNext = nullptr;
  CKRObjPtrList<CKRTestRecord> m_Children;
  CKRString m_ReadOnly;
  CKRString m_WriteOnly;

  int m_Changes = 0;
  int m_Patches = 0;
  // The answers to the per-field questions of the property grid.
  int m_IsReadOnly = 0;
  int m_IsVisible = 1;
  int m_IsChecked = 0;
  int m_AllowRelease = 1;
  static inline int s_Destroyed = 0;
  static inline bool s_RefuseInitialize = false;

  int OnInitialize() override { return s_RefuseInitialize ? 0 : 1; }
  int OnBeforeRelease() override { return m_AllowRelease; }
  void OnAfterFieldChanged(IKRFieldData*, KRF_NOTIFICATION_TYPE, CKRGuid) override { ++m_Changes; }
  void PatchData() override { ++m_Patches; }
  int IsFieldReadOnly(IKRFieldData*) override { return m_IsReadOnly; }
  int IsFieldVisible(IKRFieldData*) override { return m_IsVisible; }
  int IsFieldChecked(IKRFieldData*) override { return m_IsChecked; }

protected:
  CKRTestRecord() = default;
  ~CKRTestRecord() override { ++s_Destroyed; }
};

// A collection field over a map of records.
class CKRTestIndex : public CKRSerialObject {
  KR_DECLARE_SERIAL_TYPE(CKRTestIndex, CKRSerialObjectTypeImpl, "{5B000000-0000-4000-8000-000000000002}")
public:
  CKRObjGuidPtrMap<CKRTestRecord> m_Members;
};

// Three levels, one field each.
class CKRTestBase : public CKRSerialObject {
  KR_DECLARE_SERIAL_TYPE(CKRTestBase, CKRSerialObjectTypeImpl, "{5B000000-0000-4000-8000-0000000000B1}")
public:
  CKRString m_Base;
};

class CKRTestMiddle : public CKRTestBase {
  KR_DECLARE_SERIAL_TYPE(CKRTestMiddle, CKRSerialObjectTypeImpl, "{5B000000-0000-4000-8000-0000000000B2}")
public:
  CKRString m_Middle;
};

class CKRTestLeaf : public CKRTestMiddle {
  KR_DECLARE_SERIAL_TYPE(CKRTestLeaf, CKRSerialObjectTypeImpl, "{5B000000-0000-4000-8000-0000000000B3}")
public:
  CKRString m_Leaf;
};

// A framework class that is not storable.
class CKRTestPlain : public CKRObjectImpl {
  KR_DECLARE_OBJECT_TYPE(CKRTestPlain, CKRObjectTypeImpl, "{5B000000-0000-4000-8000-0000000000C1}")
};

// A new record through its type.
CKRTestRecord* NewRecord(const wchar_t* name = L"", CKRGuid id = CKRGuid());

// Releases a chain of records linked through m_pNext, from `first` on, and
// the records of `originals`.
void ReleaseChains(CKRTestRecord* first, const std::vector<CKRTestRecord*>& originals);
