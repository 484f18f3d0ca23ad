// Field data: values as text, comparison and copy across data types, the
// flags that decide the property grid's questions, and group field data.
#include <krCoreLib/objectmodel/CKRTypeSystem.h>
#include <krCoreLib/serialization/CKRFieldT.h>
#include <krCoreLib/serialization/CKRGroupFieldData.h>

#include "KRSerialTestObjects.h"

#include <gtest/gtest.h>

#include <climits>
#include <memory>
#include <set>
#include <string>
#include <thread>
#include <vector>

namespace {

constexpr CKRGuid kFieldID = CKRGuid::Literal("{5C000000-0000-4000-8000-000000000001}");

// A descriptor that is destroyed with the test.
template <class TValue>
struct SField {
  explicit SField(CKRGuid dataType, int flags = KRF_READ | KRF_WRITE)
      : m_pField(new CKRFieldT<TValue>(L"F", L"", kFieldID, dataType, nullptr, flags, 0.0)) {}
  ~SField() { m_pField->Release(); }
  IKRFieldData* Bind(TValue* value) { return m_pField->CreateFieldData(value); }
  IKRField* m_pField;
};

}  // namespace

TEST(CKRFieldDataT, ValuesAsText) {
  struct Case {
    const wchar_t* text;
    int accepted;
    int value;
    const wchar_t* shown;
  };
  // wtoi rules: blanks, the longest prefix, saturation; no number gives 0.
  const Case ints[] = {{L"42", 1, 42, L"42"},           {L" -7x", 1, -7, L"-7"},
                       {L"abc", 1, 0, L"0"},            {L"", 1, 0, L"0"},
                       {L"99999999999", 1, INT_MAX, L"2147483647"}};
  SField<int> intField(KRDT_INTEGER);
  for (const Case& c : ints) {
    SCOPED_TRACE(testing::PrintToString(std::wstring(c.text)));
    int value = 5;
    IKRFieldData* data = intField.Bind(&value);
    EXPECT_EQ(data->SetValueFromString(c.text), c.accepted);
    EXPECT_EQ(value, c.value);
    EXPECT_EQ(data->GetStringValue().str(), c.shown);
    data->Release(true);  // not owned: the member survives a deep release
  }

  SField<CKRGuid> guidField(KRDT_GUID);
  const CKRGuid id = CKRGuid::Literal("{0D6C5B4A-3F2E-4D1C-8B0A-9F8E7D6C5B4A}");
  CKRGuid guid = id;
  IKRFieldData* guidData = guidField.Bind(&guid);
  EXPECT_EQ(guidData->GetStringValue().str(), L"{0d6c5b4a-3f2e-4d1c-8b0a-9f8e7d6c5b4a}");
  // Hostile texts are refused and leave the value.
  for (const wchar_t* bad : {L"", L"{}", L"not a guid at all, no no no no no no", L"{0D6C5B4A-3F2E-4D1C-8B0A-9F8E7D6C5B4}"}) {
    EXPECT_EQ(guidData->SetValueFromString(bad), 0) << std::wstring(bad);
    EXPECT_EQ(guid, id);
  }
  EXPECT_EQ(guidData->SetValueFromString(L"{00000000-0000-0000-0000-000000000001}"), 1);
  EXPECT_EQ(guid.GetCString(), L"{00000000-0000-0000-0000-000000000001}");
  guidData->Release(false);

  // A value allocated on its own and owned by its field data goes with a
  // deep release (the sanitizer build reports a leak otherwise).
  SField<CKRString> stringField(KRDT_STRING);
  auto* owned = new CKRFieldDataT<CKRString>(new CKRString(L"heap"), stringField.m_pField, true);
  EXPECT_EQ(owned->GetStringValue(), L"heap");
  owned->Release(true);
  EXPECT_EQ(stringField.m_pField->CreateFieldData(nullptr), nullptr);
}

// Field data are made and released by the hundred thousand; their memory is
// reused. Made on one thread, released on another, made again after the
// first thread ended: every live field data has its own memory and stays
// bound to its own member.
TEST(CKRFieldDataT, MadeAndReleasedOnSeveralThreads) {
  constexpr int kCount = 3000;  // more than one slab of blocks
  SField<CKRString> strings(KRDT_STRING);
  SField<int> ints(KRDT_INTEGER);
  std::vector<CKRString> texts(kCount);
  std::vector<int> numbers(kCount);
  std::vector<IKRFieldData*> made;
  auto make = [&](std::vector<IKRFieldData*>& into) {
    for (int i = 0; i < kCount; ++i) {
      texts[i] = CKRString(std::to_wstring(i));
      numbers[i] = i;
      into.push_back(strings.Bind(&texts[i]));
      into.push_back(ints.Bind(&numbers[i]));
    }
  };
  auto check = [&](const std::vector<IKRFieldData*>& live) {
    ASSERT_EQ(std::set<IKRFieldData*>(live.begin(), live.end()).size(), live.size());
    for (int i = 0; i < kCount; ++i) {
      ASSERT_EQ(live[2 * i]->GetStringValue(), CKRString(std::to_wstring(i)));
      ASSERT_EQ(live[2 * i + 1]->GetStringValue(), CKRString(std::to_wstring(i)));
    }
  };
  std::thread([&] { make(made); }).join();
  check(made);
  for (IKRFieldData* data : made)
    data->Release(false);
  made.clear();
  std::vector<IKRFieldData*> gone;
  std::thread([&] {
    make(gone);
    for (IKRFieldData* data : gone)
      data->Release(false);
  }).join();
  make(made);
  check(made);
  for (IKRFieldData* data : made)
    data->Release(false);
}

TEST(CKRFieldDataT, EqualsAndSetToNeedTheSameDataType) {
  SField<CKRString> stringField(KRDT_STRING);
  SField<CKRGuid> guidField(KRDT_GUID);
  CKRString a = L"a", b = L"A";
  CKRGuid g;
  IKRFieldData* da = stringField.Bind(&a);
  IKRFieldData* db = stringField.Bind(&b);
  IKRFieldData* dg = guidField.Bind(&g);
  EXPECT_EQ(da->Equals(db), 0);  // case-sensitive
  EXPECT_EQ(da->Equals(dg), 0);
  EXPECT_EQ(da->Equals(nullptr), 0);
  EXPECT_EQ(da->SetTo(dg), 0);
  EXPECT_EQ(da->SetTo(db), 1);
  EXPECT_EQ(a, L"A");
  EXPECT_EQ(da->Equals(db), 1);
  for (IKRFieldData* d : {da, db, dg})
    d->Release(false);
}

// Links compare and copy the object they hold, only with a link field; a
// deep release lets go of the linked object and clears the member, while a
// collection's deep release empties it and leaves the elements alive.
TEST(CKRObjFieldDataT, EqualsSetToAndDeepRelease) {
  using namespace KRTestFields;
  CKRTypeSystem::Initialize(CKRGuid::Literal("{5D000000-0000-4000-8000-000000000003}"));  // the records' fields
  CKRTestRecord* a = NewRecord(L"a");
  CKRTestRecord* b = NewRecord(L"b");
  CKRTestRecord* target = NewRecord(L"target");
  a->m_pNext = target;
  IKRFieldData* linkA = a->GetFieldData(kNext);
  IKRFieldData* linkB = b->GetFieldData(kNext);
  EXPECT_EQ(linkA->Equals(linkB), 0);
  EXPECT_EQ(linkA->Equals(a->GetFieldData(kName)), 0);
  EXPECT_EQ(linkB->SetTo(a->GetFieldData(kName)), 0);
  EXPECT_EQ(linkB->SetTo(linkA), 1);
  EXPECT_EQ(b->m_pNext, target);
  EXPECT_EQ(linkA->Equals(linkB), 1);

  const int destroyed = CKRTestRecord::s_Destroyed;
  CKRTestRecord* held = target;
  linkA->GetField()->CreateFieldData(&held)->Release(true);
  EXPECT_EQ(held, nullptr);
  EXPECT_EQ(CKRTestRecord::s_Destroyed, destroyed + 1);

  CKRObjPtrList<CKRTestRecord> list;
  list.Add(a);
  list.Add(b);
  a->GetFieldData(kChildren)->GetField()->CreateFieldData(&list)->Release(true);
  EXPECT_EQ(list.GetCount(), 0);
  EXPECT_EQ(CKRTestRecord::s_Destroyed, destroyed + 1);
  a->m_pNext = b->m_pNext = nullptr;
  a->Release();
  b->Release();
}

// The property grid's questions follow the flags, and ask the object where
// a flag hands it the decision.
TEST(CKRFieldDataAdaptor, FlagsDecideOrAskTheObject) {
  struct Case {
    int flags;
    int readOnly, visible, expanded, checkbox, hilite;
  };
  const Case cases[] = {
      {0, 0, 0, 0, 0, 0},
      {KRF_READONLY | KRF_READONLY_BY_OBJECT, 1, 0, 0, 0, 0},  // 0x8 wins whatever the object says
      {KRF_READONLY_BY_OBJECT | KRF_HILITE_EDITABLE, 1, 0, 0, 0, 0},
      {KRF_HILITE_EDITABLE | KRF_VISIBLE, 0, 1, 0, 0, 1},
      {KRF_VISIBLE | KRF_VISIBLE_BY_OBJECT, 0, 0, 0, 0, 0},
      {KRF_EXPANDED_BY_OBJECT | KRF_CHECKBOX, 0, 0, 1, 1, 0},
  };
  // The object answers read-only 1, visible 0, expanded 1, checked 1.
  CKRTestRecord* object = NewRecord();
  object->m_IsReadOnly = 1;
  object->m_IsVisible = 0;
  object->m_IsChecked = 1;
  for (const Case& c : cases) {
    SCOPED_TRACE(testing::Message() << "flags 0x" << std::hex << c.flags);
    SField<CKRString> field(KRDT_STRING, c.flags);
    IKRFieldData* data = field.Bind(&object->m_Name);
    data->SetOriginObject(object);
    EXPECT_EQ(data->ReadOnly(), c.readOnly);
    EXPECT_EQ(data->Visible(), c.visible);
    EXPECT_EQ(data->Expanded(), c.expanded);
    EXPECT_EQ(data->HasCheckbox(), c.checkbox);
    EXPECT_EQ(data->Checked(), c.checkbox);
    EXPECT_EQ(data->HiliteReadable(), c.hilite);
    data->Release(false);
  }
  // Without an origin object a change is refused and notifications vanish.
  SField<CKRString> field(KRDT_STRING);
  IKRFieldData* orphan = field.Bind(&object->m_Name);
  CKRString proposed = L"x";
  EXPECT_EQ(orphan->NotifyOfPendingChange(proposed), 0);
  orphan->NotifyOfChange(KRF_VALUE_CHANGED, CKRGuid());
  orphan->Release(false);
  object->Release();
}

TEST(CKRGroupFieldData, ShowsCommonTextAndSetsEveryMember) {
  SField<CKRString> stringField(KRDT_STRING);
  auto* group = new CKRGroupFieldData(stringField.m_pField);
  EXPECT_EQ(group->GetStringValue(), L"EMPTY");
  EXPECT_EQ(group->GroupDataVaries(), 1);
  EXPECT_EQ(group->GetEffectiveData(), nullptr);
  CKRString a = L"a", b = L"a";
  IKRFieldData* da = stringField.Bind(&a);
  group->AddFieldData(da);
  group->AddFieldData(da);
  group->AddFieldData(stringField.Bind(&b));
  EXPECT_EQ(group->GetStringValue(), L"a");
  EXPECT_EQ(group->GetEffectiveData(), da);
  b = L"b";
  EXPECT_EQ(group->GetStringValue(), L"*Varies*");
  EXPECT_EQ(group->GroupDataVaries(), 1);
  EXPECT_EQ(group->SetValueFromString(L"   "), 1);  // blank: nothing changes
  EXPECT_EQ(a + b, L"ab");
  EXPECT_EQ(group->SetValueFromString(L"  both \t"), 1);
  EXPECT_EQ(a + b, L"bothboth");
  EXPECT_EQ(group->GroupDataVaries(), 0);
  group->Release(true);  // and its two members

  SField<int> intField(KRDT_INTEGER);
  int x = 1, y = 2;
  auto* ints = new CKRGroupFieldData(intField.m_pField);
  ints->AddFieldData(intField.Bind(&x));
  ints->AddFieldData(intField.Bind(&y));
  EXPECT_EQ(ints->SetValueFromString(L" 5 "), 1);
  EXPECT_EQ(x + y, 10);
  EXPECT_EQ(ints->IsGroupData(), 1);
  ints->Release(true);
}
