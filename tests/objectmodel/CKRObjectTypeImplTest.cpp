#include <krCoreLib/objectmodel/CKRObjectTypeImpl.h>

#include "KRTestObjects.h"

#include <krCoreLib/core/CKRDebugOutput.h>

#include <gtest/gtest.h>

#include <algorithm>
#include <memory>
#include <vector>

namespace {

constexpr CKRGuid kRootID = CKRGuid::Literal("{10000000-0000-4000-8000-000000000000}");
constexpr CKRGuid kChildID = CKRGuid::Literal("{20000000-0000-4000-8000-000000000000}");
constexpr CKRGuid kOtherChildID = CKRGuid::Literal("{25000000-0000-4000-8000-000000000000}");
constexpr CKRGuid kGrandchildID = CKRGuid::Literal("{30000000-0000-4000-8000-000000000000}");

// Collects the texts of the debug output while it lives.
class CKRDebugCapture {
public:
  CKRDebugCapture() { m_Previous = CKRDebugOutput::SetHandler(&Collect, &m_Texts); }
  ~CKRDebugCapture() { CKRDebugOutput::SetHandler(m_Previous); }
  std::vector<std::wstring> m_Texts;

private:
  static void Collect(const wchar_t* text, void* context) {
    static_cast<std::vector<std::wstring>*>(context)->push_back(text);
  }
  CKRDebugOutput::Handler m_Previous;
};

}  // namespace

TEST(CKRObjectTypeImpl, NestedTypePatternDescribesTheClass) {
  auto* type = CKRTestDerivedItem::GetCKRTestDerivedItemType();
  EXPECT_EQ(type, CKRTestDerivedItem::GetCKRTestDerivedItemType());
  EXPECT_EQ(type->GetID(), CKRTestDerivedItem::TypeID);
  EXPECT_EQ(type->GetParentTypeID(), CKRTestItem::TypeID);
  EXPECT_EQ(type->GetName(), L"CKRTestDerivedItem");
  EXPECT_EQ(type->GetClassName(), L"CKRTestDerivedItem");
  EXPECT_EQ(type->IsAbstract(), 0);
  EXPECT_EQ(CKRTestAbstract::GetCKRTestAbstractType()->IsAbstract(), 1);

  auto* root = CKRObjectImpl::GetCKRObjectImplType();
  EXPECT_EQ(root->GetID(), CKRGuid::Literal("{3719246B-C3B0-4AE9-9723-6E998C42484A}"));
  EXPECT_EQ(root->GetName(), L"CKRObjectImpl");
  EXPECT_EQ(root->GetClassName(), L"");
  EXPECT_EQ(root->GetParentTypeID(), CKRGuid());

  IKRObject* object = type->CreateInstance(CKRGuid());
  ASSERT_NE(object, nullptr);
  EXPECT_EQ(object->GetType(), type);
  EXPECT_EQ(object->GetInterface(IID_IKRObject), object);
  EXPECT_EQ(object->GetInterface(CKRGuid()), nullptr);
  EXPECT_EQ(object->GetInterface(CKRTestItem::TypeID), nullptr);
  EXPECT_TRUE(*object == object->GetInstanceID());
  EXPECT_EQ(object->Release(), 1);
  EXPECT_EQ(type->GetInstanceCount(), 0);
}

TEST(CKRObjectTypeImpl, CreateInstanceTracksNewObjects) {
  auto* type = CKRTestItem::GetCKRTestItemType();
  IKRObject* fresh = type->CreateInstance(CKRGuid());
  ASSERT_NE(fresh, nullptr);
  EXPECT_EQ(fresh->GetInstanceID().IsValid(), 1);
  EXPECT_EQ(type->GetInstance(fresh->GetInstanceID()), fresh);

  const CKRGuid chosen = CKRGuid::Literal("{ABCDEF00-1234-4321-8765-0123456789AB}");
  IKRObject* named = type->CreateInstance(chosen);
  EXPECT_EQ(named->GetInstanceID(), chosen);
  EXPECT_EQ(type->GetInstance(chosen), named);

  std::vector<CKRGuid> ids;
  type->GetInstanceList(ids);
  std::vector<CKRGuid> expected = {fresh->GetInstanceID(), chosen};
  std::sort(expected.begin(), expected.end());
  EXPECT_EQ(ids, expected);

  EXPECT_EQ(CKRTestAbstract::GetCKRTestAbstractType()->CreateInstance(CKRGuid()), nullptr);
  EXPECT_EQ(CKRTestAbstract::GetCKRTestAbstractType()->GetInstanceCount(), 0);

  fresh->Release();
  named->Release();
  EXPECT_EQ(type->GetInstance(chosen), nullptr);
  EXPECT_EQ(type->GetInstanceCount(), 0);
}

TEST(CKRObjectTypeImpl, VetoesAreHonoured) {
  auto* type = CKRTestItem::GetCKRTestItemType();
  const int destroyedBefore = CKRTestItem::s_Destroyed;
  CKRTestItem::s_RefuseInitialize = true;
  EXPECT_EQ(type->CreateInstance(CKRGuid()), nullptr);
  CKRTestItem::s_RefuseInitialize = false;
  EXPECT_EQ(CKRTestItem::s_Destroyed, destroyedBefore + 1);
  EXPECT_EQ(type->GetInstanceCount(), 0);

  CKRTestItem* stubborn = NewTestItem();
  stubborn->m_AllowRelease = 0;
  EXPECT_EQ(stubborn->Release(), 0);
  EXPECT_EQ(type->ReleaseInstance(stubborn), 0);
  EXPECT_EQ(type->GetInstance(stubborn->GetInstanceID()), stubborn);
  stubborn->m_AllowRelease = 1;
  EXPECT_EQ(stubborn->Release(), 1);
  EXPECT_EQ(CKRTestItem::s_Destroyed, destroyedBefore + 2);
}

namespace {

// An object that refuses both hooks, and its type.
struct CKRRefusingObject : CKRLocalObject {
  using CKRLocalObject::CKRLocalObject;
  int OnInitialize() override { return 0; }
  int OnBeforeRelease() override { return 0; }
  ~CKRRefusingObject() override { ++s_Destroyed; }
  static inline int s_Destroyed = 0;
};

struct CKRRefusingType : CKRLocalType {
  using CKRLocalType::CKRLocalType;
  IKRObject* CTOR() override { return new CKRRefusingObject(this); }
  void DTOR(IKRObject* object) override { delete static_cast<CKRRefusingObject*>(object); }
};

}  // namespace

TEST(CKRObjectTypeImpl, RefusedInitializeDestroysEvenWhenReleaseIsRefused) {
  // The new object was never handed out, so it must not outlive the failed
  // CreateInstance.
  CKRRefusingType type(L"Refusing", kChildID);
  EXPECT_EQ(type.CreateInstance(CKRGuid()), nullptr);
  EXPECT_EQ(CKRRefusingObject::s_Destroyed, 1);
  EXPECT_EQ(type.GetInstanceCount(), 0);
}

TEST(CKRObjectTypeImpl, UntrackedTwinLeavesTheTrackedObjectInPlace) {
  auto* type = CKRTestItem::GetCKRTestItemType();
  CKRTestItem* original = NewTestItem();
  const CKRGuid id = original->GetInstanceID();
  CKRTestItem* twin = NewTestItem(id);
  ASSERT_NE(twin, nullptr);
  EXPECT_NE(twin, original);
  EXPECT_EQ(twin->GetInstanceID(), id);
  EXPECT_EQ(type->GetInstance(id), original);
  EXPECT_EQ(type->GetInstanceCount(), 1);

  EXPECT_EQ(twin->Release(), 1);
  EXPECT_EQ(type->GetInstance(id), original);
  EXPECT_EQ(original->Release(), 1);
  EXPECT_EQ(type->GetInstance(id), nullptr);
}

TEST(CKRObjectTypeImpl, ReleaseInstanceRefusesObjectsOfOtherTypes) {
  CKRTestItem* item = NewTestItem();
  auto* derivedType = CKRTestDerivedItem::GetCKRTestDerivedItemType();
  EXPECT_EQ(derivedType->ReleaseInstance(item), 0);
  EXPECT_EQ(derivedType->ReleaseInstance(nullptr), 0);
  EXPECT_EQ(CKRTestItem::GetCKRTestItemType()->GetInstance(item->GetInstanceID()), item);
  EXPECT_EQ(item->Release(), 1);
}

TEST(CKRObjectTypeImpl, ParentLinksDecideIsTypeOf) {
  CKRLocalType root(L"Root", kRootID);
  CKRLocalType child(L"Child", kChildID, kRootID);
  EXPECT_EQ(child.IsTypeOf(kChildID), 1);
  EXPECT_EQ(child.IsTypeOf(CKRGuid()), 0);
  EXPECT_EQ(child.IsTypeOf(kRootID), 0);  // not linked yet
  EXPECT_EQ(child.IsTypeOf(&child), 1);
  EXPECT_EQ(child.IsTypeOf(nullptr), 0);
  EXPECT_EQ(child.GetParentType(), nullptr);

  EXPECT_EQ(child.RegisterWithParentType(nullptr), 0);
  EXPECT_EQ(child.RegisterWithParentType(&root), 1);
  EXPECT_EQ(child.GetParentType(), &root);
  EXPECT_EQ(child.IsTypeOf(kRootID), 1);
  EXPECT_EQ(child.IsTypeOf(&root), 1);
  EXPECT_EQ(root.IsTypeOf(kChildID), 0);
  EXPECT_EQ(root.HasDerivedTypes(), 1);

  // Objects answer through their type.
  IKRObject* object = child.CreateInstance(CKRGuid());
  EXPECT_EQ(object->IsTypeOf(kRootID), 1);
  EXPECT_EQ(object->IsTypeOf(kOtherChildID), 0);
  object->Release();

  // A link that would close a cycle is refused, so IsTypeOf always ends.
  EXPECT_EQ(root.RegisterWithParentType(&child), 0);
  EXPECT_EQ(root.RegisterWithParentType(&root), 0);
  EXPECT_EQ(root.IsTypeOf(kGrandchildID), 0);
}

TEST(CKRObjectTypeImpl, ChildTypesAndDerivedTypes) {
  CKRLocalType root(L"Root", kRootID);
  CKRLocalType child(L"Child", kChildID, kRootID);
  CKRLocalType otherChild(L"OtherChild", kOtherChildID, kRootID);
  CKRLocalType grandchild(L"Grandchild", kGrandchildID, kChildID);

  EXPECT_EQ(root.AddChildType(&child), 1);
  EXPECT_EQ(root.AddChildType(&child), 0);
  EXPECT_EQ(root.AddChildType(nullptr), 0);
  EXPECT_EQ(root.RemoveChildType(&otherChild), 0);
  EXPECT_EQ(root.RemoveChildType(nullptr), 0);
  EXPECT_EQ(root.RemoveChildType(&child), 1);
  EXPECT_EQ(root.HasDerivedTypes(), 0);

  ASSERT_EQ(child.RegisterWithParentType(&root), 1);
  ASSERT_EQ(otherChild.RegisterWithParentType(&root), 1);
  ASSERT_EQ(grandchild.RegisterWithParentType(&child), 1);
  std::vector<IKRObjectType*> derived;
  root.GetDerivedTypes(derived);
  EXPECT_EQ(derived, (std::vector<IKRObjectType*>{&grandchild, &child, &otherChild}));
}

TEST(CKRObjectTypeImpl, ReleaseEndsLiveInstancesAndReportsThem) {
  CKRLocalType root(L"Root", kRootID);
  CKRLocalType child(L"Child", kChildID, kRootID);
  ASSERT_EQ(child.RegisterWithParentType(&root), 1);
  child.CreateInstance(CKRGuid());
  child.CreateInstance(CKRGuid());
  {
    CKRDebugCapture capture;
    child.Release();
    ASSERT_EQ(capture.m_Texts.size(), 1u);
    EXPECT_EQ(capture.m_Texts[0], L"Warning! 2 instances of class Child were not released\n");
  }
  EXPECT_EQ(child.GetInstanceCount(), 0);
  EXPECT_EQ(root.HasDerivedTypes(), 0);
  EXPECT_EQ(child.GetParentType(), nullptr);

  // Without live instances there is nothing to report.
  CKRDebugCapture quiet;
  root.Release();
  EXPECT_TRUE(quiet.m_Texts.empty());
}

TEST(CKRObjectTypeImpl, DestroyedTypeLeavesNoDanglingLinks) {
  CKRLocalType root(L"Root", kRootID);
  {
    CKRLocalType child(L"Child", kChildID, kRootID);
    ASSERT_EQ(child.RegisterWithParentType(&root), 1);
    EXPECT_EQ(CKRTypeSystem::FindType(kChildID), &child);
  }
  EXPECT_EQ(root.HasDerivedTypes(), 0);
  EXPECT_EQ(CKRTypeSystem::FindType(kChildID), nullptr);
  {
    auto parent = std::make_unique<CKRLocalType>(L"Parent", kOtherChildID);
    CKRLocalType orphan(L"Orphan", kGrandchildID, kOtherChildID);
    ASSERT_EQ(orphan.RegisterWithParentType(parent.get()), 1);
    parent.reset();
    EXPECT_EQ(orphan.GetParentType(), nullptr);
    EXPECT_EQ(orphan.IsTypeOf(kOtherChildID), 0);
  }
}
