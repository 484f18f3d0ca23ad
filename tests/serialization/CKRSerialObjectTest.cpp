// Storable objects and their types: fields inherited along the class
// hierarchy, instances created with their field data and not tracked, the
// vetoes, instance names, CloneFieldData, and types released and claimed
// again.
#include <krCoreLib/objectmodel/CKRTypeSystem.h>
#include <krCoreLib/serialization/CKRFieldT.h>

#include "KRSerialTestObjects.h"

#include <gtest/gtest.h>

#include <vector>

using namespace KRTestFields;

namespace {

constexpr CKRGuid kRepository = CKRGuid::Literal("{5D000000-0000-4000-8000-000000000001}");

class CKRSerialObjectTest : public testing::Test {
protected:
  void SetUp() override { CKRTypeSystem::Initialize(kRepository); }
};

std::vector<CKRGuid> FieldIDs(IKRSerializableAdaptor* object) {
  std::vector<CKRGuid> ids;
  for (IKRFieldData* data : object->GetFieldDataList())
    ids.push_back(data->GetField()->GetFieldID());
  return ids;
}

}  // namespace

TEST_F(CKRSerialObjectTest, FieldsAreInheritedOnceBaseFirst) {
  auto* leafType = CKRTestLeaf::GetCKRTestLeafType();
  auto* baseType = CKRTestBase::GetCKRTestBaseType();
  ASSERT_EQ(leafType->GetFieldMap().size(), 3u);
  // Shared, not copied: the base's descriptor, owned by the base.
  EXPECT_EQ(leafType->GetField(kBase), baseType->GetField(kBase));
  EXPECT_EQ(leafType->GetField(kBase)->GetOriginType(), baseType);
  EXPECT_EQ(leafType->GetField(kLeaf)->GetOriginType(), leafType);
  leafType->AppendBaseFields(leafType, nullptr);
  CKRTestMiddle::GetCKRTestMiddleType()->AppendBaseFields(leafType, nullptr);
  EXPECT_EQ(leafType->GetFieldMap().size(), 3u);

  auto* leaf = static_cast<CKRTestLeaf*>(leafType->CreateInstance(CKRGuid()));
  ASSERT_NE(leaf, nullptr);
  EXPECT_EQ(FieldIDs(leaf), (std::vector<CKRGuid>{kBase, kMiddle, kLeaf}));
  // Each bound to its own member, with the object as origin.
  leaf->GetFieldData(kMiddle)->SetValueFromString(L"m");
  EXPECT_EQ(leaf->m_Middle, L"m");
  EXPECT_EQ(leaf->GetFieldData(kBase)->GetOriginObject(), leaf);
  EXPECT_EQ(leaf->Release(), 1);

  // A duplicate field ID keeps the first descriptor.
  IKRField* first = leafType->GetField(kLeaf);
  leafType->AddField(new CKRFieldT<CKRString>(L"Dup", L"", kLeaf, KRDT_STRING, leafType, 0, 0.0));
  EXPECT_EQ(leafType->GetField(kLeaf), first);
}

TEST_F(CKRSerialObjectTest, InstancesAreNamedCountedAndNotTracked) {
  // The counter counts each instance made.
  auto* type = CKRTestRecord::GetCKRTestRecordType();
  const CKRString before = type->GetNextInstanceName();
  CKRTestRecord* record = NewRecord(L"r");
  ASSERT_NE(record, nullptr);
  EXPECT_TRUE(before.str().starts_with(L"CKRTestRecord "));
  EXPECT_NE(type->GetNextInstanceName(), before);  // the counter moved
  EXPECT_EQ(type->GetInstance(record->GetInstanceID()), nullptr);
  EXPECT_EQ(type->GetInstanceCount(), 0);
  const CKRGuid chosen = CKRGuid::CreateNewGUID();
  CKRTestRecord* named = NewRecord(L"n", chosen);
  EXPECT_EQ(named->GetInstanceID(), chosen);

  // A refused initialisation destroys the object and its field data, and
  // does not count.
  const int destroyed = CKRTestRecord::s_Destroyed;
  const CKRString counted = type->GetNextInstanceName();
  CKRTestRecord::s_RefuseInitialize = true;
  EXPECT_EQ(NewRecord(), nullptr);
  CKRTestRecord::s_RefuseInitialize = false;
  EXPECT_EQ(CKRTestRecord::s_Destroyed, destroyed + 1);
  EXPECT_EQ(type->GetNextInstanceName(), counted);

  // A refused release keeps the object usable.
  record->m_AllowRelease = 0;
  EXPECT_EQ(record->Release(), 0);
  EXPECT_EQ(record->GetFieldData(kName)->GetStringValue(), L"r");
  record->m_AllowRelease = 1;
  EXPECT_EQ(record->Release(), 1);
  EXPECT_EQ(type->ReleaseInstance(nullptr), 0);
  EXPECT_EQ(CKRTestBase::GetCKRTestBaseType()->ReleaseInstance(named), 0);  // not its type
  named->Release();
}

TEST_F(CKRSerialObjectTest, CloneFieldDataCopiesCommonFieldsAndNotifiesEach) {
  CKRTestRecord* source = NewRecord(L"source");
  source->m_Count = 7;
  source->m_Ref = CKRGuid::CreateNewGUID();
  CKRTestRecord* copy = NewRecord(L"copy");
  copy->CloneFieldData(source);
  EXPECT_EQ(copy->m_Name, L"source");
  EXPECT_EQ(copy->m_Count, 7);
  EXPECT_EQ(copy->m_Ref, source->m_Ref);
  EXPECT_EQ(copy->m_Changes, int(copy->GetFieldDataList().size()));
  // Only the fields both have: a leaf shares no field with a record.
  CKRTestLeaf* leaf = static_cast<CKRTestLeaf*>(CKRTestLeaf::GetCKRTestLeafType()->CreateInstance(CKRGuid()));
  copy->CloneFieldData(leaf);
  copy->CloneFieldData(nullptr);
  EXPECT_EQ(copy->m_Name, L"source");
  for (IKRObject* object : std::vector<IKRObject*>{source, copy, leaf})
    object->Release();
}

// Released with the type system and claimed again, a storable type keeps
// its descriptors: an instance made before still reads and writes through
// them, and new instances bind the same ones.
TEST_F(CKRSerialObjectTest, TypesReleasedAndClaimedAgainKeepTheirFields) {
  CKRTestRecord* survivor = NewRecord(L"old");
  IKRField* name = CKRTestRecord::GetCKRTestRecordType()->GetField(kName);
  CKRTypeSystem::Release();
  EXPECT_EQ(survivor->GetFieldData(kName)->GetField()->GetName(), L"Name");
  CKRTypeSystem::Initialize(kRepository);
  EXPECT_EQ(CKRTypeSystem::FindType(CKRSerialObject::TypeID), CKRSerialObject::GetCKRSerialObjectType());
  EXPECT_EQ(CKRTestRecord::GetCKRTestRecordType()->GetField(kName), name);
  CKRTestRecord* fresh = NewRecord(L"new");
  EXPECT_EQ(fresh->GetFieldData(kName)->GetField(), name);
  EXPECT_EQ(fresh->GetFieldDataList().size(), survivor->GetFieldDataList().size());
  survivor->Release();
  fresh->Release();
}
